#include "files/Catalog.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <climits>
#include <cstdlib>
#include <memory>
#include <vector>

#include "files/Descriptor.h"
#include "files/FileHandle.h"
#include "files/FolderIndex.h"
#include "files/NodeID.h"
#include "files/PlaceMemory.h"
#include "foundation/PathText.h"

namespace tallowmere::files {
namespace {

using Path = std::optional<std::string>;

// Links on the way followed, one in the last place not.
Path CanonicalPath(const std::string& path) {
  const std::string name(*foundation::LastComponent(path));
  if (name == "/" || name == "." || name == "..") return RealPath(path);
  const auto folder = RealPath(foundation::ParentPath(path));
  if (!folder) return std::nullopt;
  return foundation::JoinPath(*folder, name);
}

// The canonical path if the item is there. A path that was canonical when it was remembered is used
// as it is: wherever its folders are by now, it still leads to this very item.
Path Verified(const ItemReference& item, const std::string& path, bool isCanonical) {
  auto canonical = isCanonical ? Path(path) : CanonicalPath(path);
  if (!canonical || !IsAt(item, AT_FDCWD, canonical->c_str())) return std::nullopt;
  return canonical;
}

VolumePointer VolumeOf(const Place& place) {
  return MountTable::OfThisProcess().OfItem(place.item, place.path);
}

bool IsOnVolume(const VolumePointer& volume, const Place& place) {
  const VolumePointer found = VolumeOf(place);
  return found && found->Number() == volume->Number();
}

// The item at a path that is taken for canonical, if there is one.
std::optional<Place> PlaceAt(std::string path) {
  const auto status = ReadStatus(AT_FDCWD, path.c_str());
  if (!status) return std::nullopt;
  return Place{std::move(path), status->item};
}

// The nearest folder to a former place of an item that is still there and on the volume; else the
// volume's root folder. What seems to be on another volume is not looked at: that one may not
// answer.
std::string NearestFolder(const VolumePointer& volume, const std::string& formerPlace) {
  const VolumePointer former = MountTable::OfThisProcess().OfPath(formerPlace);
  if (!former || former->Number() != volume->Number()) return volume->MountPoint();
  for (std::string path = formerPlace; !path.empty() && path != "/";) {
    path = FolderOf(path);
    // Above a component "." or ".." the spelling leads nowhere.
    const auto name = *foundation::LastComponent(path);
    if (name == "." || name == "..") break;
    const auto real = RealPath(path);
    const auto place = real ? PlaceAt(*real) : std::nullopt;
    if (place && IsOnVolume(volume, *place)) return *real;
  }
  return volume->MountPoint();
}

// The path at which the kernel shows an open item.
Path PathOfDescriptor(const Descriptor& descriptor) {
  const std::string link = "/proc/self/fd/" + std::to_string(descriptor.Get());
  std::array<char, PATH_MAX> text{};
  const ssize_t length = readlink(link.c_str(), text.data(), text.size());
  if (length <= 0 || text[0] != '/') return std::nullopt;
  return std::string(text.data(), static_cast<std::size_t>(length));
}

std::optional<FileHandle> HandleOf(const Volume& volume, std::uint64_t inode) {
  const auto root = volume.Root();
  return HandleOfInode(ReadHandle(AT_FDCWD, volume.MountPoint().c_str()), root->inode, inode);
}

// For a process with the privilege. The path is not verified.
Path PathByHandle(const Volume& volume, const std::optional<FileHandle>& handle) {
  if (!handle) return std::nullopt;
  const Descriptor root(open(volume.MountPoint().c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (!root.IsOpen()) return std::nullopt;
  const Descriptor opened = OpenByHandle(root.Get(), *handle);
  return opened.IsOpen() ? PathOfDescriptor(opened) : std::nullopt;
}

// What passes over volumes have learned. Indexes of volumes that are gone go with the next new one.
FolderIndex& IndexOf(const VolumePointer& volume) {
  static std::vector<FolderIndex> indexes;
  for (FolderIndex& index : indexes) {
    const VolumePointer& known = index.OfVolume();
    if (known->Number() != volume->Number() || !AreEqual(*known->Root(), *volume->Root())) continue;
    // What was learned hangs on the places where the volume was mounted.
    if (known->MountPoints() != volume->MountPoints()) index = FolderIndex(volume);
    return index;
  }
  std::erase_if(indexes, [](const FolderIndex& index) {
    return !MountTable::OfThisProcess().WithNumber(index.OfVolume()->Number());
  });
  return indexes.emplace_back(volume);
}

// The root folder where it is now. The kernel does not signal that a folder above it was renamed.
std::optional<Place> RootOf(const VolumePointer& volume) {
  for (VolumePointer current = volume; current;) {
    auto place = PlaceAt(current->MountPoint());
    if (place && AreEqual(place->item, *volume->Root()) && IsOnVolume(volume, *place)) return place;
    if (current != volume) break;
    MountTable::OfThisProcess().Distrust();
    current = MountTable::OfThisProcess().WithNumber(volume->Number());
  }
  return std::nullopt;
}

// The item at the path if it is the one with the id.
std::optional<Place> WithID(const VolumePointer& volume, std::uint32_t id, bool folder,
                            const Path& path) {
  auto place = path ? PlaceAt(*path) : std::nullopt;
  if (!place || NodeIDOf(place->item, *volume->Root()) != id) return std::nullopt;
  if (folder && !S_ISDIR(place->item.type)) return std::nullopt;
  if (!IsOnVolume(volume, *place)) return std::nullopt;
  return place;
}

// An item that can be told by its inode number is remembered by it.
Path RememberedPath(const Volume& volume, std::uint32_t id) {
  ItemReference item{};
  item.device = volume.Root()->device;
  item.inode = id;
  const auto* const remembered = PlaceMemory::OfThisProcess().Recall(item);
  if (remembered == nullptr) return std::nullopt;
  return remembered->canonical ? Path(remembered->path) : CanonicalPath(remembered->path);
}

}  // namespace

void RememberPlace(const ItemReference& item, std::string_view path) {
  PlaceMemory::OfThisProcess().Remember(item, path, false);
}

void RememberPlace(const Place& place) {
  PlaceMemory::OfThisProcess().Remember(place.item, place.path, true);
}

std::optional<std::string> RealPath(const std::string& path) {
  struct Free {
    void operator()(char* text) const { std::free(text); }
  };
  const std::unique_ptr<char, Free> real(realpath(path.c_str(), nullptr));
  if (!real) return std::nullopt;
  return std::string(real.get());
}

std::string FolderOf(const std::string& path) {
  return foundation::WithFolderMark(foundation::ParentPath(path), false);
}

std::optional<std::string> FindPlace(const ItemReference& item) {
  const auto* const remembered = PlaceMemory::OfThisProcess().Recall(item);
  const std::string former = remembered == nullptr ? "" : remembered->path;
  if (remembered != nullptr) {
    const bool wasCanonical = remembered->canonical;
    if (auto place = Verified(item, former, wasCanonical)) {
      if (!wasCanonical) RememberPlace({*place, item});
      return place;
    }
  }
  const auto volume = MountTable::OfThisProcess().OfItem(item, former);
  if (!volume || !volume->Root()) return std::nullopt;

  Path path =
      PathByHandle(*volume, item.handle.size != 0 ? item.handle : HandleOf(*volume, item.inode));
  auto place = path ? Verified(item, *path, false) : std::nullopt;
  if (!place) {
    const SearchedItem wanted{NodeIDOf(item, *volume->Root()), &item, S_ISDIR(item.type)};
    path = IndexOf(volume).Find(wanted, NearestFolder(volume, former));
    place = path ? Verified(item, *path, false) : std::nullopt;
  }
  if (place) RememberPlace({*place, item});
  return place;
}

std::optional<Place> FindItemAtOnce(const VolumePointer& volume, std::uint32_t id, bool folder) {
  if (!volume->Root() || !IsInodeNumber(id)) return std::nullopt;
  auto place = WithID(volume, id, folder, RememberedPath(*volume, id));
  if (place) return place;
  place = WithID(volume, id, folder, PathByHandle(*volume, HandleOf(*volume, id)));
  if (place) RememberPlace(*place);
  return place;
}

std::optional<Place> FindItem(const VolumePointer& volume, std::uint32_t id, bool folder) {
  if (!CanBeNodeID(id) || !volume->Root()) return std::nullopt;
  if (id == kRootFolderID) return RootOf(volume);

  auto place = FindItemAtOnce(volume, id, folder);
  if (place) return place;
  const std::string latest(PlaceMemory::OfThisProcess().Latest());
  const std::string start = NearestFolder(volume, latest);
  place = WithID(volume, id, folder, IndexOf(volume).Find({id, nullptr, folder}, start));
  if (place) RememberPlace(*place);
  return place;
}

}  // namespace tallowmere::files
