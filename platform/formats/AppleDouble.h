// AppleDouble and AppleSingle files: RFC 1740, appendix A and B. Big-endian.
//
// Magic number, version, 16 bytes of filler, number of entries; for each its id, and offset and
// length of its content from the file's begin.
#pragma once

#include <cstdint>
#include <optional>
#include <string_view>
#include <vector>

namespace tallowmere::formats {

struct AppleDouble {
  // Entry ids; others are skipped. The Finder information has 32 bytes; systems append others to
  // them.
  static constexpr std::uint32_t kDataFork = 1;
  static constexpr std::uint32_t kResourceFork = 2;
  static constexpr std::uint32_t kRealName = 3;
  static constexpr std::uint32_t kFinderInfo = 9;

  struct Entry {
    std::uint32_t id;
    std::uint64_t offset;
    std::uint64_t length;  // never 0
  };

  bool isSingle = false;       // AppleSingle
  std::vector<Entry> entries;  // those with content, within the file

  // The first entry with an id; null when there is none.
  const Entry* Find(std::uint32_t id) const;
};

// More entries are not read. Files have two, or thirteen.
inline constexpr std::size_t kMostEntries = 300;
// All entries are told within so many bytes of the file's begin.
inline constexpr std::size_t kLongestAppleDoubleHead = 26 + kMostEntries * 12;

// The entries of a file of `size` bytes that begins with `beginning`. Nullopt for another magic
// number or version, and when anything does not fit that is not skipped.
std::optional<AppleDouble> ReadAppleDouble(std::string_view beginning, std::uint64_t size);

}  // namespace tallowmere::formats
