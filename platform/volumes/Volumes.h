// Which volumes are there: one state of the table of mounts, and the table that gives the next.
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

// The volumes as one reading of the table listed them. Immutable; it stays valid for whoever holds
// it, though what it says gets old.
class Volumes {
 public:
  // `volumes` in their order, "/" first, never none; by the number of each mount the volume that it
  // belongs to; the mount points of every line of the table.
  Volumes(std::vector<ListedVolumePointer> volumes,
          std::unordered_map<int, ListedVolumePointer> byMount,
          std::unordered_set<std::string> mountPoints);

  const std::vector<ListedVolumePointer>& InOrder() const { return mVolumes; }

  // 0 is the volume of "/". Null when none has the number.
  ListedVolumePointer WithNumber(VolumeNumber number) const;

  // The first volume with a name in HFS form; kNoVolume when none has it.
  kernel::Result<ListedVolumePointer> WithName(std::string_view name) const;

  // The volume with a mount; null for a mount of a kernel interface and for an unknown one.
  ListedVolumePointer WithMount(int mount) const;

  // The volume that an item is on: by the mount that the kernel reports for it, where it reports
  // none by the device, else by the mount point that `path` begins with. Null for an item of a
  // kernel interface. REQUIRES: `path` is the item's canonical path, or the mount is told.
  ListedVolumePointer OfItem(const kernel::Item& item, std::string_view path) const;

  // The volume at or below whose MountPoint() a path lies by its spelling; of several the one with
  // the longest.
  ListedVolumePointer OfPath(std::string_view path) const;

  // Whether something, a volume or not, is mounted at a path, or at a name in the folder with that
  // path.
  bool IsMountPoint(const std::string& path) const { return mMountPoints.contains(path); }
  bool HoldsMountPoint(const std::string& path) const { return mHolders.contains(path); }

  // Whether the nearest mount above a path, or at it, is not another volume's, for which one could
  // wait: by the spelling. REQUIRES: one place of the volume is above the path.
  bool IsReachable(const ListedVolume& volume, std::string path) const;

 private:
  std::vector<ListedVolumePointer> mVolumes;
  std::unordered_map<int, ListedVolumePointer> mByMount;
  std::unordered_map<VolumeNumber, ListedVolumePointer> mByNumber;
  std::unordered_set<std::string> mMountPoints;
  std::unordered_set<std::string> mHolders;
};

using VolumesPointer = std::shared_ptr<const Volumes>;

// The table of a process. One thread at a time. It is read when a question first needs it, and
// again only when the kernel has signalled a change. It belongs to the mount namespace in which it
// was first read, and a forked child that goes on using it shares the kernel's signal with its
// parent.
class VolumeTable {
 public:
  // `readRoot` tells the mount at the process's root.
  explicit VolumeTable(kernel::MountTableFile file = kernel::MountTableFile(),
                       kernel::RootMount (*readRoot)() = kernel::ReadRootMount);

  // The volumes now. One system call unless something was mounted or unmounted.
  const VolumesPointer& Now();

  // The volumes as last read, without a question to the kernel; null before the first.
  const VolumesPointer& AsLastRead() const { return mVolumes; }

  // Makes the next question read the table whatever the kernel has signalled: a place was found not
  // to be where the table says, and the kernel does not signal that a mount point was renamed.
  void Invalidate() { mIsCurrent = false; }

 private:
  void Read();
  VolumesPointer VolumesOf(const std::vector<Mount>& mounts, int rootID);
  ListedVolumePointer ListVolume(const std::vector<Mount>& mounts,
                                 const std::vector<std::size_t>& indexes, const MountTree& tree,
                                 const std::multimap<int, std::string>& byParent);
  std::optional<VolumeNumber> NumberOf(int mountID);

  kernel::MountTableFile mFile;
  kernel::RootMount (*mReadRoot)();
  VolumesPointer mVolumes;
  bool mIsCurrent = false;            // unless the kernel has signalled a change since
  std::unordered_set<int> mMountIDs;  // of the last reading
  // Where minus the mount id does not fit 16 bits: the numbers by mount id, and which are taken so.
  std::map<int, VolumeNumber> mAssignedNumbers;
  std::unordered_set<int> mTakenNumbers;
};

}  // namespace tallowmere::volumes
