#include "formats/AliasRecord.h"

#include <algorithm>
#include <bitset>

#include "formats/Bytes.h"

namespace tallowmere::formats {
namespace {

constexpr std::size_t kSizeAt = 4;
constexpr std::size_t kVersionAt = 6;
constexpr std::size_t kKindAt = 8;
constexpr std::uint16_t kFile = 0;
constexpr std::uint16_t kFolder = 1;

constexpr std::size_t kHeadOfVersion2 = 150;
constexpr std::size_t kLongestVolumeName = 27;
constexpr std::size_t kLongestTargetName = 63;
constexpr std::size_t kHeadOfVersion3 = 58;

constexpr std::uint16_t kEndTag = 0xFFFF;
constexpr std::size_t kTagHead = 4;

std::size_t HeadSizeOf(std::uint16_t version) {
  switch (version) {
    case 2:
      return kHeadOfVersion2;
    case 3:
      return kHeadOfVersion3;
    default:
      return 0;
  }
}

// A Pascal string of a head, in its field.
bool ReadPascal(std::string_view head, std::size_t offset, std::size_t longest, std::string& text) {
  const auto length = BigEndianIn<std::uint8_t>(head, offset);
  if (length > longest) return false;
  text = head.substr(offset + 1, length);
  return true;
}

bool ReadVersion2(std::string_view head, AliasRecord& record) {
  record.volumeCreation = BigEndianIn<std::uint32_t>(head, 38);
  record.signature = BigEndianIn<std::uint16_t>(head, 42);
  record.diskType = BigEndianIn<std::uint16_t>(head, 44);
  record.parentID = BigEndianIn<std::uint32_t>(head, 46);
  record.targetID = BigEndianIn<std::uint32_t>(head, 114);
  record.targetCreation = BigEndianIn<std::uint32_t>(head, 118);
  record.type = BigEndianIn<std::uint32_t>(head, 122);
  record.creator = BigEndianIn<std::uint32_t>(head, 126);
  record.levelsUp = BigEndianIn<std::int16_t>(head, 130);
  record.levelsDown = BigEndianIn<std::int16_t>(head, 132);
  record.volumeAttributes = BigEndianIn<std::uint32_t>(head, 134);
  record.fileSystemID = BigEndianIn<std::uint16_t>(head, 138);
  return ReadPascal(head, 10, kLongestVolumeName, record.shortVolumeName) &&
         ReadPascal(head, 50, kLongestTargetName, record.shortTargetName);
}

void ReadVersion3(std::string_view head, AliasRecord& record) {
  record.preciseVolumeCreation = BigEndianIn<PreciseDate>(head, 10);
  record.signature = BigEndianIn<std::uint16_t>(head, 18);
  record.fileSystemID = BigEndianIn<std::uint16_t>(head, 20);
  record.diskType = BigEndianIn<std::uint16_t>(head, 22);
  record.parentID = BigEndianIn<std::uint32_t>(head, 24);
  record.targetID = BigEndianIn<std::uint32_t>(head, 28);
  record.preciseTargetCreation = BigEndianIn<PreciseDate>(head, 32);
  record.volumeAttributes = BigEndianIn<std::uint32_t>(head, 40);
}

bool ReadText(std::string_view bytes, std::optional<std::string>& text) {
  text = bytes;
  return true;
}

// Some writers put NUL after each ':' and at the end.
bool ReadHFSPath(std::string_view bytes, std::optional<std::string>& path) {
  path = bytes;
  path->erase(std::remove(path->begin(), path->end(), '\0'), path->end());
  return true;
}

// A number of UTF-16 units, then the units.
bool ReadUnits(std::string_view bytes, std::optional<std::u16string>& text) {
  const auto count = BigEndianAt<std::uint16_t>(bytes, 0);
  if (!count || !Piece(bytes, sizeof *count, std::uint64_t{*count} * sizeof(char16_t))) {
    return false;
  }
  text.emplace();
  for (std::size_t i = 1; i <= *count; ++i) {
    text->push_back(BigEndianIn<std::uint16_t>(bytes, i * sizeof(char16_t)));
  }
  return true;
}

bool ReadIDs(std::string_view bytes, std::optional<std::vector<std::uint32_t>>& ids) {
  if (bytes.size() % sizeof(std::uint32_t) != 0) return false;
  ids.emplace();
  for (std::size_t at = 0; at < bytes.size(); at += sizeof(std::uint32_t)) {
    ids->push_back(BigEndianIn<std::uint32_t>(bytes, at));
  }
  return true;
}

template <class Number, class Field>
bool ReadNumber(std::string_view bytes, Field& field) {
  const auto number = BigEndianAt<Number>(bytes, 0);
  if (number) field = *number;
  return number.has_value();
}

bool ReadTag(std::uint16_t tag, std::string_view bytes, AliasRecord& record) {
  switch (tag) {
    case 0:
      return ReadText(bytes, record.folderName);
    case 1:
      return ReadIDs(bytes, record.folders);
    case 2:
      return ReadHFSPath(bytes, record.hfsPath);
    case 3:
      return ReadText(bytes, record.zone);
    case 4:
      return ReadText(bytes, record.server);
    case 5:
      return ReadText(bytes, record.user);
    case 6:
      return ReadText(bytes, record.driver);
    case 14:
      return ReadUnits(bytes, record.targetName);
    case 15:
      return ReadUnits(bytes, record.volumeName);
    case 16:
      return ReadNumber<PreciseDate>(bytes, record.preciseVolumeCreation);
    case 17:
      return ReadNumber<PreciseDate>(bytes, record.preciseTargetCreation);
    case 18:
      return ReadText(bytes, record.posixPath);
    case 19:
      return ReadText(bytes, record.mountPoint);
    case 20:
      return ReadText(bytes, record.diskImage);
    case 21:
      return ReadNumber<std::uint16_t>(bytes, record.homeComponents);
    default:
      return true;
  }
}

// Of a tag that comes twice, the first counts.
bool ReadTags(std::string_view tags, AliasRecord& record) {
  std::bitset<kEndTag + 1> known;
  while (!tags.empty()) {
    const auto tag = BigEndianAt<std::uint16_t>(tags, 0);
    const auto length = BigEndianAt<std::uint16_t>(tags, sizeof *tag);
    if (!length) return false;
    if (*tag == kEndTag) return *length == 0;
    const auto bytes = Piece(tags, kTagHead, *length);
    const auto rest = From(tags, kTagHead + *length + *length % 2U);
    if (!bytes || !rest) return false;
    if (!known.test(*tag) && !ReadTag(*tag, *bytes, record)) return false;
    known.set(*tag);
    tags = *rest;
  }
  return true;
}

}  // namespace

std::optional<AliasRecord> ReadAliasRecord(std::string_view bytes) {
  const auto size = BigEndianAt<std::uint16_t>(bytes, kSizeAt);
  const auto version = BigEndianAt<std::uint16_t>(bytes, kVersionAt);
  const auto kind = BigEndianAt<std::uint16_t>(bytes, kKindAt);
  if (!size || !version || !kind || *kind > kFolder) return std::nullopt;
  const std::size_t headSize = HeadSizeOf(*version);
  const auto record = Piece(bytes, 0, *size);
  if (headSize == 0 || !record || record->size() < headSize) return std::nullopt;
  AliasRecord read;
  read.userType = BigEndianIn<std::uint32_t>(bytes, 0);
  read.version = *version;
  read.isFolder = *kind != kFile;
  const std::string_view head = record->substr(0, headSize);
  if (*version == 3) {
    ReadVersion3(head, read);
  } else if (!ReadVersion2(head, read)) {
    return std::nullopt;
  }
  if (!ReadTags(record->substr(headSize), read)) return std::nullopt;
  return read;
}

}  // namespace tallowmere::formats
