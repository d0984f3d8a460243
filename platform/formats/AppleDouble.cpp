#include "formats/AppleDouble.h"

#include <algorithm>

#include "formats/Bytes.h"

namespace tallowmere::formats {
namespace {

constexpr std::uint32_t kMagicOfSingle = 0x00051600;
constexpr std::uint32_t kMagicOfDouble = 0x00051607;
constexpr std::uint32_t kVersion1 = 0x00010000;
constexpr std::uint32_t kVersion2 = 0x00020000;
constexpr std::size_t kCountAt = 24;
constexpr std::size_t kEntriesAt = 26;
constexpr std::size_t kEntrySize = 12;

bool IsKnown(std::uint32_t id) {
  return id == AppleDouble::kDataFork || id == AppleDouble::kResourceFork ||
         id == AppleDouble::kRealName || id == AppleDouble::kFinderInfo;
}

}  // namespace

const AppleDouble::Entry* AppleDouble::Find(std::uint32_t id) const {
  const auto found = std::find_if(entries.begin(), entries.end(),
                                  [id](const Entry& entry) { return entry.id == id; });
  return found == entries.end() ? nullptr : &*found;
}

std::optional<AppleDouble> ReadAppleDouble(std::string_view beginning, std::uint64_t size) {
  const auto magic = BigEndianAt<std::uint32_t>(beginning, 0);
  const auto version = BigEndianAt<std::uint32_t>(beginning, 4);
  const auto count = BigEndianAt<std::uint16_t>(beginning, kCountAt);
  const bool isSingle = magic == kMagicOfSingle;
  const bool isDouble = magic == kMagicOfDouble;
  const bool isOld = version == kVersion1;
  const bool isNew = version == kVersion2;
  if (!count || !(isSingle || isDouble) || !(isOld || isNew)) return std::nullopt;
  if (*count > kMostEntries) return std::nullopt;
  const auto list = Piece(beginning, kEntriesAt, *count * kEntrySize);
  if (!list) return std::nullopt;
  AppleDouble read;
  read.isSingle = isSingle;
  for (std::size_t at = 0; at < list->size(); at += kEntrySize) {
    const AppleDouble::Entry entry{BigEndianIn<std::uint32_t>(*list, at),
                                   BigEndianIn<std::uint32_t>(*list, at + 4),
                                   BigEndianIn<std::uint32_t>(*list, at + 8)};
    if (entry.length == 0 || !IsKnown(entry.id)) continue;
    if (entry.offset > size || entry.length > size - entry.offset) return std::nullopt;
    read.entries.push_back(entry);
  }
  return read;
}

}  // namespace tallowmere::formats
