#include "formats/Recognition.h"

#include "formats/AppleDouble.h"
#include "formats/Bytes.h"
#include "formats/MacBinary.h"
#include "formats/ResourceFork.h"

namespace tallowmere::formats {
namespace {

template <class Read>
std::optional<AliasContent> ContentOf(const std::optional<Read>& read) {
  return read ? std::optional<AliasContent>(*read) : std::nullopt;
}

// In the forks of a file, the data first.
std::optional<RecognizedAlias> InForks(Container container, std::string_view data,
                                       std::string_view resources) {
  const bool isBookmark = BeginsBookmarkFile(data);
  if (isBookmark) {
    if (const auto bookmark = ReadBookmarkFile(data)) return RecognizedAlias{container, *bookmark};
  }
  auto found = RecognizeAliasInFork(resources);
  if (found) found->container = container;
  if (!found && isBookmark) return RecognizedAlias{container, std::nullopt};
  return found;
}

std::optional<RecognizedAlias> InAppleDouble(std::string_view bytes) {
  const auto file = ReadAppleDouble(bytes.substr(0, kLongestAppleDoubleHead), bytes.size());
  if (!file) return std::nullopt;
  const auto contentOf = [&](std::uint32_t id) {
    const auto* const entry = file->Find(id);
    return entry == nullptr
               ? std::string_view()
               : Piece(bytes, entry->offset, entry->length).value_or(std::string_view());
  };
  return InForks(Container::kAppleDouble, contentOf(AppleDouble::kDataFork),
                 contentOf(AppleDouble::kResourceFork));
}

std::optional<RecognizedAlias> Alone(std::string_view bytes) {
  if (auto record = ReadAliasRecord(bytes)) return RecognizedAlias{Container::kNone, *record};
  if (auto bookmark = ReadBookmark(bytes)) return RecognizedAlias{Container::kNone, *bookmark};
  return std::nullopt;
}

}  // namespace

std::optional<RecognizedAlias> RecognizeAliasInFork(std::string_view fork) {
  const auto resources = ResourcesOfType(fork, Code("alis"));
  if (!resources || resources->empty()) return std::nullopt;
  const auto& data = FirstByID(*resources).data;
  return RecognizedAlias{Container::kResourceFork,
                         data ? ContentOf(ReadAliasRecord(*data)) : std::nullopt};
}

std::optional<RecognizedAlias> RecognizeAlias(std::string_view bytes) {
  if (BeginsBookmarkFile(bytes)) {
    return RecognizedAlias{Container::kBookmarkFile, ContentOf(ReadBookmarkFile(bytes))};
  }
  if (auto found = InAppleDouble(bytes)) return found;
  if (const auto file = ReadMacBinary(bytes)) {
    return InForks(Container::kMacBinary, file->dataFork, file->resourceFork);
  }
  if (auto found = RecognizeAliasInFork(bytes)) return found;
  return Alone(bytes);
}

}  // namespace tallowmere::formats
