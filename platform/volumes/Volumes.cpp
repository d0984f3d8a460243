#include "volumes/Volumes.h"

#include <algorithm>
#include <limits>
#include <utility>

#include "foundation/PathText.h"

namespace tallowmere::volumes {
namespace {

constexpr VolumeNumber kLowestNumber = std::numeric_limits<VolumeNumber>::min();

// How often a table that changes while it is being read is read again before it is used as it is.
// The next query finds the change signalled.
constexpr int kReadAttempts = 8;

bool HasMount(const std::vector<Mount>& mounts, int id) {
  return std::any_of(mounts.begin(), mounts.end(),
                     [id](const Mount& mount) { return mount.id == id; });
}

// The lowest mount of the stack at "/" in the table, for kernels that report no mount ids.
std::optional<int> LowestRoot(const std::vector<Mount>& mounts) {
  for (const Mount& mount : mounts) {
    const bool isLowest = mount.parent == mount.id || !HasMount(mounts, mount.parent);
    if (mount.mountPoint == "/" && isLowest) return mount.id;
  }
  return std::nullopt;
}

// The id of the mount that contains the process's root. Adds that mount where it is missing: there
// may be no table, "/" may be a folder inside a mount (chroot), or the kernel may report no ids.
int FindRoot(std::vector<Mount>& mounts, const kernel::RootMount& root) {
  if (HasMount(mounts, root.id)) return root.id;
  const auto lowest = root.id == 0 ? LowestRoot(mounts) : std::nullopt;
  if (lowest) return *lowest;
  mounts.insert(mounts.begin(), Mount{root.id, 0, root.device, "", "/", ""});
  return root.id;
}

template <class Map>
ListedVolumePointer ValueOf(const Map& volumes, const typename Map::key_type& key) {
  const auto found = volumes.find(key);
  return found == volumes.end() ? nullptr : found->second;
}

}  // namespace

Volumes::Volumes(std::vector<ListedVolumePointer> volumes,
                 std::unordered_map<int, ListedVolumePointer> byMount,
                 std::unordered_set<std::string> mountPoints)
    : mVolumes(std::move(volumes)),
      mByMount(std::move(byMount)),
      mMountPoints(std::move(mountPoints)) {
  for (const auto& volume : mVolumes) mByNumber[volume->Number()] = volume;
  for (const std::string& path : mMountPoints) mHolders.insert(foundation::FolderOf(path));
}

ListedVolumePointer Volumes::WithNumber(VolumeNumber number) const {
  return number == 0 ? mVolumes.front() : ValueOf(mByNumber, number);
}

kernel::Result<ListedVolumePointer> Volumes::WithName(std::string_view name) const {
  for (const auto& volume : mVolumes) {
    const auto own = volume->Name();
    if (!own) return own.Error();
    if (*own == name) return volume;
  }
  return kernel::kNoVolume;
}

ListedVolumePointer Volumes::WithMount(int mount) const {
  return ValueOf(mByMount, mount);
}

ListedVolumePointer Volumes::OfItem(const kernel::Item& item, std::string_view path) const {
  if (item.mount != kernel::kNoMount) return WithMount(item.mount);
  const auto found = std::find_if(mVolumes.begin(), mVolumes.end(), [&item](const auto& volume) {
    const auto entered = volume->Enter();
    return entered && (*entered)->Root().device == item.device;
  });
  return found != mVolumes.end() ? *found : OfPath(path);
}

ListedVolumePointer Volumes::OfPath(std::string_view path) const {
  ListedVolumePointer longest;
  for (const auto& volume : mVolumes) {
    if (!foundation::IsWithin(path, volume->MountPoint())) continue;
    if (!longest || volume->MountPoint().size() > longest->MountPoint().size()) longest = volume;
  }
  return longest;
}

bool Volumes::IsReachable(const ListedVolume& volume, std::string path) const {
  const auto& own = volume.MountPoints();
  for (; path.size() > 1; path.resize(path.rfind('/'))) {
    if (IsMountPoint(path)) return std::find(own.begin(), own.end(), path) != own.end();
  }
  return true;
}

VolumeTable::VolumeTable(kernel::MountTableFile file, kernel::RootMount (*readRoot)())
    : mFile(std::move(file)), mReadRoot(readRoot) {}

const VolumesPointer& VolumeTable::Now() {
  if (!mIsCurrent || mFile.HasChanged()) Read();
  return mVolumes;
}

void VolumeTable::Read() {
  mIsCurrent = false;
  std::vector<Mount> mounts;
  bool isWhole = false;
  for (int attempt = 0; attempt < kReadAttempts && !isWhole; ++attempt) {
    const auto text = mFile.Read();
    if (!text) break;
    mounts = ParseMountInfo(*text);
    // A mount made between two pieces of the text has been signalled by now, and is signalled only
    // once.
    isWhole = !mFile.HasChanged();
  }
  const int rootID = FindRoot(mounts, mReadRoot());
  mVolumes = VolumesOf(mounts, rootID);
  mIsCurrent = isWhole;
}

VolumesPointer VolumeTable::VolumesOf(const std::vector<Mount>& mounts, int rootID) {
  MountPointsByParent byParent;
  std::unordered_set<std::string> mountPoints;
  mMountIDs.clear();
  for (const Mount& mount : mounts) {
    byParent.emplace(mount.parent, mount.mountPoint);
    mountPoints.insert(mount.mountPoint);
    mMountIDs.insert(mount.id);
  }
  MountTree tree(mounts, rootID);
  const auto isFolder = [](const Mount& mount) {
    return kernel::IsFolderByMemory(mount.mountPoint);
  };
  std::vector<ListedVolumePointer> volumes;
  std::unordered_map<int, ListedVolumePointer> byMount;
  for (const auto& indexes : tree.GroupIntoVolumes(isFolder)) {
    auto volume = ListVolume(mounts, indexes, tree, byParent);
    if (!volume) continue;
    for (const std::size_t index : indexes) byMount[mounts[index].id] = volume;
    volumes.push_back(std::move(volume));
  }
  return std::make_shared<const Volumes>(std::move(volumes), std::move(byMount),
                                         std::move(mountPoints));
}

// Null when every number is taken.
ListedVolumePointer VolumeTable::ListVolume(const std::vector<Mount>& mounts,
                                            const std::vector<std::size_t>& indexes,
                                            const MountTree& tree,
                                            const MountPointsByParent& byParent) {
  const auto number = NumberOf(mounts[indexes.front()].id);
  if (!number) return nullptr;
  std::vector<ListedVolume::Place> places;
  std::vector<std::string> covers;
  for (const std::size_t index : indexes) {
    places.push_back({mounts[index], tree.MayBeFile(index)});
    const auto [begin, end] = byParent.equal_range(mounts[index].id);
    for (auto cover = begin; cover != end; ++cover) covers.emplace_back(cover->second);
  }
  return std::make_shared<const ListedVolume>(*number, std::move(places), std::move(covers));
}

// Nullopt when every number is taken.
std::optional<VolumeNumber> VolumeTable::NumberOf(int mountID) {
  const auto assigned = mAssignedNumbers.find(mountID);
  if (assigned != mAssignedNumbers.end()) return assigned->second;
  if (mountID > 0 && -mountID >= kLowestNumber && !mTakenNumbers.contains(-mountID)) {
    return static_cast<VolumeNumber>(-mountID);
  }
  for (int number = kLowestNumber; number < 0; ++number) {
    if (mTakenNumbers.contains(number) || mMountIDs.contains(-number)) continue;
    mTakenNumbers.insert(number);
    mAssignedNumbers[mountID] = static_cast<VolumeNumber>(number);
    return static_cast<VolumeNumber>(number);
  }
  return std::nullopt;
}

}  // namespace tallowmere::volumes
