// Which mounts are reachable, and which of them make one volume. Pure but for the caller's
// `isFolder`.
#pragma once

#include <cstddef>
#include <functional>
#include <map>
#include <string>
#include <unordered_map>
#include <utility>
#include <vector>

#include "volumes/MountInfo.h"

namespace tallowmere::volumes {

// The mounts of a table by what they are mounted on.
//
// Reachable: not covered by another mount at its own mount point, nor by one further up. What is
// mounted over the process's root is unreachable: path lookup starts below it. Parents that are
// missing from the table count as reachable.
class MountTree {
 public:
  // `rootID` is the id of the mount that the process's root is in. REQUIRES: it is among the
  // mounts, which outlive the tree.
  MountTree(const std::vector<Mount>& mounts, int rootID);

  // The mounts that make each volume, by index, its place in front; the volumes in their order: the
  // one of "/" first, then the kernel's order of places. Mounts of one file system are one volume.
  //
  // A volume's place is the mount at the process's root if it is one of its own, else its first
  // reachable mount of the file system's root folder, else its first reachable mount of a folder (a
  // file can be mounted alone); behind the place stand its other reachable mounts. `isFolder` is
  // asked only where no mount shows the root folder and MayBeFile().
  std::vector<std::vector<std::size_t>> GroupIntoVolumes(
      const std::function<bool(const Mount&)>& isFolder);

  // Whether a mount can be a single file's, as far as can be told without waiting for a server:
  // behind one it counts as a folder. REQUIRES: the mount is reachable.
  bool MayBeFile(std::size_t index) const;

 private:
  enum class State : char { kUnknown, kEntered, kHidden };

  bool IsRoot(std::size_t index) const { return mMounts[index].id == mRootID; }
  bool IsReachable(std::size_t index);
  bool IsEntered(std::size_t index);
  bool IsCovered(std::size_t index) const;
  bool NeedsServer(std::size_t index) const;

  const std::vector<Mount>& mMounts;
  int mRootID;
  std::vector<State> mState;
  std::unordered_map<int, std::size_t> mByID;
  std::map<std::pair<int, std::string>, std::size_t> mByPlace;
};

}  // namespace tallowmere::volumes
