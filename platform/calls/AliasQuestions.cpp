// What alias files and records say, for programs.
#include <Tallowmere/Aliases.h>

#include <algorithm>
#include <array>
#include <exception>

#include "aliases/AliasFile.h"
#include "aliases/Resolution.h"
#include "calls/Process.h"
#include "calls/ResultCodes.h"
#include "formats/Recognition.h"
#include "foundation/ColonsAndSlashes.h"
#include "foundation/PathText.h"
#include "kernel/Contents.h"
#include "names/HFSNames.h"
#include "stores/Stores.h"
#include "text/FileNameText.h"
#include "text/MacRoman.h"
#include "text/Utf16.h"

using namespace tallowmere;

namespace tallowmere::alias {
namespace {

using formats::AliasRecord;
using formats::Bookmark;

// --- Texts --------------------------------------------------------------------------------------

// Surrogates without their other half are shown as '?'.
std::string Utf8(std::u16string text) {
  if (auto bytes = text::FileNameOfText(text)) return *std::move(bytes);
  std::replace_if(
      text.begin(), text.end(), [](char16_t unit) { return text::IsSurrogate(unit); }, u'?');
  return text::FileNameOfText(text).value_or("");
}

// Names in 8 bits, as UTF-8 where they are that, else as Mac Roman.
std::string Utf8Of8Bits(const std::string& bytes) {
  const std::u16string text = text::TextOfFileName(bytes);
  const bool isUtf8 = std::none_of(text.begin(), text.end(),
                                   [](char16_t unit) { return text::IsEscapedByte(unit); });
  return isUtf8 ? bytes : Utf8(text::DecodeMacRoman(bytes));
}

std::string NameOf(const std::optional<std::u16string>& text, const std::string& bytes) {
  return text ? Utf8(*text) : Utf8Of8Bits(bytes);
}

std::string CodeOf(std::uint32_t code) {
  if (code == 0) return {};
  std::string bytes;
  for (const unsigned shift : {24U, 16U, 8U, 0U}) bytes.push_back(static_cast<char>(code >> shift));
  return Utf8Of8Bits(bytes);
}

// "H+" of a code that ends in zeros.
std::string FileSystemOf(const AliasRecord& record) {
  std::string code = CodeOf(std::uint32_t{record.signature} << 16 | record.fileSystemID);
  code.erase(std::find(code.begin(), code.end(), '\0'), code.end());
  return code;
}

// --- Numbers ------------------------------------------------------------------------------------

constexpr std::int64_t k1904 = -2'082'844'800;  // in seconds since 1970
constexpr std::int64_t k2001 = 978'307'200;

std::optional<Date> DateOf(formats::PreciseDate precise, std::uint32_t seconds) {
  constexpr unsigned kFractionBits = 16;
  if (precise != 0) return Date{static_cast<std::int64_t>(precise >> kFractionBits) + k1904, true};
  if (seconds != 0) return Date{std::int64_t{seconds} + k1904, false};
  return std::nullopt;
}

std::optional<Date> DateOf(std::optional<double> since2001) {
  constexpr double kFarthest = 1e12;
  const bool isDate = since2001 && *since2001 > -kFarthest && *since2001 < kFarthest;
  if (!isDate) return std::nullopt;
  return Date{static_cast<std::int64_t>(*since2001) + k2001, true};
}

std::optional<std::uint64_t> IDOf(std::uint32_t id) {
  if (id == 0 || id == AliasRecord::kNoID) return std::nullopt;
  return id;
}

std::optional<int> LevelOf(std::int16_t level) {
  return level > 0 ? std::optional<int>(level) : std::nullopt;
}

// --- Descriptions -------------------------------------------------------------------------------

Description Describe(const AliasRecord& record) {
  Description d{};
  d.form = record.version == 3 ? Form::kRecordOfVersion3 : Form::kRecordOfVersion2;
  d.isFolder = record.isFolder;
  d.volumeName = NameOf(record.volumeName, record.shortVolumeName);
  d.fileSystem = FileSystemOf(record);
  d.volumeCreation = DateOf(record.preciseVolumeCreation, record.volumeCreation);
  d.mountPoint = record.mountPoint.value_or("");
  d.isOnDiskImage = record.diskImage.has_value();
  d.name = NameOf(record.targetName, record.shortTargetName);
  d.id = IDOf(record.targetID);
  d.parentID = IDOf(record.parentID);
  d.creation = DateOf(record.preciseTargetCreation, record.targetCreation);
  d.type = CodeOf(record.type);
  d.creator = CodeOf(record.creator);
  d.levelsUp = LevelOf(record.levelsUp);
  d.levelsDown = LevelOf(record.levelsDown);
  d.posixPath = record.posixPath.value_or("");
  d.hfsPath = Utf8Of8Bits(record.hfsPath.value_or(""));
  d.server = Utf8Of8Bits(record.server.value_or(""));
  d.user = Utf8Of8Bits(record.user.value_or(""));
  return d;
}

Description Describe(const Bookmark& bookmark) {
  Description d{};
  d.form = Form::kBookmark;
  d.isFolder = bookmark.flags && bookmark.flags->Has(formats::BookmarkFlags::kFolder);
  d.volumeName = bookmark.volumeName.value_or("");
  d.volumeCreation = DateOf(bookmark.volumeCreation);
  // What writers put where the file system has no date.
  if (d.volumeCreation && d.volumeCreation->seconds == 0) d.volumeCreation.reset();
  d.mountPoint = bookmark.volumePath.value_or("");
  d.isOnDiskImage = bookmark.diskImageLevel.has_value();
  d.creation = DateOf(bookmark.targetCreation);
  d.user = bookmark.userName.value_or("");
  if (!bookmark.components) return d;
  for (const std::string& name : *bookmark.components) d.posixPath.append("/").append(name);
  if (bookmark.components->empty()) d.posixPath = "/";
  if (!bookmark.components->empty()) {
    d.name = foundation::ExchangeColonsAndSlashes(bookmark.components->back());
  }
  const auto& ids = bookmark.ids;
  const bool hasIDs = ids && ids->size() == bookmark.components->size() && !ids->empty();
  if (hasIDs && ids->back() > 0) d.id = static_cast<std::uint64_t>(ids->back());
  return d;
}

std::vector<std::vector<std::string>> WaysOf(const aliases::Target& target) {
  std::vector<std::vector<std::string>> ways;
  for (const aliases::Way& way : target.ways) {
    ways.push_back(way.components);
    if (way.spelling == aliases::Way::Spelling::kLinux) continue;
    for (std::string& name : ways.back()) name = names::SpellHFSName(name).precomposed;
  }
  return ways;
}

Container ContainerOf(formats::Container container) {
  switch (container) {
    case formats::Container::kBookmarkFile:
      return Container::kAliasFile;
    case formats::Container::kResourceFork:
      return Container::kResourceFork;
    case formats::Container::kAppleDouble:
      return Container::kAppleDouble;
    case formats::Container::kMacBinary:
      return Container::kMacBinary;
    default:
      return Container::kNone;
  }
}

// --- Answers ------------------------------------------------------------------------------------

Answer Failed(OSErr result) {
  return {result, std::nullopt, Found::kNot, {}, false};
}

Found FoundBy(aliases::Found by) {
  switch (by) {
    case aliases::Found::kByLevels:
      return Found::kByLevels;
    case aliases::Found::kByPath:
      return Found::kByPath;
    default:
      return Found::kByID;
  }
}

// `file` is null where nothing is relative to one.
Answer AnswerTo(catalog::Moment& moment, const formats::AliasContent& content, Container container,
                const catalog::Look* file) {
  Answer answer = Failed(noErr);
  answer.description = std::visit([](const auto& read) { return Describe(read); }, content);
  answer.description->container = container;
  const aliases::Target target = aliases::TargetOf(content);
  answer.description->waysOnVolume = WaysOf(target);
  const auto resolved = aliases::Resolve(moment, file, target);
  if (!resolved) {
    answer.result = calls::ResultCodeOfAlias(resolved.Error());
    return answer;
  }
  answer.found = FoundBy(resolved->by);
  answer.path = resolved->item.path;
  answer.isFolder = kernel::IsFolder(resolved->item.item);
  return answer;
}

Answer LookAt(catalog::Moment& moment, std::string_view bytes, const catalog::Look* file) {
  const auto found = formats::RecognizeAlias(bytes);
  if (!found || !found->content) return Failed(paramErr);
  return AnswerTo(moment, *found->content, ContainerOf(found->container), file);
}

Answer LookAtContent(catalog::Moment& moment, const catalog::Look& file) {
  const auto contents = kernel::OpenFile(file.Spot(), file.Item());
  if (!contents) return Failed(calls::ResultCodeOf(contents.Error()));
  const auto size = kernel::SizeOf(*contents);
  if (!size || *size > stores::kLongestFork) return Failed(paramErr);
  const auto bytes = kernel::ReadBytes(*contents, 0, static_cast<std::size_t>(*size));
  if (!bytes) return Failed(calls::ResultCodeOf(bytes.Error()));
  return LookAt(moment, *bytes, nullptr);
}

Answer LookAt(catalog::Moment& moment, const std::string& path) {
  const auto folder = moment.HoldParentOf(path);
  if (!folder) return Failed(calls::ResultCodeOfFolder(folder.Error()));
  const auto file = moment.LookUp(*folder, *foundation::LastComponent(path));
  if (!file) return Failed(calls::ResultCodeOf(file.Error()));
  if (kernel::IsFolder(file->Item())) return Failed(paramErr);
  const auto alias = aliases::ReadAliasFile(*file);
  if (!alias) return Failed(calls::ResultCodeOfAlias(alias.Error()));
  if (!alias->isAlias) return LookAtContent(moment, *file);
  if (!alias->content) return Failed(calls::ResultCodeOfAlias(alias->content.Error()));
  return AnswerTo(moment, *alias->content, Container::kAliasFile, &*file);
}

template <class Body>
Answer InMoment(const Body& body) noexcept {
  try {
    return calls::InMoment(body);
  } catch (const std::exception&) {
    return Failed(memFullErr);
  }
}

}  // namespace

Answer LookAtBytes(std::string_view bytes) noexcept {
  return InMoment([&](catalog::Moment& moment) { return LookAt(moment, bytes, nullptr); });
}

Answer LookAtFile(const std::string& path) noexcept {
  return InMoment([&](catalog::Moment& moment) { return LookAt(moment, path); });
}

}  // namespace tallowmere::alias
