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
#include <optional>
#include <string>
#include <vector>

#include "files/Descriptor.h"
#include "files/MountInfo.h"

namespace tallowmere::files {

using VolumeNumber = short;

class Volume {
 public:
  Volume(VolumeNumber number, const Mount& place);

  // Below 0, unique while mounted, the same in every process: minus the mount id of its place.
  VolumeNumber Number() const { return mNumber; }

  // Where its root folder is, as this process sees it.
  const std::string& MountPoint() const { return mMountPoint; }

  // In HFS form, 1 to 63 bytes: the last component of the mount point; for "/" the label of the
  // file system, else "Root". Two volumes can have the same name.
  const std::string& Name() const;

 private:
  VolumeNumber mNumber;
  std::string mMountPoint;
  mutable std::optional<std::string>
      mName;  // the label costs three system calls, so only on demand
};

class MountTable {
 public:
  static MountTable& OfThisProcess();

  // `source` is a file with the text that /proc/self/mountinfo has.
  explicit MountTable(std::string source = "/proc/self/mountinfo");

  // The volumes in their order, "/" first; there is always one. `index` counts from 0. Null past
  // the last one. A walk 0, 1, 2, … sees one state of the table: going on from the last asked index
  // does not look for changes. The volume stays valid until the next question.
  const Volume* AtIndex(std::size_t index);

  // The volume with a number; 0 is the volume of "/". Null when none has it.
  const Volume* WithNumber(VolumeNumber number);

 private:
  void Refresh();
  bool IsCurrent() const;
  void Read();
  std::optional<std::string> ReadSource();
  std::optional<VolumeNumber> NumberOf(const Mount& place, const std::vector<Mount>& mounts);

  std::string mSource;
  Descriptor mDescriptor;  // open while mVolumes came from it
  std::vector<Volume> mVolumes;
  std::optional<std::size_t> mLastIndex;         // of a walk by AtIndex
  std::map<int, VolumeNumber> mAssignedNumbers;  // by mount id, where minus the id does not serve
};

}  // namespace tallowmere::files
