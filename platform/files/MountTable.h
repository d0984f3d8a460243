// Which volumes are there: the mounted file systems of this process, each with the number and the
// name by which the File Manager knows it.
//
// One thread at a time. The table is read when a question first needs it, and again only when the
// kernel has signalled a change. It belongs to the mount namespace in which it was first read, and
// a forked child that goes on using it shares the kernel's signal with its parent.
#pragma once

#include <sys/types.h>

#include <cstddef>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <unordered_map>
#include <unordered_set>
#include <vector>

#include "files/Descriptor.h"
#include "files/ItemReference.h"
#include "files/MountInfo.h"

namespace tallowmere::files {

using VolumeNumber = short;

class Volume {
 public:
  // `mounts` are the reachable mounts of one file system, the volume's place first; `covers` are
  // the mount points of what is mounted on those.
  Volume(VolumeNumber number, std::vector<Mount> mounts, std::vector<std::string> covers);

  // Below 0, unique while mounted, the same in every process: minus the mount id of its place.
  VolumeNumber Number() const { return mNumber; }

  // Where its root folder is, as this process sees it.
  const std::string& MountPoint() const { return mMounts.front().mountPoint; }

  // Everywhere that the volume is mounted; MountPoint() is the first.
  const std::vector<std::string>& MountPoints() const { return mMountPoints; }

  // Where something is mounted on the volume, so that what lies below is hidden there.
  const std::vector<std::string>& Covers() const { return mCovers; }

  // Whether that is the id of one of its mounts.
  bool IsMountedAs(int mount) const;

  // Everywhere that the volume shows the item with that path on one of its mounts, the first mount
  // first, whatever else is mounted there. The path alone for another mount.
  std::vector<std::string> PathsOf(const std::string& path, int mount) const;

  // The root folder, asked for when first needed; none when it cannot be read, and when something
  // else is found at the mount point.
  const std::optional<ItemReference>& Root() const;

  // Whether the root folder was not found at the mount point, as when a folder above was renamed.
  bool IsMoved() const { return mIsMoved; }

  // Of the file system: "ext4", "tmpfs", …
  const std::string& Type() const { return mMounts.front().type; }

  // In HFS form, 1 to 63 bytes: the last component of the mount point; for "/" the label of the
  // file system, else "Root". Two volumes can have the same name.
  const std::string& Name() const;

 private:
  std::vector<Mount>::const_iterator MountWithID(int id) const;

  VolumeNumber mNumber;
  std::vector<Mount> mMounts;
  std::vector<std::string> mMountPoints;
  std::vector<std::string> mCovers;
  // On demand: the label of "/" costs three system calls.
  mutable std::optional<std::string> mName;
  mutable bool mIsNameKnown = false;
  mutable std::optional<ItemReference> mRoot;
  mutable bool mIsMoved = false;
};

// A volume as it was in one state of the table. It stays valid for whoever holds it.
using VolumePointer = std::shared_ptr<const Volume>;

class MountTable {
 public:
  static MountTable& OfThisProcess();

  // The mount that the process's root is in, as the kernel tells without the table.
  static Mount ReadRootMount();

  // `source` is a file with the text that /proc/self/mountinfo has, `readRoot` tells the mount at
  // the process's root.
  explicit MountTable(std::string source = "/proc/self/mountinfo",
                      Mount (*readRoot)() = ReadRootMount);

  // The volumes in their order, "/" first; there is always one. `index` counts from 0. Null past
  // the last one. A walk 0, 1, 2, … sees one state of the table: going on from the last asked index
  // does not look for changes.
  VolumePointer AtIndex(std::size_t index);

  // The volume with a number; 0 is the volume of "/". Null when none has it.
  VolumePointer WithNumber(VolumeNumber number);

  // The first volume with a name in HFS form; null when none has it.
  VolumePointer WithName(std::string_view name);

  // The volume that an item is on: by the mount that the kernel reports for it, where it reports
  // none by the device, else by the mount point that `path` begins with. Null for an item of a
  // kernel interface. REQUIRES: `path` is the item's canonical path.
  VolumePointer OfItem(const ItemReference& item, std::string_view path);

  // The volume at or below whose MountPoint() a path lies by its spelling; of several the one with
  // the longest.
  VolumePointer OfPath(std::string_view path);

  // Whether something, a volume or not, is mounted at a path, or at a name in the folder with that
  // path, in the state last looked at.
  bool IsMountPoint(const std::string& path) const { return mState.mountPoints.contains(path); }
  bool HoldsMountPoint(const std::string& path) const { return mState.holders.contains(path); }

  // Whether the nearest mount above a path, or at it, is not another volume's, for which one could
  // wait: by the spelling and in the state last looked at. REQUIRES: one place of the volume is
  // above the path.
  bool IsReachable(const Volume& volume, std::string path) const;

  // Makes the next question read the table whatever the kernel has signalled: a place was found not
  // to be where the table says, as the kernel does not signal that a mount point was renamed.
  void Distrust() { mIsCurrent = false; }

 private:
  // What one reading of the table gave.
  struct State {
    std::vector<VolumePointer> volumes;
    std::unordered_map<int, VolumePointer> byMount;  // by mount id
    std::unordered_map<VolumeNumber, VolumePointer> byNumber;
    std::unordered_set<std::string> mountPoints;  // of every line of the table
    std::unordered_set<std::string> holders;      // the folders that hold those
  };

  void Refresh();
  bool HasChanged() const;
  void Read();
  std::optional<std::string> ReadSource();
  State StateOf(const std::vector<Mount>& mounts, int rootID);
  std::optional<VolumeNumber> NumberOf(int mountID, const std::unordered_set<int>& mountIDs);
  VolumePointer OfMount(int id) const;

  std::string mSource;
  Mount (*mReadRoot)();
  Descriptor mDescriptor;  // open while the state came from it
  State mState;
  bool mIsCurrent = false;                // as far as nothing was signalled since
  std::optional<std::size_t> mLastIndex;  // of a walk by AtIndex
  // Where minus the mount id does not serve: the numbers by mount id, and which are taken so.
  std::map<int, VolumeNumber> mAssignedNumbers;
  std::unordered_set<int> mTakenNumbers;
};

}  // namespace tallowmere::files
