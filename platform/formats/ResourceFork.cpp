#include "formats/ResourceFork.h"

#include <algorithm>
#include <utility>

#include "formats/Bytes.h"

namespace tallowmere::formats {
namespace {

// Of the map, from its begin.
constexpr std::uint64_t kTypeListOffsetAt = 24;
constexpr std::uint64_t kTypeEntry = 8;
constexpr std::uint64_t kReference = 12;

// Counts are one less than what they count: 0xFFFF is none.
std::optional<std::uint64_t> CountAt(std::string_view bytes, std::uint64_t offset) {
  const auto lessOne = BigEndianAt<std::uint16_t>(bytes, offset);
  if (!lessOne) return std::nullopt;
  return static_cast<std::uint16_t>(*lessOne + 1);
}

// A resource's data: its length, then so many bytes.
std::optional<std::string_view> DataAt(std::string_view data, std::uint64_t offset) {
  const auto length = BigEndianAt<std::uint32_t>(data, offset);
  return length ? Piece(data, offset + sizeof *length, *length) : std::nullopt;
}

struct Fork {
  std::string_view data;
  std::string_view types;  // the list of types, and all that follows it in the map
};

std::optional<Fork> ReadFork(std::string_view fork) {
  const auto dataAt = BigEndianAt<std::uint32_t>(fork, 0);
  const auto mapAt = BigEndianAt<std::uint32_t>(fork, 4);
  const auto dataLength = BigEndianAt<std::uint32_t>(fork, 8);
  const auto mapLength = BigEndianAt<std::uint32_t>(fork, 12);
  if (!mapLength) return std::nullopt;
  const auto data = Piece(fork, *dataAt, *dataLength);
  const auto map = Piece(fork, *mapAt, *mapLength);
  if (!data || !map) return std::nullopt;
  const auto typesAt = BigEndianAt<std::uint16_t>(*map, kTypeListOffsetAt);
  const auto types = typesAt ? From(*map, *typesAt) : std::nullopt;
  if (!types) return std::nullopt;
  return Fork{*data, *types};
}

std::optional<std::vector<Resource>> ReadReferences(const Fork& fork, std::uint64_t offset,
                                                    std::uint64_t count) {
  const auto references = Piece(fork.types, offset, count * kReference);
  if (!references) return std::nullopt;
  std::vector<Resource> resources;
  resources.reserve(static_cast<std::size_t>(count));
  for (std::size_t at = 0; at < references->size(); at += kReference) {
    constexpr std::uint32_t kLow24Bits = 0xFFFFFF;  // above them are the attributes
    const auto dataAt = BigEndianIn<std::uint32_t>(*references, at + 4) & kLow24Bits;
    resources.push_back({BigEndianIn<std::int16_t>(*references, at), DataAt(fork.data, dataAt)});
  }
  return resources;
}

}  // namespace

std::optional<std::vector<Resource>> ResourcesOfType(std::string_view bytes, std::uint32_t type) {
  const auto fork = ReadFork(bytes);
  const auto count = fork ? CountAt(fork->types, 0) : std::nullopt;
  if (!count) return std::nullopt;
  const auto list = Piece(fork->types, sizeof(std::uint16_t), *count * kTypeEntry);
  if (!list) return std::nullopt;
  for (std::size_t at = 0; at < list->size(); at += kTypeEntry) {
    if (BigEndianIn<std::uint32_t>(*list, at) != type) continue;
    const auto references = CountAt(*list, at + 4);
    return ReadReferences(*fork, BigEndianIn<std::uint16_t>(*list, at + 6), *references);
  }
  return std::vector<Resource>();
}

const Resource& FirstByID(const std::vector<Resource>& resources) {
  return *std::min_element(
      resources.begin(), resources.end(), [](const Resource& first, const Resource& second) {
        return std::pair(first.id != 0, first.id) < std::pair(second.id != 0, second.id);
      });
}

}  // namespace tallowmere::formats
