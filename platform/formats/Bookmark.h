// Bookmarks, as newer systems write them instead of alias records: known from public descriptions
// by those who read them. Little-endian, but for dates.
//
// Data with tables of contents, each a chain of keys and offsets of items. An item is length, type
// and so many bytes. The first table, of level 1, is the target's; the others, each for one more
// volume on the way to it, are checked and never used.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace tallowmere::formats {

// Which flags are set, of those that are known.
struct BookmarkFlags {
  static constexpr std::uint64_t kFile = 1;
  static constexpr std::uint64_t kFolder = 2;
  static constexpr std::uint64_t kLink = 4;
  static constexpr std::uint64_t kVolume = 8;
  static constexpr std::uint64_t kPackage = 0x10;

  std::uint64_t set = 0;
  std::uint64_t known = 0;

  bool Has(std::uint64_t flag) const { return (set & known & flag) != 0; }
};

// What the first table says. The numbers are those of the keys; nullopt for one that is not there.
struct Bookmark {
  // What decides where it leads. With another type than theirs the bookmark is broken.
  std::optional<std::vector<std::string>> components;     // 0x1004, from the writer's "/"
  std::optional<BookmarkFlags> flags;                     // 0x1010
  std::optional<std::vector<std::int64_t>> volumeLevels;  // 0x2000
  std::optional<std::string> volumePath;                  // 0x2002
  std::optional<std::string> volumeName;                  // 0x2010

  // What else is shown. With another type it is not there.
  std::optional<std::vector<std::int64_t>> ids;  // 0x1005, of the components; 0 for none
  std::optional<std::int64_t> targetID;          // 0x1030
  std::optional<double> targetCreation;          // 0x1040, in seconds since 2001
  std::optional<std::string> volumeURL;          // 0x2005
  std::optional<std::string> volumeUUID;         // 0x2011
  std::optional<std::int64_t> volumeSize;        // 0x2012, in bytes
  std::optional<double> volumeCreation;          // 0x2013, in seconds since 2001
  std::optional<bool> isOnBootVolume;            // 0x2030
  std::optional<std::int64_t> diskImageLevel;    // 0x2040
  std::optional<std::string> userName;           // 0xC011
};

// Whether a file's data begin as those of an alias file with a bookmark. Its first 16 bytes tell.
inline constexpr std::size_t kBookmarkFileMark = 16;
bool BeginsBookmarkFile(std::string_view data);

// The bookmark of an alias file, and one on its own. Nullopt when anything does not fit: a length,
// an offset, a table met twice, a list too deep or too long.
std::optional<Bookmark> ReadBookmarkFile(std::string_view file);
std::optional<Bookmark> ReadBookmark(std::string_view bytes);

}  // namespace tallowmere::formats
