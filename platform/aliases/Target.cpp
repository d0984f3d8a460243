#include "aliases/Target.h"

#include <algorithm>
#include <cstdlib>
#include <utility>

#include "foundation/ColonsAndSlashes.h"
#include "foundation/PathText.h"
#include "names/HFSNames.h"
#include "names/NodeIDs.h"
#include "text/FileNameText.h"
#include "text/MacRoman.h"
#include "text/UnicodeForms.h"
#include "text/Utf16.h"

namespace tallowmere::aliases {
namespace {

using formats::AliasRecord;
using formats::Bookmark;
using formats::BookmarkFlags;

// --- Texts --------------------------------------------------------------------------------------

// The name in HFS form that a Linux name stands for, and back; nullopt where none can.
std::u16string HFSText(std::string_view linuxName) {
  return foundation::ExchangeColonsAndSlashes(text::TextOfFileName(linuxName));
}
std::optional<std::string> LinuxName(std::u16string_view hfsName) {
  auto name = text::FileNameOfText(foundation::ExchangeColonsAndSlashes(std::u16string(hfsName)));
  return name && names::CanBeLinuxName(*name) ? name : std::nullopt;
}

bool IsAscii(std::string_view bytes) {
  return text::IsAllAscii(bytes);
}

// Bytes that are not valid UTF-8 are read as lone surrogates.
bool IsUtf8(std::string_view bytes) {
  const std::u16string text = text::TextOfFileName(bytes);
  return std::none_of(text.begin(), text.end(),
                      [](char16_t unit) { return text::IsEscapedByte(unit); });
}

bool HasUtf8Reading(std::string_view bytes) {
  return !IsAscii(bytes) && IsUtf8(bytes);
}

std::vector<std::u16string> ReadingsOf(std::string_view bytes) {
  if (bytes.empty()) return {};
  std::vector<std::u16string> readings{text::DecodeMacRoman(bytes)};
  if (HasUtf8Reading(bytes)) readings.push_back(text::TextOfFileName(bytes));
  return readings;
}

// Whether two names are the same to those who store one with its marks apart.
bool AreSameName(std::u16string_view first, std::u16string_view second) {
  return first == second || text::Decompose(first) == text::Decompose(second);
}

bool IsOneOf(std::u16string_view name, const std::vector<std::u16string>& names) {
  return std::any_of(names.begin(), names.end(),
                     [name](const auto& other) { return AreSameName(name, other); });
}

std::vector<std::string> Split(std::string_view path, char separator) {
  std::vector<std::string> components;
  for (;;) {
    const std::size_t end = path.find(separator);
    components.emplace_back(path.substr(0, end));
    if (end == std::string_view::npos) return components;
    path.remove_prefix(end + 1);
  }
}

// --- Ways ---------------------------------------------------------------------------------------

using Components = std::vector<std::string>;

bool CanBeLinuxNames(const Components& components) {
  return std::all_of(components.begin(), components.end(),
                     [](const std::string& name) { return names::CanBeLinuxName(name); });
}

bool CanBeHFSNames(const Components& components) {
  return std::all_of(components.begin(), components.end(), [](const std::string& name) {
    return !names::SpellHFSName(name).precomposed.empty();
  });
}

std::u16string TextOfLast(const Way& way) {
  const std::string& last = way.components.back();
  return way.spelling == Way::Spelling::kHFS ? text::DecodeMacRoman(last) : HFSText(last);
}

// The way by a name in HFS form, in UTF-16.
std::vector<Way> WaysBy(std::u16string_view hfsName) {
  const auto name = LinuxName(hfsName);
  if (!name) return {};
  return {{Way::Spelling::kLinux, {*name}}};
}

// The readings of HFS names in 8 bits. One that reads as UTF-8 is looked up by its characters.
std::vector<Way> WaysBy8Bits(const Components& components) {
  std::vector<Way> ways;
  if (CanBeHFSNames(components)) ways.push_back({Way::Spelling::kHFS, components});
  const bool isAmbiguous = std::any_of(components.begin(), components.end(), HasUtf8Reading) &&
                           std::all_of(components.begin(), components.end(), IsUtf8);
  if (!isAmbiguous) return ways;
  Components exchanged = components;
  for (std::string& name : exchanged) name = foundation::ExchangeColonsAndSlashes(name);
  if (CanBeLinuxNames(exchanged)) ways.push_back({Way::Spelling::kLinux, std::move(exchanged)});
  return ways;
}

std::vector<Way> WaysByPosixPath(std::string_view path) {
  if (path.starts_with('/')) path.remove_prefix(1);
  Components components = path.empty() ? Components() : Split(path, '/');
  if (!CanBeLinuxNames(components)) return {};
  return {{Way::Spelling::kLinux, std::move(components)}};
}

// What follows the volume's name, which must be the record's.
std::vector<Way> WaysByHFSPath(const AliasRecord& record,
                               const std::vector<std::u16string>& volumeNames) {
  Components components = Split(*record.hfsPath, ':');
  const std::string volume = std::move(components.front());
  components.erase(components.begin());
  const bool isTheRecords =
      record.volumeName
          ? std::ranges::any_of(ReadingsOf(volume),
                                [&](const auto& name) { return IsOneOf(name, volumeNames); })
          : volume == record.shortVolumeName;
  if (!isTheRecords) return {};
  const bool isRoot = components == Components{""};
  return WaysBy8Bits(isRoot ? Components() : components);
}

// --- Records ------------------------------------------------------------------------------------

constexpr std::uint16_t kHFS = 0x4244;            // 'BD'
constexpr std::uint16_t kHFSPlus = 0x482B;        // 'H+'
constexpr std::uint16_t kCaseSensitive = 0x4858;  // 'HX'

bool IsOnHFSPlus(const AliasRecord& record) {
  return record.signature == kHFSPlus || record.signature == kCaseSensitive;
}

// Foreign file systems have 'BD' and an id; version 3 has one code of both.
bool HasCatalogIDs(const AliasRecord& record) {
  if (record.version == 2 && IsOnHFSPlus(record)) return true;
  return (IsOnHFSPlus(record) || record.signature == kHFS) && record.fileSystemID == 0;
}

// Seconds from 1904 to 1970.
constexpr std::int64_t k1970 = 2'082'844'800;

std::optional<Creation> CreationOf(const AliasRecord& record) {
  if (record.preciseTargetCreation != 0) {
    constexpr unsigned kFractionBits = 16;
    const auto seconds = static_cast<std::int64_t>(record.preciseTargetCreation >> kFractionBits);
    return Creation{seconds - k1970, true};
  }
  if (record.targetCreation == 0) return std::nullopt;
  return Creation{std::int64_t{record.targetCreation} - k1970, false};
}

std::optional<std::uint32_t> KnownID(std::uint32_t id) {
  if (id == 0 || id == AliasRecord::kNoID) return std::nullopt;
  return id;
}

std::optional<CatalogIDs> IDsOf(const AliasRecord& record) {
  const auto creation = CreationOf(record);
  if (!creation || !HasCatalogIDs(record)) return std::nullopt;
  return CatalogIDs{KnownID(record.targetID), KnownID(record.parentID), *creation};
}

std::optional<Levels> LevelsOf(const AliasRecord& record) {
  if (record.version != 2 || record.levelsUp < 1 || record.levelsDown < 1) return std::nullopt;
  return Levels{static_cast<std::size_t>(record.levelsUp),
                static_cast<std::size_t>(record.levelsDown)};
}

// Whether each way has so many components and ends with the target's name.
bool CanDescend(const std::vector<Way>& ways, const Levels& levels,
                const std::vector<std::u16string>& names) {
  return std::all_of(ways.begin(), ways.end(), [&](const Way& way) {
    return way.components.size() >= levels.down && IsOneOf(TextOfLast(way), names);
  });
}

// --- Bookmarks ----------------------------------------------------------------------------------

// The index of the first component that is on the target's own volume.
std::optional<std::size_t> FirstOnVolume(const Bookmark& bookmark) {
  const Components& components = *bookmark.components;
  if (bookmark.volumeLevels) {
    const auto& levels = *bookmark.volumeLevels;
    constexpr std::int64_t kTargetsLevel = 1;
    const auto last = std::find(levels.rbegin(), levels.rend(), kTargetsLevel);
    if (levels.size() != components.size() + 1 || last == levels.rend()) return std::nullopt;
    return static_cast<std::size_t>(levels.rend() - last) - 1;
  }
  if (!bookmark.volumePath || !bookmark.volumePath->starts_with('/')) return 0;
  const Components volume =
      Split(foundation::WithoutFolderMark(*bookmark.volumePath).substr(1), '/');
  const bool isWithin = volume.size() <= components.size() &&
                        std::equal(volume.begin(), volume.end(), components.begin());
  return isWithin ? volume.size() : 0;
}

std::vector<Way> WaysOf(const Bookmark& bookmark) {
  if (!bookmark.components || !CanBeLinuxNames(*bookmark.components)) return {};
  const auto first = FirstOnVolume(bookmark);
  if (!first) return {};
  const Components& all = *bookmark.components;
  return {{Way::Spelling::kLinux,
           Components(all.begin() + static_cast<std::ptrdiff_t>(*first), all.end())}};
}

// Of several kinds none is certain.
Kinds KindsOf(const BookmarkFlags& flags) {
  const Kinds kinds = {.file = flags.Has(BookmarkFlags::kFile),
                       .folder = flags.Has(BookmarkFlags::kFolder),
                       .link = flags.Has(BookmarkFlags::kLink)};
  return kinds.file + kinds.folder + kinds.link == 1 ? kinds : Kinds();
}

}  // namespace

bool Kinds::Admit(const kernel::Item& item) const {
  if (kernel::IsFolder(item)) return folder;
  return kernel::IsLink(item) ? link : file && kernel::IsRegularFile(item);
}

Target TargetOf(const AliasRecord& record) {
  Target target;
  target.kinds = {.file = !record.isFolder, .folder = record.isFolder, .link = !record.isFolder};
  target.isOnHFSPlus = IsOnHFSPlus(record);
  target.volumeNames =
      record.volumeName ? std::vector{*record.volumeName} : ReadingsOf(record.shortVolumeName);
  std::erase_if(target.volumeNames, [](const auto& name) { return name.empty(); });
  const auto readings =
      record.targetName ? std::vector{*record.targetName} : ReadingsOf(record.shortTargetName);
  target.names =
      record.targetName ? WaysBy(*record.targetName) : WaysBy8Bits({record.shortTargetName});
  if (record.isFolder && record.parentID == names::kParentOfRootID) {
    target.ways = {Way()};
  } else if (record.posixPath) {
    target.ways = WaysByPosixPath(*record.posixPath);
  } else if (record.hfsPath) {
    target.ways = WaysByHFSPath(record, target.volumeNames);
    // A reading in 8 bits that contradicts the name in UTF-16 is a wrong one.
    if (record.targetName) {
      std::erase_if(target.ways, [&](const Way& way) {
        return !way.components.empty() && !IsOneOf(TextOfLast(way), readings);
      });
    }
  }
  const auto levels = LevelsOf(record);
  if (levels && CanDescend(target.ways, *levels, readings)) target.levels = levels;
  target.ids = IDsOf(record);
  return target;
}

Target TargetOf(const Bookmark& bookmark) {
  Target target;
  target.kinds = KindsOf(bookmark.flags.value_or(BookmarkFlags()));
  if (bookmark.volumeName && !bookmark.volumeName->empty()) {
    target.volumeNames = {text::TextOfFileName(*bookmark.volumeName)};
  }
  target.ways = WaysOf(bookmark);
  return target;
}

Target TargetOf(const formats::AliasContent& content) {
  return std::visit([](const auto& read) { return TargetOf(read); }, content);
}

bool IsBirthOf(const Creation& creation, std::int64_t birthSeconds) {
  constexpr std::int64_t kQuarter = std::int64_t{15} * 60;
  constexpr std::int64_t kFarthest = std::int64_t{14} * 60 * 60;
  constexpr std::int64_t kNoDate = std::int64_t{1} << 48;  // what overflows below is none
  if (birthSeconds > kNoDate || birthSeconds < -kNoDate) return false;
  const std::int64_t difference = birthSeconds - creation.seconds;
  if (creation.isInUTC) return difference == 0;
  return std::abs(difference) <= kFarthest && difference % kQuarter == 0;
}

std::vector<std::string> OtherFormsOf(std::string_view linuxName) {
  if (IsAscii(linuxName)) return {};
  const std::u16string text = text::TextOfFileName(linuxName);
  std::vector<std::string> forms;
  for (const std::u16string& form : {text::Compose(text), text::Decompose(text)}) {
    const auto name = text::FileNameOfText(form);
    if (name && *name != linuxName) forms.push_back(*name);
  }
  return forms;
}

}  // namespace tallowmere::aliases
