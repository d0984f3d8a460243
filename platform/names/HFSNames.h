// What an item is called in HFS terms: the one place where a Linux name becomes a File Manager
// name.
//
// An HFS name is Mac Roman bytes in which ':' separates and '/' is an ordinary character, the other
// way round than in a Linux name; ':' and '/' are exchanged on the way.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace tallowmere::names {

// The longest name, in bytes, that an FSSpec can hold, and that a Str255 can.
inline constexpr std::size_t kLongestSpecName = 63;
inline constexpr std::size_t kLongestStr255Name = 255;

// The name itself in HFS form, when Mac Roman has all of it and it takes at most `limit` bytes.
std::optional<std::string> PlainHFSName(std::string_view linuxName, std::size_t limit);

// The plain HFS name by which this very Linux name is looked up first, so that no other item can be
// found by it where the folder has this one.
std::optional<std::string> UnmistakableHFSName(std::string_view linuxName, std::size_t limit);

// What stands for a name that has no plain form, at most 31 bytes: as much of the name as fits, '?'
// for what Mac Roman lacks, "#", the node id in capital hexadecimal, and the extension if it has
// one of 1 to 5 characters that all can be encoded: "A very long name tha#1B4A3F.aif". Where an
// item is really called so, the one that only stands for its name has more than one '#': `marks` of
// them, 1 to kMostMarks.
std::string ShortHFSName(std::string_view linuxName, std::uint32_t nodeID, std::size_t marks = 1);
inline constexpr std::size_t kMostMarks = 16;

// Whether a name without accents can be the short form of an item that has no plain form: those
// have '?', or the full length because they were too long.
bool CanBeShortForm(std::string_view name);

// The node id and the most marks that an HFS name has if it reads as a short one. It can read as
// one in two ways, since an extension may have '#' in it.
struct ShortNameParts {
  std::uint32_t nodeID;
  std::size_t marks;
};
std::vector<ShortNameParts> ReadShortHFSName(std::string_view name);

// Whether an item of a Linux folder can be called so: not empty, no '/', no NUL, not "." or "..".
bool CanBeLinuxName(std::string_view name);

// The Linux names that an HFS name can stand for as it is: precomposed and, when it has accented
// letters, decomposed. Empty when no item can be called so.
struct SpelledNames {
  std::string precomposed;
  std::string decomposed;  // empty: no accented letters
};
SpelledNames SpellHFSName(std::string_view name);

}  // namespace tallowmere::names
