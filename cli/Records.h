// Records as a person writes them: "volume:parent:name" or the 70 bytes in hexadecimal.
#pragma once

#include <tallowmere/Types.h>

#include <nlohmann/json_fwd.hpp>
#include <optional>
#include <string>
#include <string_view>

namespace tallowmere::cli {

// "-27:19:hostname", the name in UTF-8.
std::string TextOfRecord(const FSSpec& spec);

// The record's 70 bytes, zeros behind the name, as 140 hexadecimal digits.
std::string HexOfRecord(const FSSpec& spec);

// Either of the two. The numbers are decimal; a parent id is taken signed or unsigned. What stands
// behind the name in hexadecimal does not count. None for anything else, for a name above 63 bytes
// and for one that Mac Roman lacks a character of.
std::optional<FSSpec> ReadRecord(std::string_view text);

// Its numbers, its name as UTF-8 and its bytes, behind what the object has.
void Put(nlohmann::ordered_json& json, const FSSpec& spec);

// Bytes as lower-case hexadecimal digits.
std::string Hex(std::string_view bytes);

}  // namespace tallowmere::cli
