// The HFS names of items: the one place where a Linux name becomes a File Manager name.
//
// An HFS name is Mac Roman bytes in which ':' separates and '/' is an ordinary character. In a
// Linux name it is the reverse, so ':' and '/' are exchanged in between.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace tallowmere::names {

// The longest names, in bytes, that an FSSpec and a Str255 can hold.
inline constexpr std::size_t kLongestSpecName = 63;
inline constexpr std::size_t kLongestStr255Name = 255;

// The Linux name in HFS form. Nullopt unless Mac Roman has all of it and it takes at most `limit`
// bytes.
std::optional<std::string> PlainHFSName(std::string_view linuxName, std::size_t limit);

// The plain HFS name, if looking it up tries exactly this Linux name first: in a folder that has
// this item, the name then finds no other.
std::optional<std::string> UnmistakableHFSName(std::string_view linuxName, std::size_t limit);

// Stands for a name without a plain form, in at most 31 bytes: as much of the name as fits, with
// '?' for what Mac Roman lacks, "#", the node id in capital hexadecimal, and the extension if it
// has 1 to 5 characters that can all be encoded: "A very long name tha#1B4A3F.aif". When that is
// the real name of another item, the short name gets more than one '#': `marks` of them, 1 to
// kMostMarks.
std::string ShortHFSName(std::string_view linuxName, std::uint32_t nodeID, std::size_t marks = 1);
inline constexpr std::size_t kMostMarks = 16;

// Whether a name without accents can be the short form of an item that has no plain form: such a
// form has '?', or the full length because the name was too long.
bool CanBeShortForm(std::string_view name);

// The node id and the number of marks of an HFS name that reads as a short one. There are two ways
// to read it, since an extension may contain '#'.
struct ShortNameParts {
  std::uint32_t nodeID;
  std::size_t marks;
};
std::vector<ShortNameParts> ReadShortHFSName(std::string_view name);

// Whether an item in a Linux folder can have this name: not empty, no '/', no NUL, not "." or "..".
bool CanBeLinuxName(std::string_view name);

// The Linux names that an HFS name can stand for as it is: precomposed and, when it has accented
// letters, decomposed. Empty when no item can have the name.
struct SpelledNames {
  std::string precomposed;
  std::string decomposed;  // empty when there are no accented letters
};
SpelledNames SpellHFSName(std::string_view name);

// The Linux name that an HFS name is where a file system shows the bytes that are stored: the same
// bytes, ':' and '/' exchanged. Empty when they are UTF-8, or no item can have the name.
std::string NameInBytes(std::string_view name);

// Whether a Linux name has more than 31 characters in HFS form, so that programs which knew no
// longer ones had a short form for it.
bool HadShortForm(std::string_view linuxName);

}  // namespace tallowmere::names
