#include "files/ItemPlace.h"

#include <fcntl.h>
#include <unistd.h>

#include <array>
#include <climits>
#include <cstdlib>
#include <memory>

#include "files/Descriptor.h"
#include "files/FileHandle.h"
#include "files/FolderPass.h"
#include "files/MountTable.h"
#include "files/PlaceMemory.h"
#include "foundation/PathText.h"

namespace tallowmere::files {
namespace {

using Path = std::optional<std::string>;

// All links followed.
Path RealPath(const std::string& path) {
  struct Free {
    void operator()(char* text) const { std::free(text); }
  };
  const std::unique_ptr<char, Free> real(realpath(path.c_str(), nullptr));
  if (!real) return std::nullopt;
  return std::string(real.get());
}

// Links on the way followed, one in the last place not.
Path CanonicalPath(const std::string& path) {
  const std::string name(*foundation::LastComponent(path));
  if (name == "/" || name == "." || name == "..") return RealPath(path);
  const auto folder = RealPath(foundation::ParentPath(path));
  if (!folder) return std::nullopt;
  return foundation::JoinPath(*folder, name);
}

// The canonical path if the item is there.
Path Verified(const ItemReference& item, const std::string& path) {
  auto canonical = CanonicalPath(path);
  if (!canonical || !IsAt(item, AT_FDCWD, canonical->c_str())) return std::nullopt;
  return canonical;
}

// The place of the item's volume.
Path VolumeRoot(const ItemReference& item) {
  MountTable& table = MountTable::OfThisProcess();
  for (std::size_t index = 0; const Volume* volume = table.AtIndex(index); ++index) {
    if (IsOnVolumeOf(item, volume->MountPoint().c_str())) return volume->MountPoint();
  }
  return std::nullopt;
}

// The nearest folder to a former place of the item that is still there, on the item's volume.
Path NearestFolder(const ItemReference& item, const std::string& formerPlace) {
  for (std::string path = formerPlace; path != "/";) {
    path = foundation::WithFolderMark(foundation::ParentPath(path), false);
    auto real = RealPath(path);
    if (real && IsOnVolumeOf(item, real->c_str())) return real;
    // Above a component "." or ".." the spelling leads nowhere.
    const auto name = *foundation::LastComponent(path);
    if (name == "." || name == "..") break;
  }
  return VolumeRoot(item);
}

// The path at which the kernel shows an open item.
Path PathOfDescriptor(const Descriptor& descriptor) {
  const std::string link = "/proc/self/fd/" + std::to_string(descriptor.Get());
  std::array<char, PATH_MAX> text{};
  const ssize_t length = readlink(link.c_str(), text.data(), text.size());
  if (length <= 0 || text[0] != '/') return std::nullopt;
  return std::string(text.data(), static_cast<std::size_t>(length));
}

std::optional<FileHandle> HandleOf(const ItemReference& item, const std::string& sibling) {
  if (item.handle.size != 0) return item.handle;
  const auto read = ReadItem(AT_FDCWD, sibling.c_str());
  if (!read) return std::nullopt;
  return HandleOfInode(ReadHandle(AT_FDCWD, sibling.c_str()), read->inode, item.inode);
}

// By handle, for a process with the privilege. `folder` is on the item's volume.
Path PlaceByHandle(const ItemReference& item, const std::string& folder) {
  const auto handle = HandleOf(item, folder);
  if (!handle) return std::nullopt;
  const Descriptor volume(open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (!volume.IsOpen()) return std::nullopt;
  const Descriptor opened = OpenByHandle(volume.Get(), *handle);
  if (!opened.IsOpen()) return std::nullopt;
  const auto path = PathOfDescriptor(opened);
  return path ? Verified(item, *path) : std::nullopt;
}

Path PlaceByPass(const ItemReference& item, const std::string& folder) {
  const auto path = SearchFolders(item, folder);
  return path ? Verified(item, *path) : std::nullopt;
}

}  // namespace

void RememberPlace(const ItemReference& item, std::string_view path) {
  PlaceMemory::OfThisProcess().Remember(item, path);
}

std::optional<std::string> FindPlace(const ItemReference& item) {
  const std::string* const remembered = PlaceMemory::OfThisProcess().Recall(item);
  if (remembered != nullptr) {
    if (auto place = Verified(item, *remembered)) return place;
  }
  const auto folder = remembered != nullptr ? NearestFolder(item, *remembered) : VolumeRoot(item);
  if (!folder) return std::nullopt;
  auto place = PlaceByHandle(item, *folder);
  if (!place) place = PlaceByPass(item, *folder);
  if (place) RememberPlace(item, *place);
  return place;
}

}  // namespace tallowmere::files
