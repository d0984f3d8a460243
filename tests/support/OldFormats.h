// Writes what old systems wrote about files, by the published formats: for tests of those who read
// it, with which this shares no code.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace tallowmere::test {

// The lowest bytes of a number, the highest of them first, or last.
std::string Big(std::uint64_t number, int count);
std::string Little(std::uint64_t number, int count);

// --- Alias records ------------------------------------------------------------------------------

struct Tag {
  std::uint16_t number;
  std::string bytes;
};
// A text in UTF-16 with its length in front, as tags 14 and 15 have it.
std::string Units(std::u16string_view text);

// The fields of both versions, each as it is stored.
struct RecordToWrite {
  int version = 2;
  std::uint16_t kind = 0;
  std::string volumeName{};
  std::uint64_t volumeCreation = 0;
  std::string signature = "H+";  // two letters
  std::uint16_t fileSystemID = 0;
  std::uint16_t diskType = 0;
  std::uint32_t parentID = 0;
  std::string name{};
  std::uint32_t targetID = 0;
  std::uint64_t targetCreation = 0;
  std::string type = "TEXT";
  std::string creator = "ttxt";
  std::int16_t levelsUp = -1;
  std::int16_t levelsDown = -1;
  std::vector<Tag> tags{};
  bool hasEndTag = true;
};
std::string Write(const RecordToWrite& record);

// --- Files around them --------------------------------------------------------------------------

struct ResourceToWrite {
  std::string type;  // four letters
  std::int16_t id;
  std::string data;
};
// Resources of one type must be neighbours.
std::string WriteResourceFork(const std::vector<ResourceToWrite>& resources);

// Finder information of 32 bytes.
std::string FinderInfo(std::uint16_t flags);
inline constexpr std::uint16_t kAliasFlag = 0x8000;

std::string WriteAppleDouble(const std::vector<std::pair<std::uint32_t, std::string>>& entries,
                             std::uint32_t magic = 0x00051607);

// What stands beside an empty file that is an alias with this record: AppleDouble with flag and
// fork.
std::string WriteSidecarOfAlias(const std::string& record);

// The checksum of a MacBinary header: CRC-16 of XMODEM.
std::uint16_t Checksum(const std::string& bytes);

struct MacBinaryToWrite {
  std::string name = "alias";
  std::uint16_t finderFlags = kAliasFlag;
  std::string dataFork{};
  std::string resourceFork{};
  std::uint16_t secondHeader = 0;  // its length
  std::uint8_t version = 129;
};
std::string Write(const MacBinaryToWrite& file);

// --- Bookmarks ----------------------------------------------------------------------------------

// Collects items and tables; offsets are those that the bookmark has in the end.
class BookmarkWriter {
 public:
  using Offset = std::uint32_t;

  Offset Add(std::uint32_t type, const std::string& bytes);
  Offset Text(const std::string& text) { return Add(0x0101, text); }
  Offset Number(std::int64_t number) {
    return Add(0x0304, Little(static_cast<std::uint64_t>(number), 8));
  }
  Offset SmallNumber(std::int32_t number) {
    return Add(0x0303, Little(static_cast<std::uint32_t>(number), 4));
  }
  Offset Flags(std::uint64_t set, std::uint64_t known = 0x1F) {
    return Add(0x0201, Little(set, 8) + Little(known, 8) + Little(0, 8));
  }
  Offset List(const std::vector<Offset>& items);
  Offset Texts(const std::vector<std::string>& texts);
  Offset Numbers(const std::vector<std::int64_t>& numbers);

  // Adds a table behind what is there; `next` is the offset of the next one. The first table is the
  // one that was named last.
  Offset AddTable(std::uint32_t level, const std::vector<std::pair<std::uint32_t, Offset>>& entries,
                  Offset next = 0);
  void BeginWith(Offset table) { mFirst = table; }
  // Makes the table at an offset lead to another one.
  void Chain(Offset table, Offset next);

  std::string File() const;  // as the data of an alias file
  std::string Bare() const;

 private:
  std::string Data() const { return Little(mFirst, 4) + mItems; }

  std::string mItems;
  Offset mFirst = 0;
};

// A bookmark to a path on a volume that is mounted at "/" where it was written.
struct BookmarkToWrite {
  std::vector<std::string> components{};
  std::string volumeName{};
  std::uint64_t flags = 1;
  std::string volumePath = "/";
};
BookmarkWriter Write(const BookmarkToWrite& bookmark);

}  // namespace tallowmere::test
