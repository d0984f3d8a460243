#include "cli/CopiedVolumes.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <memory>
#include <system_error>
#include <unordered_map>
#include <utility>

#include "client/NewNames.h"
#include "client/Places.h"
#include "client/Quoted.h"
#include "service/Protocol.h"
#include "text/FileNameText.h"
#include "text/MacRoman.h"
#include "text/UnicodeForms.h"
#include "text/Utf16.h"

namespace tallowmere::cli {
namespace {

using Path = Converted<std::string>;

Error NoFolder(const std::string& path) {
  return {Outcome::kNothing, "there is no folder " + Quoted(path)};
}

Result<std::string> FolderAt(const std::string& place) {
  auto folder = Places(true).FindFolder(place);
  if (!folder) return folder.Failure();
  return (*folder)->PathOrRoot();
}

// --- Names --------------------------------------------------------------------------------------

// Adds nothing for a text that no file name can be.
void AddForm(const std::u16string& text, std::vector<std::string>& forms) {
  if (auto form = text::FileNameOfText(text)) forms.push_back(*std::move(form));
}

bool IsUtf8(std::string_view bytes) {
  const std::u16string text = text::TextOfFileName(bytes);
  return std::none_of(text.begin(), text.end(),
                      [](char16_t unit) { return text::IsEscapedByte(unit); });
}

// The other ways to write a name, most likely first.
std::vector<std::string> OtherFormsOf(const std::string& name) {
  const std::u16string text = text::TextOfFileName(name);
  std::vector<std::string> forms;
  AddForm(text::Compose(text), forms);
  AddForm(text::DecomposeMacRoman(text), forms);
  AddForm(text::Decompose(text), forms);
  const auto bytes = text::EncodeMacRoman(text);
  if (bytes && !IsUtf8(*bytes)) forms.push_back(*bytes);
  return forms;
}

// --- Folders ------------------------------------------------------------------------------------

Error WhyNotEntered(const std::string& path, int errorNumber) {
  struct stat about {};
  if (lstat(path.c_str(), &about) == 0 && S_ISLNK(about.st_mode)) {
    return {Outcome::kNothing, Quoted(path) + " is a link, which is not followed in a copy"};
  }
  if (errorNumber == ENOENT || errorNumber == ENOTDIR) return NoFolder(path);
  return {Outcome::kRefused,
          Quoted(path) + " cannot be looked at: " + std::generic_category().message(errorNumber)};
}

// The names of a folder that are not ASCII, by their composed form.
struct NamesOfFolder {
  struct stat folder {};
  std::unordered_map<std::u16string, std::vector<std::string>> names;
};

bool IsUnchanged(const struct stat& before, const struct stat& now) {
  const auto same = [](const timespec& one, const timespec& other) {
    return one.tv_sec == other.tv_sec && one.tv_nsec == other.tv_nsec;
  };
  return before.st_dev == now.st_dev && before.st_ino == now.st_ino &&
         same(before.st_mtim, now.st_mtim) && same(before.st_ctim, now.st_ctim);
}

// Returns nullopt and sets errno when the folder cannot be read.
std::optional<NamesOfFolder> ReadNames(const Folder& folder) {
  const int opened = openat(folder.Descriptor(), ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
  const std::unique_ptr<DIR, int (*)(DIR*)> entries(opened < 0 ? nullptr : fdopendir(opened),
                                                    closedir);
  NamesOfFolder all;
  if (!entries || fstat(opened, &all.folder) != 0) return std::nullopt;
  errno = 0;
  while (const dirent* const entry = readdir(entries.get())) {
    const std::string_view name = entry->d_name;
    if (!text::IsAllAscii(name))
      all.names[text::Compose(text::TextOfFileName(name))].emplace_back(name);
  }
  if (errno != 0) return std::nullopt;
  return all;
}

// The entry whose name differs only in how its accents are written, some composed, some not.
Result<std::optional<std::string>> EntryInAnyForm(const Folder& folder, const std::string& name) {
  // Kept for the next items, most of which are in the same folder.
  thread_local std::optional<NamesOfFolder> latest;
  struct stat now {};
  const bool isKnown =
      latest && fstat(folder.Descriptor(), &now) == 0 && IsUnchanged(latest->folder, now);
  if (!isKnown) latest = ReadNames(folder);
  if (!latest) return WhyNotEntered(folder.PathOrRoot(), errno);
  const auto found = latest->names.find(text::Compose(text::TextOfFileName(name)));
  if (found == latest->names.end()) return std::optional<std::string>();
  if (found->second.size() == 1) return std::optional(found->second.front());
  return Error{Outcome::kAmbiguous, "the folder " + Quoted(folder.PathOrRoot()) +
                                        " has two items " + Quoted(name) +
                                        ", with their accents written in two ways"};
}

// The name of the item as it is stored; nullopt where there is no such item.
Result<std::optional<std::string>> EntryOf(const Folder& folder, const std::string& name) {
  std::vector<std::string> forms = {name};
  const bool hasOneForm = text::IsAllAscii(std::string_view(name));
  if (!hasOneForm) {
    for (std::string& form : OtherFormsOf(name)) forms.push_back(std::move(form));
  }
  for (std::string& form : forms) {
    const auto looked = LookAt(folder, form);
    if (!looked) return looked.Failure();
    if (looked->exists) return std::optional(std::move(form));
  }
  if (hasOneForm) return std::optional<std::string>();
  return EntryInAnyForm(folder, name);
}

Conversion<std::string> ItemIn(const std::string& path, const std::string& name) {
  const int opened = open(path.c_str(), O_PATH | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
  if (opened < 0) return WhyNotEntered(path, errno);
  const Folder folder(path == "/" ? "" : path, opened);
  const auto entry = EntryOf(folder, name);
  if (!entry) return entry.Failure();
  return Path{folder.PathOf(entry->value_or(name)), *entry ? Outcome::kFound : Outcome::kNew};
}

// --- HFS paths ----------------------------------------------------------------------------------

// The Linux names behind the volume's, up to a colon at the end.
Result<std::vector<std::string>> NamesIn(std::string_view hfsPath) {
  std::vector<std::string> names;
  std::string_view rest = hfsPath;
  rest.remove_prefix(std::min(rest.find(protocol::kSeparator), rest.size() - 1) + 1);
  while (!rest.empty()) {
    const std::string_view name = rest.substr(0, rest.find(protocol::kSeparator));
    if (name.empty()) {
      return Error{Outcome::kInvalid, "the HFS path " + Quoted(Utf8OfHFSName(hfsPath)) +
                                          " climbs to an outer folder, which none does in a copy"};
    }
    if (auto reason = WhyNoHFSName(name)) return Error{Outcome::kInvalid, *std::move(reason)};
    names.push_back(LinuxNameOfHFSName(name));
    rest.remove_prefix(std::min(name.size() + 1, rest.size()));
  }
  return names;
}

// Why no new item can be called so; nullopt when one can.
std::optional<Error> WhyNotNew(std::string_view linuxName) {
  const auto name = HFSNameOfLinuxName(linuxName);
  if (name && name->size() <= protocol::kLongestSpecName) return std::nullopt;
  const std::string text = name ? Utf8OfHFSName(*name) : std::string(linuxName);
  return Error{Outcome::kInvalid, "no new item can keep the HFS name " + Quoted(text)};
}

}  // namespace

Result<CopiedVolumes> CopiedVolumes::Read(const OldPlaces& places) {
  CopiedVolumes copies;
  std::vector<OldPlace> all;
  if (!places.table.empty()) {
    auto table = ReadTable(places.table);
    if (!table) return table.Failure();
    all = *std::move(table);
  }
  const std::size_t told = all.size();
  for (const std::string& map : places.maps) {
    if (auto place = ReadPlace(map)) all.push_back(*std::move(place));
  }
  for (std::size_t i = 0; i < all.size(); ++i) {
    auto folder = FolderAt(all[i].place);
    // A table may serve other commands and volumes too: only its own items fail by a wrong line.
    if (!folder && i >= told) return folder.Failure();
    if (!copies.mFolders.emplace(KeyOfVolume(all[i].old), std::move(folder)).second) {
      return Error{Outcome::kAmbiguous, Quoted(all[i].old) + " has two places"};
    }
  }
  return copies;
}

std::optional<Result<std::string>> CopiedVolumes::FolderOf(const std::string& volume) const {
  const auto folder = mFolders.find(KeyOfVolume(volume));
  return folder == mFolders.end() ? std::nullopt : std::optional(folder->second);
}

std::optional<Conversion<std::string>> CopiedVolumes::PathOfHFSPath(
    std::string_view hfsPath) const {
  const std::string volume(hfsPath.substr(0, hfsPath.find(protocol::kSeparator)));
  const auto folder = mFolders.find(volume);
  if (folder == mFolders.end()) return std::nullopt;
  if (!folder->second) return folder->second.Failure();
  const auto names = NamesIn(hfsPath);
  if (!names) return names.Failure();
  auto path = PathInCopy(*folder->second, *names);
  if (!path) return path;
  if (hfsPath.ends_with(protocol::kSeparator)) {  // a folder that exists
    const auto looked = LookAt(path->value);
    if (!looked) return looked.Failure();
    if (!looked->isFolder) return NoFolder(path->value);
  }
  if (path->outcome == Outcome::kNew) {
    if (auto error = WhyNotNew(names->back())) return *std::move(error);
  }
  return path;
}

Conversion<std::string> PathInCopy(const std::string& folder,
                                   const std::vector<std::string>& names) {
  Path item{folder, Outcome::kFound};
  for (const std::string& name : names) {
    if (item.outcome == Outcome::kNew) return NoFolder(item.value);
    auto next = ItemIn(item.value, name);
    if (!next) return next;
    item = *std::move(next);
  }
  return item;
}

}  // namespace tallowmere::cli
