// Atom containers as text for a person.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace tallowmere::cli {

// 1 as a fixed-point number with 16 bits after the point.
inline constexpr double kFixedOne = 65536;

// The big-endian number in the last four bytes.
std::uint32_t BigEndian(std::string_view bytes);

// One line for each atom, indented by two spaces per enclosing atom: its type and, for a leaf, its
// data. Nullopt when the bytes are not a container, and when atoms are nested more than 16 deep, as
// in no settings.
std::optional<std::string> TextOfAtoms(std::string_view container);

}  // namespace tallowmere::cli
