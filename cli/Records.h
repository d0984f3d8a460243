// Records as a person enters them: "volume:parent:name", or the 70 bytes in hexadecimal or base64.
#pragma once

#include <tallowmere/Types.h>

#include <bit>
#include <nlohmann/json_fwd.hpp>
#include <optional>
#include <string>
#include <string_view>

namespace tallowmere::cli {

// The record's 70 bytes, zeros after the name, as 140 hexadecimal digits.
std::string HexOfRecord(const FSSpec& spec);

// Reads a record in any of the forms. `order` is that of the numbers in bytes; what follows the
// name there is ignored. Nullopt for anything else; see FSSpecOfText.
std::optional<FSSpec> ReadRecord(std::string_view text, std::endian order = std::endian::native);

// The 70 bytes that a text is in hexadecimal or base64 (RFC 4648, section 4); nullopt for another.
std::optional<std::string> ReadRecordBytes(std::string_view text);

// Appends the record's numbers, its name as UTF-8 and its bytes to the object.
void Put(nlohmann::ordered_json& json, const FSSpec& spec);

// The bytes as lower-case hexadecimal digits.
std::string Hex(std::string_view bytes);

}  // namespace tallowmere::cli
