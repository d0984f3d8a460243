#include "support/OldFormats.h"

#include <algorithm>

namespace tallowmere::test {
namespace {

std::string Pascal(const std::string& text, std::size_t field) {
  std::string bytes = Big(text.size(), 1) + text;
  bytes.resize(field);
  return bytes;
}

std::string Zeros(std::size_t count) {
  return std::string(count, '\0');
}

std::string HeadOfVersion2(const RecordToWrite& record) {
  return Big(record.kind, 2) + Pascal(record.volumeName, 28) + Big(record.volumeCreation, 4) +
         record.signature + Big(record.diskType, 2) + Big(record.parentID, 4) +
         Pascal(record.name, 64) + Big(record.targetID, 4) + Big(record.targetCreation, 4) +
         record.type + record.creator + Big(static_cast<std::uint16_t>(record.levelsUp), 2) +
         Big(static_cast<std::uint16_t>(record.levelsDown), 2) + Zeros(4) +
         Big(record.fileSystemID, 2) + Zeros(10);
}

std::string HeadOfVersion3(const RecordToWrite& record) {
  return Big(record.kind, 2) + Big(record.volumeCreation, 8) + record.signature +
         Big(record.fileSystemID, 2) + Big(record.diskType, 2) + Big(record.parentID, 4) +
         Big(record.targetID, 4) + Big(record.targetCreation, 8) + Zeros(4) + Zeros(14);
}

std::string Padded(std::string bytes, std::size_t block) {
  bytes.resize((bytes.size() + block - 1) / block * block);
  return bytes;
}

}  // namespace

std::string Big(std::uint64_t number, int count) {
  std::string bytes = Little(number, count);
  std::reverse(bytes.begin(), bytes.end());
  return bytes;
}

std::string Little(std::uint64_t number, int count) {
  std::string bytes;
  for (; count > 0; --count, number /= 256) bytes.push_back(static_cast<char>(number % 256));
  return bytes;
}

std::string Units(std::u16string_view text) {
  std::string bytes = Big(text.size(), 2);
  for (const char16_t unit : text) bytes += Big(unit, 2);
  return bytes;
}

std::string Write(const RecordToWrite& record) {
  std::string rest = Big(static_cast<std::uint64_t>(record.version), 2) +
                     (record.version == 3 ? HeadOfVersion3(record) : HeadOfVersion2(record));
  for (const Tag& tag : record.tags) {
    rest += Big(tag.number, 2) + Big(tag.bytes.size(), 2) + Padded(tag.bytes, 2);
  }
  if (record.hasEndTag) rest += Big(0xFFFF, 2) + Big(0, 2);
  return Zeros(4) + Big(rest.size() + 6, 2) + rest;
}

std::string WriteResourceFork(const std::vector<ResourceToWrite>& resources) {
  std::string data;
  std::string types;
  std::string references;
  std::size_t typeCount = 0;
  for (std::size_t i = 0; i < resources.size(); ++i) {
    if (i == 0 || resources[i].type != resources[i - 1].type) ++typeCount;
  }
  const std::size_t referencesAt = 2 + 8 * typeCount;
  for (std::size_t i = 0; i < resources.size();) {
    std::size_t end = i;
    const std::size_t begin = references.size();
    for (; end < resources.size() && resources[end].type == resources[i].type; ++end) {
      references += Big(static_cast<std::uint16_t>(resources[end].id), 2) + Big(0xFFFF, 2) +
                    Big(0x20, 1) + Big(data.size(), 3) + Big(0, 4);
      data += Big(resources[end].data.size(), 4) + resources[end].data;
    }
    types += resources[i].type + Big(end - i - 1, 2) + Big(referencesAt + begin, 2);
    i = end;
  }
  const std::string lists = Big(typeCount - 1, 2) + types + references;
  const std::string map = Zeros(24) + Big(28, 2) + Big(28 + lists.size(), 2) + lists;
  return Big(256, 4) + Big(256 + data.size(), 4) + Big(data.size(), 4) + Big(map.size(), 4) +
         Zeros(240) + data + map;
}

std::string FinderInfo(std::uint16_t flags) {
  return "alisMACS" + Big(flags, 2) + Zeros(22);
}

std::string WriteAppleDouble(const std::vector<std::pair<std::uint32_t, std::string>>& entries,
                             std::uint32_t magic) {
  std::string head =
      Big(magic, 4) + Big(0x00020000, 4) + "Mac OS X        " + Big(entries.size(), 2);
  std::string content;
  const std::size_t contentAt = 26 + 12 * entries.size();
  for (const auto& [id, bytes] : entries) {
    head += Big(id, 4) + Big(contentAt + content.size(), 4) + Big(bytes.size(), 4);
    content += bytes;
  }
  return head + content;
}

std::string WriteSidecarOfAlias(const std::string& record) {
  const std::string fork = WriteResourceFork({{"icns", -16455, "icon"}, {"alis", 0, record}});
  return WriteAppleDouble({{9, FinderInfo(kAliasFlag)}, {2, fork}});
}

// By the long division of the whole text with 16 zero bits behind it.
std::uint16_t Checksum(const std::string& bytes) {
  std::uint32_t rest = 0;
  const std::string text = bytes + Zeros(2);
  for (const char byte : text) {
    for (int bit = 7; bit >= 0; --bit) {
      rest = rest << 1 | (static_cast<unsigned char>(byte) >> bit & 1U);
      if ((rest & 0x10000) != 0) rest ^= 0x11021;
    }
  }
  return static_cast<std::uint16_t>(rest);
}

std::string Write(const MacBinaryToWrite& file) {
  std::string header = Zeros(1) + Pascal(file.name, 64) + "alisMACS" +
                       Big(file.finderFlags >> 8U, 1) + Zeros(9) + Big(file.dataFork.size(), 4) +
                       Big(file.resourceFork.size(), 4) + Zeros(10) +
                       Big(file.finderFlags & 0xFFU, 1) + Zeros(18) + Big(file.secondHeader, 2) +
                       Big(file.version, 1) + Big(129, 1);
  header += Big(Checksum(header), 2) + Zeros(2);
  return header + Padded(Zeros(file.secondHeader), 128) + Padded(file.dataFork, 128) +
         Padded(file.resourceFork, 128);
}

BookmarkWriter::Offset BookmarkWriter::Add(std::uint32_t type, const std::string& bytes) {
  const auto offset = static_cast<Offset>(4 + mItems.size());
  mItems += Little(bytes.size(), 4) + Little(type, 4) + Padded(bytes, 4);
  return offset;
}

BookmarkWriter::Offset BookmarkWriter::List(const std::vector<Offset>& items) {
  std::string bytes;
  for (const Offset item : items) bytes += Little(item, 4);
  return Add(0x0601, bytes);
}

BookmarkWriter::Offset BookmarkWriter::Texts(const std::vector<std::string>& texts) {
  std::vector<Offset> items;
  for (const std::string& text : texts) items.push_back(Text(text));
  return List(items);
}

BookmarkWriter::Offset BookmarkWriter::Numbers(const std::vector<std::int64_t>& numbers) {
  std::vector<Offset> items;
  for (const std::int64_t number : numbers) items.push_back(SmallNumber(static_cast<int>(number)));
  return List(items);
}

BookmarkWriter::Offset BookmarkWriter::AddTable(
    std::uint32_t level, const std::vector<std::pair<std::uint32_t, Offset>>& entries,
    Offset next) {
  mFirst = static_cast<Offset>(4 + mItems.size());
  mItems += Little(12 + 12 * entries.size(), 4) + Little(0xFFFFFFFE, 4) + Little(level, 4) +
            Little(next, 4) + Little(entries.size(), 4);
  for (const auto& [key, offset] : entries) {
    mItems += Little(key, 4) + Little(offset, 4) + Little(0, 4);
  }
  return mFirst;
}

void BookmarkWriter::Chain(Offset table, Offset next) {
  mItems.replace(table - 4 + 12, 4, Little(next, 4));
}

std::string BookmarkWriter::File() const {
  return std::string("book\0\0\0\0mark\0\0\0\0", 16) + Little(0x38, 4) + Little(0x38, 4) +
         Little(Data().size(), 4) + Little(0x10040000, 4) + Zeros(24) + Data();
}

std::string BookmarkWriter::Bare() const {
  return "book" + Little(0x30 + Data().size(), 4) + Little(0x10040000, 4) + Little(0x30, 4) +
         Zeros(32) + Data();
}

BookmarkWriter Write(const BookmarkToWrite& bookmark) {
  BookmarkWriter writer;
  const auto components = writer.Texts(bookmark.components);
  const auto flags = writer.Flags(bookmark.flags);
  const auto volumePath = writer.Text(bookmark.volumePath);
  const auto volumeName = writer.Text(bookmark.volumeName);
  writer.AddTable(
      1, {{0x1004, components}, {0x1010, flags}, {0x2002, volumePath}, {0x2010, volumeName}});
  return writer;
}

}  // namespace tallowmere::test
