#include "files/Catalog.h"

#include <fcntl.h>
#include <linux/openat2.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <climits>
#include <cstdlib>
#include <memory>
#include <vector>

#include "files/Descriptor.h"
#include "files/FileHandle.h"
#include "files/FileSystems.h"
#include "files/FolderIndex.h"
#include "files/NodeID.h"
#include "files/PlaceMemory.h"
#include "foundation/PathText.h"

namespace tallowmere::files {
namespace {

using Path = std::optional<std::string>;

// Links on the way followed, one in the last place not.
Path CanonicalPath(const std::string& path) {
  const std::string_view name = *foundation::LastComponent(path);
  if (name == "/" || name == "." || name == "..") return RealPath(path);
  const auto length = static_cast<std::size_t>(name.data() - path.data());
  const auto folder = RealPath(path.substr(0, length));
  if (!folder) return std::nullopt;
  return foundation::JoinPath(*folder, name);
}

// Whether a path is canonical unless there are links on its way.
bool IsSpelledOut(std::string_view path) {
  if (path == "/") return true;
  if (!path.starts_with('/')) return false;
  while (!path.empty()) {
    path.remove_prefix(1);
    const auto name = path.substr(0, path.find('/'));
    if (name.empty() || name == "." || name == "..") return false;
    path.remove_prefix(name.size());
  }
  return true;
}

constexpr std::uint64_t kForItsPathAlone = O_PATH | O_NOFOLLOW | O_CLOEXEC;

// As OpenWithoutLinks, folder by folder: an open link has nothing in it.
Descriptor OpenStepByStep(std::string_view path) {
  if (path.size() >= PATH_MAX) {
    errno = ENAMETOOLONG;
    return Descriptor();
  }
  Descriptor item(open("/", kForItsPathAlone));
  while (item.IsOpen() && path.size() > 1) {
    path.remove_prefix(1);
    const std::string name(path.substr(0, path.find('/')));
    item = Descriptor(openat(item.Get(), name.c_str(), kForItsPathAlone));
    path.remove_prefix(name.size());
  }
  return item;
}

// Not open when a link is on the way. REQUIRES: the path is spelled out.
Descriptor OpenWithoutLinks(const std::string& path) {
  open_how how{};
  how.flags = kForItsPathAlone;
  how.resolve = RESOLVE_NO_SYMLINKS;
  Descriptor item(static_cast<int>(syscall(SYS_openat2, AT_FDCWD, path.c_str(), &how, sizeof how)));
  // Before Linux 5.6 there is no such call, and some sandboxes forbid it.
  const bool isCallMissing = !item.IsOpen() && (errno == ENOSYS || errno == EPERM);
  return isCallMissing ? OpenStepByStep(path) : std::move(item);
}

// An item held while it is looked at, and the canonical path by which it was reached.
struct ReachedItem {
  std::string path;
  Descriptor descriptor;
};

std::optional<ReachedItem> Reach(const std::string& path) {
  if (IsSpelledOut(path)) {
    Descriptor descriptor = OpenWithoutLinks(path);
    if (descriptor.IsOpen()) return ReachedItem{path, std::move(descriptor)};
  }
  const Path canonical = CanonicalPath(path);
  if (!canonical) return std::nullopt;
  Descriptor descriptor = OpenWithoutLinks(*canonical);
  if (!descriptor.IsOpen()) return std::nullopt;
  return ReachedItem{*canonical, std::move(descriptor)};
}

// The canonical path if this very item is there.
Path Verified(const ItemReference& item, const std::string& path) {
  auto reached = Reach(path);
  if (!reached || !IsAt(item, reached->descriptor.Get(), "")) return std::nullopt;
  return std::move(reached->path);
}

// `volume` is as the table has it now.
bool IsOnVolume(const VolumePointer& volume, const Place& place) {
  if (volume->IsMountedAs(place.item.mount)) return true;
  const VolumePointer found = MountTable::OfThisProcess().OfItem(place.item, place.path);
  return found && found->Number() == volume->Number();
}

// The nearest folder to a former place of an item that is still there and on the volume; else the
// volume's root folder. What is on another volume, by the spelling or behind a link, is not looked
// at: that one may not answer.
std::string NearestFolder(const VolumePointer& volume, const std::string& formerPlace) {
  MountTable& table = MountTable::OfThisProcess();
  const VolumePointer former = table.OfPath(formerPlace);
  const bool isNear = former && former->Number() == volume->Number() && IsSpelledOut(formerPlace);
  for (std::string path = formerPlace; isNear && path != "/";) {
    path = foundation::FolderOf(path);
    if (!table.IsReachable(*former, path)) continue;
    const Descriptor descriptor = OpenWithoutLinks(path);
    const auto folder = descriptor.IsOpen() ? ReadStatus(descriptor.Get(), "") : std::nullopt;
    const bool isFolder = folder && S_ISDIR(folder->item.type);
    if (isFolder && IsOnVolume(volume, {path, folder->item})) return path;
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

// What a file system said about a handle.
struct HandleAnswer {
  Path path;            // not verified
  bool isGone = false;  // the item is, for certain
};

// For a process with the privilege. One that has it only in a user namespace is refused what is not
// below the mount that it asks through, so that a refusal says nothing of a volume's other mounts.
HandleAnswer AskByHandle(const Volume& volume, const FileHandle& handle, bool findsAll) {
  const Descriptor root(open(volume.MountPoint().c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (!root.IsOpen()) return {};
  const Descriptor opened = OpenByHandle(root.Get(), handle);
  if (opened.IsOpen()) return {PathOfDescriptor(opened), false};
  return {std::nullopt, findsAll && errno == ESTALE && volume.MountPoints().size() == 1};
}

HandleAnswer AskByInode(const Volume& volume, std::uint64_t inode) {
  const FileHandle rootHandle = ReadHandle(AT_FDCWD, volume.MountPoint().c_str());
  const auto handle = HandleOfInode(rootHandle, volume.Root()->inode, inode);
  return handle ? AskByHandle(volume, *handle, FindsAllByInode(volume.Type())) : HandleAnswer{};
}

// What passes over volumes have learned. Indexes of volumes that are gone go with the next new one.
FolderIndex& IndexOf(const VolumePointer& volume) {
  static std::vector<FolderIndex> indexes;
  for (FolderIndex& index : indexes) {
    const VolumePointer& known = index.OfVolume();
    if (known->Number() != volume->Number() || !AreEqual(*known->Root(), *volume->Root())) continue;
    // What was learned hangs on the places where the volume was mounted, and on what was hidden.
    const bool isSeenAlike =
        known->MountPoints() == volume->MountPoints() && known->Covers() == volume->Covers();
    if (!isSeenAlike) index = FolderIndex(volume);
    return index;
  }
  std::erase_if(indexes, [](const FolderIndex& index) {
    return !MountTable::OfThisProcess().WithNumber(index.OfVolume()->Number());
  });
  return indexes.emplace_back(volume);
}

// How often what a pass has found may be gone, or elsewhere, when it is looked at again.
constexpr int kMostPasses = 3;

// What `check` makes of the path to an item that a pass finds; none when it finds none. The folders
// near a former place, of this item or another, are looked through first.
template <class Check>
auto FindByPass(const VolumePointer& volume, const SearchedItem& item, const std::string& near,
                const Check& check) -> decltype(check(near)) {
  for (int pass = 0; pass < kMostPasses; ++pass) {
    const Path path = IndexOf(volume).Find(item, NearestFolder(volume, near));
    if (!path) return std::nullopt;
    if (auto found = check(*path)) return found;
  }
  return std::nullopt;
}

// A volume and its root folder, where they are now.
struct SettledVolume {
  VolumePointer volume;
  Place root;
};

// The kernel does not signal that a folder above a mount point was renamed, which can have left a
// link.
std::optional<SettledVolume> Settle(const VolumePointer& volume) {
  MountTable& table = MountTable::OfThisProcess();
  for (VolumePointer current = volume; current;) {
    const Descriptor held = OpenWithoutLinks(current->MountPoint());
    const auto root = held.IsOpen() ? ReadStatus(held.Get(), "") : std::nullopt;
    const bool isThere = root && current->Root() && AreEqual(root->item, *current->Root());
    Place place{current->MountPoint(), isThere ? root->item : ItemReference{}};
    if (isThere && IsOnVolume(volume, place)) {
      return SettledVolume{std::move(current), std::move(place)};
    }
    if (current != volume) break;
    table.Distrust();
    current = table.WithNumber(volume->Number());
  }
  return std::nullopt;
}

// The place if its item is the one with the id.
std::optional<Place> WithID(const VolumePointer& volume, std::uint32_t id, bool folder,
                            std::optional<Place> place) {
  if (!place || NodeIDOf(place->item, *volume->Root()) != id) return std::nullopt;
  if (folder && !S_ISDIR(place->item.type)) return std::nullopt;
  if (!IsOnVolume(volume, *place)) return std::nullopt;
  return place;
}

// What is now where an item was last seen.
std::optional<Place> AtPlaceOf(const ItemReference& item) {
  const std::string* const path = PlaceMemory::OfThisProcess().Recall(item);
  auto place = path != nullptr ? PlaceAt(*path) : std::nullopt;
  if (place && AreEqual(place->item, item)) RememberPlace(*place);
  return place;
}

// An item that can be told by its inode number, as far as that tells it.
ItemReference ItemWithID(const Volume& volume, std::uint32_t id) {
  ItemReference item{};
  item.device = volume.Root()->device;
  item.inode = id;
  return item;
}

// An item that can be told by its inode number is remembered by it.
std::optional<Place> AtRememberedPlace(const VolumePointer& volume, std::uint32_t id) {
  if (!volume->Root() || !IsInodeNumber(id)) return std::nullopt;
  return WithID(volume, id, false, AtPlaceOf(ItemWithID(*volume, id)));
}

// Whether both are one item on one mount; errno tells ENOENT when not.
bool IsSame(const ItemReference& first, const ItemReference& second) {
  if (AreEqual(first, second) && first.mount == second.mount) return true;
  errno = ENOENT;
  return false;
}

// None, and errno tells, when it is not open or no folder.
std::optional<OpenFolder> AsFolder(const std::string& path, Descriptor descriptor) {
  const auto status = descriptor.IsOpen() ? ReadStatus(descriptor.Get(), "") : std::nullopt;
  if (!status) return std::nullopt;
  if (!S_ISDIR(status->item.type)) {
    errno = ENOTDIR;
    return std::nullopt;
  }
  return OpenFolder{{path, status->item},
                    std::make_shared<const Descriptor>(std::move(descriptor))};
}

// The folder at the end of a path, links followed. No automounter is asked at its end.
std::optional<OpenFolder> Follow(const Spot& end, const std::string& path) {
  return AsFolder(path, Descriptor(openat(end.folder, end.name, O_PATH | O_CLOEXEC)));
}

std::optional<OpenFolder> Follow(const std::string& path) {
  return Follow({AT_FDCWD, path.c_str()}, path);
}

// A folder that was found by following an absolute path, at its canonical path. A path that leads
// through a link of /proc can spell another folder than the one it is in.
std::optional<OpenFolder> AtRealPath(const OpenFolder& found, const std::string& path) {
  const auto real = RealPath(path);
  auto folder = real ? OpenFolderAt(*real) : std::nullopt;
  if (folder && !IsSame(folder->place.item, found.place.item)) return std::nullopt;
  return folder;
}

}  // namespace

void RememberPlace(const Place& place) {
  PlaceMemory::OfThisProcess().Remember(place.item, place.path);
}

std::optional<Place> PlaceAt(const std::string& path) {
  auto reached = Reach(path);
  const auto status = reached ? ReadStatus(reached->descriptor.Get(), "") : std::nullopt;
  if (!status) return std::nullopt;
  return Place{std::move(reached->path), status->item};
}

bool Holds(const OpenFolder& folder, const ItemReference& item, std::string_view name) {
  return IsAt(item, folder.descriptor->Get(), std::string(name).c_str());
}

std::optional<OpenFolder> Open(const Place& folder) {
  auto found = Follow(folder.path);
  if (!found || !IsSame(found->place.item, folder.item)) return std::nullopt;
  return found;
}

std::optional<OpenFolder> OpenFolderAt(const std::string& path) {
  if (IsSpelledOut(path)) return AsFolder(path, OpenWithoutLinks(path));
  errno = ELOOP;
  return std::nullopt;
}

std::optional<OpenFolder> OpenHolderOf(const std::string& path) {
  const std::string folder = foundation::FolderOf(path);
  auto found = OpenFolderAt(folder);
  if (!found && (errno == ELOOP || errno == ENOTDIR)) {
    const auto followed = Follow(folder);
    if (followed) found = AtRealPath(*followed, folder);
  }
  if (found) RememberPlace(found->place);
  return found;
}

Spot SpotOf(const Place& item, const OpenFolder& folder) {
  const std::string_view name = *foundation::LastComponent(item.path);
  std::string_view holder(item.path.data(), item.path.size() - name.size());
  if (holder != "/") holder.remove_suffix(1);
  const bool isInFolder = holder == folder.place.path;
  return isInFolder ? Spot{folder.descriptor->Get(), name.data()}
                    : Spot{AT_FDCWD, item.path.c_str()};
}

std::optional<OpenFolder> OpenBehindLink(const Spot& link, const std::string& path) {
  const auto found = Follow(link, path);
  return found ? AtRealPath(*found, path) : std::nullopt;
}

std::optional<std::string> RealPath(const std::string& path) {
  struct Free {
    void operator()(char* text) const { std::free(text); }
  };
  const std::unique_ptr<char, Free> real(realpath(path.c_str(), nullptr));
  if (!real) return std::nullopt;
  return std::string(real.get());
}

// Where the kernel does not tell the mount, only the canonical path tells the volume.
std::optional<std::string> LastPathOf(const ItemReference& item) {
  const std::string* const path = PlaceMemory::OfThisProcess().Recall(item);
  const bool isGoodEnough = path != nullptr && item.mount != kNoMount && IsSpelledOut(*path);
  if (!isGoodEnough) return std::nullopt;
  return *path;
}

std::optional<std::string> LastPathOf(const Volume& volume, std::uint32_t id) {
  if (!volume.Root() || !IsInodeNumber(id)) return std::nullopt;
  ItemReference item = ItemWithID(volume, id);
  item.mount = volume.Root()->mount;
  return LastPathOf(item);
}

std::optional<std::string> FindCanonicalPath(const ItemReference& item) {
  const std::string* const known = PlaceMemory::OfThisProcess().Recall(item);
  const std::string former = known == nullptr ? "" : *known;
  Path place = former.empty() ? std::nullopt : Verified(item, former);
  if (!place) {
    const auto volume = MountTable::OfThisProcess().OfItem(item, former);
    const auto settled = volume ? Settle(volume) : std::nullopt;
    if (!settled) return std::nullopt;
    const Volume& current = *settled->volume;
    const HandleAnswer answer =
        HasHandle(item) ? AskByHandle(current, item.handle, FindsAllByHandle(current.Type()))
                        : AskByInode(current, item.inode);
    if (answer.isGone) return std::nullopt;
    place = answer.path ? Verified(item, *answer.path) : std::nullopt;
    if (!place) {
      const SearchedItem wanted{NodeIDOf(item, *current.Root()), &item, S_ISDIR(item.type)};
      place = FindByPass(settled->volume, wanted, former,
                         [&](const std::string& path) { return Verified(item, path); });
    }
  }
  if (place) RememberPlace({*place, item});
  return place;
}

std::optional<Place> FindItemAtOnce(const VolumePointer& volume, std::uint32_t id) {
  auto place = AtRememberedPlace(volume, id);
  if (place || !volume->Root() || !IsInodeNumber(id)) return place;
  const Path path = AskByInode(*volume, id).path;
  if (path) place = WithID(volume, id, false, PlaceAt(*path));
  if (place) RememberPlace(*place);
  return place;
}

std::optional<Place> FindItem(const VolumePointer& volume, std::uint32_t id, bool folder) {
  if (!CanBeNodeID(id)) return std::nullopt;
  auto place = AtRememberedPlace(volume, id);
  if (place) return folder && !S_ISDIR(place->item.type) ? std::nullopt : place;
  const auto settled = Settle(volume);
  if (!settled) return std::nullopt;
  if (id == kRootFolderID) return settled->root;

  const HandleAnswer answer = IsInodeNumber(id) ? AskByInode(*settled->volume, id) : HandleAnswer{};
  if (answer.isGone) return std::nullopt;
  if (answer.path) place = WithID(settled->volume, id, false, PlaceAt(*answer.path));
  // Nothing but this item can have the id.
  if (place && folder && !S_ISDIR(place->item.type)) return std::nullopt;
  if (!place) {
    const std::string latest(PlaceMemory::OfThisProcess().Latest());
    place =
        FindByPass(settled->volume, {id, nullptr, folder}, latest, [&](const std::string& path) {
          return WithID(settled->volume, id, folder, PlaceAt(path));
        });
  }
  if (place) RememberPlace(*place);
  return place;
}

std::optional<OpenFolder> OpenWithID(const VolumePointer& volume, std::uint32_t id) {
  const auto last = LastPathOf(*volume, id);
  auto found = last ? OpenFolderAt(*last) : std::nullopt;
  if (found && WithID(volume, id, true, found->place)) return found;
  const auto place = FindItem(volume, id, true);
  return place ? Open(*place) : std::nullopt;
}

}  // namespace tallowmere::files
