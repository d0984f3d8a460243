#include "client/Places.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <climits>
#include <cstdlib>
#include <system_error>
#include <utility>

#include "client/Quoted.h"

namespace tallowmere {
namespace {

// Enough for the folders on the way to an item, to which a listing of a tree returns.
constexpr std::size_t kMostFolders = 8;

Error Failed(std::string_view path, int errorNumber) {
  const std::string reason = std::generic_category().message(errorNumber);
  switch (errorNumber) {
    case ENOENT:
    case ENOTDIR:
    case ELOOP:
      return {Outcome::kNothing, "there is no folder " + Quoted(path)};
    case ENAMETOOLONG:
      return {Outcome::kInvalid, Quoted(path) + " is too long: " + reason};
    default:
      return {Outcome::kRefused, Quoted(path) + " cannot be looked at: " + reason};
  }
}

// Looks at `text` from a folder, or from AT_FDCWD; `path` is what it is called in an error.
Result<Looked> LookFrom(int folder, const char* text, const std::string& path) {
  struct stat about {};
  if (fstatat(folder, text, &about, AT_SYMLINK_NOFOLLOW | AT_NO_AUTOMOUNT) == 0) {
    return Looked{true, S_ISDIR(about.st_mode)};
  }
  if (errno == ENOENT) return Looked{false, false};
  return Failed(path, errno);
}

std::string_view WithoutSlashesAtTheEnd(std::string_view path) {
  const std::size_t last = path.find_last_not_of('/');
  return path.substr(
      0, last == std::string_view::npos ? std::min<std::size_t>(path.size(), 1) : last + 1);
}

bool IsDots(std::string_view name) {
  return name == "." || name == "..";
}

// A path's folder and name. The folder of a lone name is ".".
struct Split {
  std::string_view folder;
  std::string_view name;
};
Split SplitOf(std::string_view path) {
  const std::size_t slash = path.rfind('/');
  if (slash == std::string_view::npos) return {".", path};
  return {WithoutSlashesAtTheEnd(path.substr(0, slash + 1)), path.substr(slash + 1)};
}

bool IsSame(const struct stat& one, const struct stat& other) {
  return one.st_dev == other.st_dev && one.st_ino == other.st_ino;
}

// The path that a held folder has now. Sets errno and is empty when it has none.
std::string PathOfDescriptor(int descriptor, const std::string& text) {
  std::array<char, PATH_MAX> path;
  const std::string link = "/proc/self/fd/" + std::to_string(descriptor);
  const ssize_t length = readlink(link.c_str(), path.data(), path.size());
  if (length > 0) return {path.data(), static_cast<std::size_t>(length)};
  // Without /proc.
  return realpath(text.c_str(), path.data()) == nullptr ? "" : std::string(path.data());
}

}  // namespace

Folder::~Folder() {
  close(mDescriptor);
}

std::string Folder::PathOf(std::string_view name) const {
  std::string path;
  path.reserve(mPath.size() + 1 + name.size());
  return path.append(mPath).append(1, '/').append(name);
}

bool Folder::IsAt(const std::string& path) const {
  struct stat own {};
  struct stat other {};
  return fstat(mDescriptor, &own) == 0 && lstat(path.c_str(), &other) == 0 && IsSame(own, other);
}

Result<Looked> LookAt(const Folder& folder, std::string_view name) {
  const std::string path = folder.PathOf(name);
  return LookFrom(folder.Descriptor(), path.c_str() + path.size() - name.size(), path);
}

Result<Looked> LookAt(const std::string& path) {
  return LookFrom(AT_FDCWD, path.c_str(), path);
}

bool IsSameItem(const std::string& one, const std::string& other) {
  if (one == other) return true;
  struct stat first {};
  struct stat second {};
  return lstat(one.c_str(), &first) == 0 && lstat(other.c_str(), &second) == 0 &&
         IsSame(first, second);
}

bool IsSameFileSystem(const std::string& one, const std::string& other) {
  struct stat first {};
  struct stat second {};
  return lstat(one.c_str(), &first) == 0 && lstat(other.c_str(), &second) == 0 &&
         first.st_dev == second.st_dev;
}

std::string_view LastNameOf(std::string_view path) {
  return path.substr(path.rfind('/') + 1);
}

std::string_view FolderOf(std::string_view path) {
  return path.substr(0, path.rfind('/'));
}

std::optional<Error> Places::WhyNoPath(std::string_view path) const {
  if (path.empty()) return Error{Outcome::kInvalid, "an empty path names nothing"};
  if (path.find('\0') != std::string_view::npos) {
    return Error{Outcome::kInvalid, "a path with a NUL names nothing"};
  }
  if (!mResolves && path.front() != '/') {
    return Error{Outcome::kInvalid, Quoted(path) + " is not absolute"};
  }
  return std::nullopt;
}

Result<std::shared_ptr<Folder>> Places::FindFolder(std::string_view path) {
  if (auto error = WhyNoPath(path)) return *std::move(error);
  return FolderAt(path);
}

Result<Place> Places::Find(std::string_view path) {
  if (auto error = WhyNoPath(path)) return *std::move(error);
  const std::string_view plain = WithoutSlashesAtTheEnd(path);
  const Split split = SplitOf(plain);
  if (plain == "/" || IsDots(split.name)) return FindByWholeWay(plain);
  auto folder = FolderAt(split.folder);
  if (!folder) return folder.Failure();
  return PlaceIn(*std::move(folder), split.name);
}

// The place of a folder that is not named by its path.
Result<Place> Places::FindByWholeWay(std::string_view path) {
  if (!mResolves && path != "/") {
    return Error{Outcome::kInvalid, Quoted(path) + " does not end in the name of an item"};
  }
  auto item = FolderAt(path);
  if (!item) return item.Failure();
  if ((*item)->Path().empty()) return Place{*std::move(item), "/", 1, true, true};
  const Split split = SplitOf((*item)->Path());
  auto folder = FolderAt(split.folder);
  if (!folder) return folder.Failure();
  return PlaceIn(*std::move(folder), split.name);
}

Result<Place> Places::PlaceIn(std::shared_ptr<Folder> folder, std::string_view name) {
  Place place{nullptr, folder->PathOf(name), folder->Path().size() + 1, false, false};
  const auto looked = LookFrom(folder->Descriptor(), place.path.c_str() + place.nameAt, place.path);
  if (!looked) return looked.Failure();
  if (place.path.size() >= PATH_MAX) return Failed(place.path, ENAMETOOLONG);
  place.folder = std::move(folder);
  place.exists = looked->exists;
  place.isFolder = looked->isFolder;
  return place;
}

Result<std::shared_ptr<Folder>> Places::FolderAt(std::string_view path) {
  const std::string_view text = WithoutSlashesAtTheEnd(path);
  const auto known = std::find_if(mKnown.rbegin(), mKnown.rend(),
                                  [text](const Known& one) { return one.text == text; });
  if (known != mKnown.rend()) {
    std::rotate(known.base() - 1, known.base(), mKnown.end());
    return mKnown.back().folder;
  }
  auto folder = Open(std::string(text));
  if (mKnown.size() == kMostFolders) mKnown.erase(mKnown.begin());
  mKnown.push_back({std::string(text), std::move(folder)});
  return mKnown.back().folder;
}

Result<std::shared_ptr<Folder>> Places::Open(const std::string& text) {
  if (auto folder = OpenInKnown(text)) return folder;
  const int descriptor =
      open(text.c_str(), O_PATH | O_DIRECTORY | O_CLOEXEC | (mResolves ? 0 : O_NOFOLLOW));
  if (descriptor < 0) return Failed(text, errno);
  const std::string path = mResolves ? PathOfDescriptor(descriptor, text) : text;
  auto folder = std::make_shared<Folder>(path == "/" ? "" : path, descriptor);
  // A folder that was deleted, or is below another root or another mount, has no path.
  if (mResolves && !folder->IsAt(path)) return Failed(text, ENOENT);
  return folder;
}

// A folder in a known one, unless it is a link: its path is known without asking the system.
std::shared_ptr<Folder> Places::OpenInKnown(const std::string& text) {
  const Split split = SplitOf(text);
  if (split.name.empty() || IsDots(split.name)) return nullptr;
  const auto known = std::find_if(mKnown.rbegin(), mKnown.rend(), [&](const Known& one) {
    return one.folder && one.text == split.folder;
  });
  if (known == mKnown.rend()) return nullptr;
  const Folder& holder = **known->folder;
  const std::string name(split.name);
  const int descriptor =
      openat(holder.Descriptor(), name.c_str(), O_PATH | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
  if (descriptor < 0) return nullptr;
  return std::make_shared<Folder>(holder.PathOf(name), descriptor);
}

}  // namespace tallowmere
