// MacBinary II and III: a file with both forks and its Finder information in one. Published as
// "MacBinary II Standard" (1987) and "MacBinary III" (1996). Big-endian.
//
// A header of 128 bytes with a checksum, perhaps a second header, the data fork, the resource fork,
// each padded to a multiple of 128 bytes.
#pragma once

#include <cstdint>
#include <optional>
#include <string_view>

namespace tallowmere::formats {

struct MacBinary {
  std::string_view name;  // in the writer's 8-bit encoding, 1 to 63 bytes
  std::uint32_t type = 0;
  std::uint32_t creator = 0;
  std::uint16_t finderFlags = 0;
  std::string_view dataFork;
  std::string_view resourceFork;
};

// Nullopt for bytes that are none or do not fit. The views stay valid as long as the bytes.
std::optional<MacBinary> ReadMacBinary(std::string_view bytes);

}  // namespace tallowmere::formats
