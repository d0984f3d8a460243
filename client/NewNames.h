// Whether a new item could have an HFS name and would be found by it, as far as the name alone
// tells. Pure functions.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace tallowmere {

// The HFS name, in Mac Roman, of an item with a Linux name: ':' becomes '/'. Nullopt for a
// character that Mac Roman lacks.
std::optional<std::string> HFSNameOfLinuxName(std::string_view name);

// The Linux name of a new item with an HFS name: '/' becomes ':'.
std::string LinuxNameOfHFSName(std::string_view name);

// Why no item can have the HFS name; nullopt when one can.
std::optional<std::string> WhyNoHFSName(std::string_view name);

// Whether the HFS name of a new item with the Linux name may be that of another item: one whose
// accents are written otherwise, or one with a short form. Otherwise it leads to the new item
// alone.
bool MayBeAnothersName(std::string_view name);

}  // namespace tallowmere
