// The mounted volumes: one state of the mount table, and the table that returns the current one.
#pragma once

#include <cstddef>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <unordered_map>
#include <unordered_set>
#include <vector>

#include "kernel/MountTableFile.h"
#include "volumes/MountTree.h"
#include "volumes/Volume.h"

namespace tallowmere::volumes {

// The volumes of one reading of the table. Immutable; it stays valid for whoever holds it, but may
// become outdated.
class Volumes {
 public:
  // `volumes` in their order, "/" first, never empty; the volume of each mount, by mount id; the
  // mount points of every line of the table.
  Volumes(std::vector<ListedVolumePointer> volumes,
          std::unordered_map<int, ListedVolumePointer> byMount,
          std::unordered_set<std::string> mountPoints);

  const std::vector<ListedVolumePointer>& InOrder() const { return mVolumes; }

  // The volume with a number; 0 is the volume of "/". Null when none has the number.
  ListedVolumePointer WithNumber(VolumeNumber number) const;

  // The first volume with a name in HFS form. Returns kNoVolume when none has it.
  kernel::Result<ListedVolumePointer> WithName(std::string_view name) const;

  // The volume of a mount. Null for a mount of a kernel interface and for an unknown one.
  ListedVolumePointer WithMount(int mount) const;

  // The volume that an item is on. Goes by the mount that the kernel reports for the item; without
  // one, by the device, then by the mount point that `path` begins with. Null for an item of a
  // kernel interface. REQUIRES: `path` is the item's canonical path, or its mount is known.
  ListedVolumePointer OfItem(const kernel::Item& item, std::string_view path) const;

  // The volume whose MountPoint() contains a path, judged by spelling alone; of several, the one
  // with the longest.
  ListedVolumePointer OfPath(std::string_view path) const;

  // Whether anything, a volume or not, is mounted at a path, or at a name in the folder with that
  // path.
  bool IsMountPoint(const std::string& path) const { return mMountPoints.contains(path); }
  bool HoldsMountPoint(const std::string& path) const { return mHolders.contains(path); }

  // Whether the nearest mount at or above a path is the volume's own, so that no other volume can
  // make a look at it wait; judged by spelling alone. REQUIRES: a place of the volume is above the
  // path.
  bool IsReachable(const ListedVolume& volume, std::string path) const;

 private:
  std::vector<ListedVolumePointer> mVolumes;
  std::unordered_map<int, ListedVolumePointer> mByMount;
  std::unordered_map<VolumeNumber, ListedVolumePointer> mByNumber;
  std::unordered_set<std::string> mMountPoints;
  std::unordered_set<std::string> mHolders;
};

using VolumesPointer = std::shared_ptr<const Volumes>;

// The mount table of a process. One thread at a time. It is first read when needed, and again only
// when the kernel has signalled a change. It belongs to the mount namespace in which it was first
// read; a forked child that keeps using it shares the kernel's signal with its parent.
class VolumeTable {
 public:
  // `readRoot` returns the mount that contains the process's root.
  explicit VolumeTable(kernel::MountTableFile file = kernel::MountTableFile(),
                       kernel::RootMount (*readRoot)() = kernel::ReadRootMount);

  // The current volumes. One system call unless something was mounted or unmounted.
  const VolumesPointer& Now();

  // The volumes as last read, without asking the kernel; null before the first reading.
  const VolumesPointer& AsLastRead() const { return mVolumes; }

  // Makes the next query read the table whatever the kernel has signalled. For a place that is not
  // where the table says: the kernel does not signal the renaming of a mount point.
  void Invalidate() { mIsCurrent = false; }

 private:
  // Views of the table's mounts.
  using MountPointsByParent = std::multimap<int, std::string_view>;

  void Read();
  VolumesPointer VolumesOf(const std::vector<Mount>& mounts, int rootID);
  ListedVolumePointer ListVolume(const std::vector<Mount>& mounts,
                                 const std::vector<std::size_t>& indexes, const MountTree& tree,
                                 const MountPointsByParent& byParent);
  std::optional<VolumeNumber> NumberOf(int mountID);

  kernel::MountTableFile mFile;
  kernel::RootMount (*mReadRoot)();
  VolumesPointer mVolumes;
  bool mIsCurrent = false;            // unless the kernel has signalled a change since
  std::unordered_set<int> mMountIDs;  // of the last reading
  // For mount ids whose negative does not fit into 16 bits: their numbers, and which are taken.
  std::map<int, VolumeNumber> mAssignedNumbers;
  std::unordered_set<int> mTakenNumbers;
};

}  // namespace tallowmere::volumes
