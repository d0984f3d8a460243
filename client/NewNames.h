// What can be told of an HFS name without asking: whether a new item could be called so, and would
// be found again. Pure functions.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace tallowmere {

// The HFS name, in Mac Roman, that an item with a Linux name has when it can be written so: ':'
// becomes '/'. Nullopt for a character that Mac Roman lacks.
std::optional<std::string> HFSNameOfLinuxName(std::string_view name);

// The Linux name of a new item with an HFS name: '/' becomes ':'.
std::string LinuxNameOfHFSName(std::string_view name);

// Why no item can have the HFS name; nullopt when one can.
std::optional<std::string> WhyNoHFSName(std::string_view name);

// Whether a new item with the Linux name may have the HFS name of another item, one with other
// accents, or one that has but a short form. Otherwise its HFS name leads to it alone.
bool MayBeAnothersName(std::string_view name);

}  // namespace tallowmere
