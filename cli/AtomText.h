// Atom containers as text for a person.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace tallowmere::cli {

// 1 as a number with 16 bits behind the point.
inline constexpr double kFixedOne = 65536;

// The big-endian number in the last four of the bytes.
std::uint32_t BigEndian(std::string_view bytes);

// A line for each atom, indented by two spaces for each atom around it: its type, and a leaf's data
// in the words of its kind. None for what is no container, and where more than 16 atoms lie within
// each other, as in no settings.
std::optional<std::string> TextOfAtoms(std::string_view container);

}  // namespace tallowmere::cli
