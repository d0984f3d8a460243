#include "cli/OldVolumes.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <tallowmere/Volumes.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <memory>
#include <set>
#include <system_error>
#include <utility>

#include "client/NewNames.h"

namespace tallowmere::cli {
namespace {

constexpr std::int32_t kParentOfRoots = 1;  // the parent id of a volume's root folder
constexpr char kSeparator = ':';            // in HFS paths

// Nullopt for a text without '='.
std::optional<OldPlace> ReadPlace(const std::string& text) {
  const std::size_t equals = text.find('=');
  if (equals == 0 || equals == text.npos || equals + 1 == text.size()) return std::nullopt;
  return OldPlace{text.substr(0, equals), text.substr(equals + 1)};
}

// By what a record or HFS path names the volume; a text that is no name stays as it is.
std::string KeyOf(const std::string& old) {
  return HFSNameOfUtf8(old).value_or(old);
}

Result<std::string> FolderAt(const std::string& place) {
  std::error_code error;
  const auto path = std::filesystem::canonical(place, error);
  if (error || !std::filesystem::is_directory(path, error)) {
    return Error{Outcome::kNothing, "there is no folder \"" + place + '"'};
  }
  return path.string();
}

Error NotIn(const std::string& folder, const std::string& name) {
  return {Outcome::kNothing,
          "the folder \"" + folder + "\" has no item \"" + Utf8OfHFSName(name) + '"'};
}

// The entry of a folder, which may be no link, that has an HFS name.
Result<std::string> EntryWithName(const std::string& folder, const std::string& name) {
  const int opened = open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
  const std::unique_ptr<DIR, int (*)(DIR*)> entries(opened < 0 ? nullptr : fdopendir(opened),
                                                    closedir);
  if (!entries && errno == EACCES) return Error{Outcome::kRefused, folder + " may not be read"};
  std::string linuxName = LinuxNameOfHFSName(name);
  if (!entries || WhyNoHFSName(name)) return NotIn(folder, name);
  struct stat about {};
  if (fstatat(opened, linuxName.c_str(), &about, AT_SYMLINK_NOFOLLOW) == 0) return linuxName;
  std::optional<std::string> found;
  while (const dirent* const entry = readdir(entries.get())) {
    if (HFSNameOfLinuxName(entry->d_name) != name) continue;
    if (found) {
      return Error{Outcome::kAmbiguous,
                   "the folder \"" + folder + "\" has two items \"" + Utf8OfHFSName(name) + '"'};
    }
    found = entry->d_name;
  }
  return found ? Result<std::string>(*found) : NotIn(folder, name);
}

}  // namespace

Result<std::vector<OldPlace>> ReadTable(const std::string& file) {
  std::ifstream input(file);
  std::vector<OldPlace> places;
  std::set<std::string> seen;
  std::size_t number = 0;
  for (std::string line; std::getline(input, line);) {
    ++number;
    if (line.ends_with('\r')) line.pop_back();
    if (line.empty() || line.front() == '#') continue;
    auto place = ReadPlace(line);
    const std::string where = file + ", line " + std::to_string(number) + ": ";
    if (!place) return Error{Outcome::kInvalid, where + "it is no OLD-NUMBER-OR-NAME=PLACE"};
    if (!seen.insert(KeyOf(place->old)).second) {
      return Error{Outcome::kAmbiguous, where + '"' + place->old + "\" has a place already"};
    }
    places.push_back(*std::move(place));
  }
  if (!input.is_open() || input.bad()) {
    return Error{Outcome::kInvalid, file + ": " + std::strerror(errno)};
  }
  return places;
}

Result<OldNumbers> OldNumbers::Read(Client& client, const OldPlaces& places) {
  OldNumbers numbers;
  const auto find = [&client](const std::string& place) -> Result<Known> {
    auto volume = FindVolume(client, place);
    if (!volume) return volume.Failure();
    return Known{volume->number, std::move(volume->name)};
  };
  if (!places.volume.empty()) {
    const auto all = find(places.volume);
    if (!all) return all.Failure();
    numbers.mAll = *all;
  }
  if (places.table.empty()) return numbers;
  const auto table = ReadTable(places.table);
  if (!table) return table.Failure();
  numbers.mIsTable = true;
  for (const auto& [old, place] : *table) numbers.mKnown.emplace(KeyOf(old), find(place));
  return numbers;
}

Result<FSSpec> OldNumbers::Here(FSSpec record) const {
  if (!AreTold()) return record;
  std::optional<Result<Known>> known;
  if (mAll) {
    known = *mAll;
  } else {
    auto found = mKnown.find(std::to_string(record.vRefNum));
    if (found == mKnown.end() && record.parID == kParentOfRoots) found = mKnown.find(record.name);
    if (found == mKnown.end()) {
      return Error{Outcome::kNotAVolume,
                   "the table has no volume " + std::to_string(record.vRefNum)};
    }
    known = found->second;
  }
  if (!*known) return known->Failure();
  record.vRefNum = (*known)->number;
  if (record.parID == kParentOfRoots) record.name = (*known)->name;
  return record;
}

Result<CopiedVolumes> CopiedVolumes::Read(const OldPlaces& places) {
  CopiedVolumes copies;
  std::vector<OldPlace> all;
  if (!places.table.empty()) {
    auto table = ReadTable(places.table);
    if (!table) return table.Failure();
    all = *std::move(table);
  }
  for (const std::string& map : places.maps) {
    auto place = ReadPlace(map);
    if (!place) return Error{Outcome::kInvalid, '"' + map + "\" is no OLD-NAME=FOLDER"};
    all.push_back(*std::move(place));
  }
  for (const OldPlace& place : all) {
    auto folder = FolderAt(place.place);
    if (!folder) return folder.Failure();
    if (!copies.mFolders.emplace(KeyOf(place.old), *std::move(folder)).second) {
      return Error{Outcome::kAmbiguous, '"' + place.old + "\" has two places"};
    }
  }
  return copies;
}

std::optional<CopiedVolumes::InCopy> CopiedVolumes::Find(std::string_view hfsPath) const {
  const std::size_t end = std::min(hfsPath.find(kSeparator), hfsPath.size());
  const auto folder = mFolders.find(std::string(hfsPath.substr(0, end)));
  if (folder == mFolders.end()) return std::nullopt;
  InCopy copy{folder->second, {}};
  hfsPath.remove_prefix(std::min(end + 1, hfsPath.size()));
  while (!hfsPath.empty()) {
    const std::size_t length = std::min(hfsPath.find(kSeparator), hfsPath.size());
    copy.names.emplace_back(hfsPath.substr(0, length));
    hfsPath.remove_prefix(std::min(length + 1, hfsPath.size()));
  }
  return copy;
}

Result<std::string> PathInCopy(const CopiedVolumes::InCopy& copy) {
  std::string path = copy.folder;
  for (const std::string& name : copy.names) {
    if (name.empty()) return Error{Outcome::kInvalid, "an HFS path that climbs is none in a copy"};
    const auto entry = EntryWithName(path, name);
    if (!entry) return entry.Failure();
    if (!path.ends_with('/')) path += '/';
    path += *entry;
  }
  return path;
}

}  // namespace tallowmere::cli
