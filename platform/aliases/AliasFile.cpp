#include "aliases/AliasFile.h"

#include <algorithm>
#include <string>
#include <utility>

#include "formats/AliasRecord.h"
#include "formats/Bookmark.h"
#include "formats/Bytes.h"
#include "formats/ResourceFork.h"
#include "kernel/Contents.h"
#include "stores/Stores.h"

namespace tallowmere::aliases {
namespace {

using kernel::Result;

constexpr std::uint32_t kAliasResource = formats::Code("alis");

// Longer ones are broken: they are a few kilobytes, with the tokens of a sandbox some more.
constexpr std::size_t kLongestBookmark = std::size_t{4} << 20;

AliasFile Broken() {
  return {true, kBroken};
}

AliasFile SayingWhat(std::optional<std::string_view> resource) {
  const auto record = resource ? formats::ReadAliasRecord(*resource) : std::nullopt;
  return record ? AliasFile{true, formats::AliasContent(*record)} : Broken();
}

// By Finder flags and resource fork.
Result<AliasFile> ReadRecordOf(const catalog::Look& file, const kernel::Descriptor& contents) {
  const auto flags = stores::FinderFlagsOf(file, contents);
  if (!flags) return flags.Error();
  if ((flags->value_or(0) & stores::kIsAlias) == 0) return AliasFile();
  const auto fork = stores::ResourceForkOf(file, contents);
  if (!fork && fork.Error() != kernel::Error{EFBIG}) return fork.Error();
  if (fork && fork->empty()) return AliasFile();
  const auto resources = fork ? formats::ResourcesOfType(*fork, kAliasResource) : std::nullopt;
  if (!resources) return kBroken;
  return resources->empty() ? AliasFile() : SayingWhat(formats::FirstByID(*resources).data);
}

// REQUIRES: the data begin as those of a bookmark.
Result<AliasFile> ReadBookmarkOf(const catalog::Look& file, const kernel::Descriptor& contents) {
  const auto size = kernel::SizeOf(contents);
  if (!size) return size.Error();
  const auto data = kernel::ReadBytes(
      contents, 0, static_cast<std::size_t>(std::min<std::uint64_t>(*size, kLongestBookmark)));
  if (!data) return data.Error();
  const auto bookmark = formats::ReadBookmarkFile(*data);
  if (bookmark) return AliasFile{true, formats::AliasContent(*bookmark)};
  auto record = ReadRecordOf(file, contents);
  if (!record && record.Error() != kBroken) return AliasFile{true, record.Error()};
  return record && record->isAlias ? record : Broken();
}

}  // namespace

Result<AliasFile> ReadAliasFile(const catalog::Look& file) {
  if (!kernel::IsRegularFile(file.Item())) return AliasFile();
  const auto contents = kernel::OpenFile(file.Spot(), file.Item());
  if (!contents) return contents.Error();
  const auto beginning = kernel::ReadBytes(*contents, 0, formats::kBookmarkFileMark);
  if (!beginning) return beginning.Error();
  if (formats::BeginsBookmarkFile(*beginning)) return ReadBookmarkOf(file, *contents);
  return beginning->empty() ? ReadRecordOf(file, *contents) : AliasFile();
}

}  // namespace tallowmere::aliases
