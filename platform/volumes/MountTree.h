// Which mounts are reachable, and which of them form one volume. Pure except for the caller's
// `isFolder`.
#pragma once

#include <cstddef>
#include <functional>
#include <map>
#include <string_view>
#include <unordered_map>
#include <utility>
#include <vector>

#include "volumes/MountInfo.h"

namespace tallowmere::volumes {

// The mounts of a table, arranged by what they are mounted on.
//
// A mount is reachable when it is not covered by another mount, at its own mount point or further
// up. What is mounted over the process's root is unreachable: path lookup starts below it. Parents
// that are missing from the table count as reachable.
class MountTree {
 public:
  // `rootID` is the id of the mount that contains the process's root. REQUIRES: it is among
  // `mounts`, which outlive the tree.
  MountTree(const std::vector<Mount>& mounts, int rootID);

  // Groups mounts of the same file system into volumes. Each volume is a list of mount indexes: its
  // place, then its other reachable mounts. The volume of "/" comes first, the others in the
  // kernel's order of their places. A volume's place is the first of these that exists:
  //
  //   1. the mount at the process's root
  //   2. the first reachable mount of the file system's root folder
  //   3. the first reachable mount of a folder (a file can be mounted alone)
  //
  // `isFolder` is called only where no mount shows the root folder, and only where MayBeFile().
  std::vector<std::vector<std::size_t>> GroupIntoVolumes(
      const std::function<bool(const Mount&)>& isFolder);

  // Whether a mount may be that of a single file, as far as can be told without waiting for a
  // server: one that needs a server counts as a folder. REQUIRES: the mount is reachable.
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
  std::map<std::pair<int, std::string_view>, std::size_t> mByPlace;
};

}  // namespace tallowmere::volumes
