// The kernel's table of mounted file systems as text, and which volumes it describes.
//
// Pure: nothing here opens or asks anything but the text it is given and the caller's `isFolder`.
// The text's format is in proc(5), /proc/[pid]/mountinfo.
#pragma once

#include <sys/types.h>

#include <cstddef>
#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace tallowmere::files {

// One line of the table.
struct Mount {
  int id;            // unique while mounted
  int parent;        // the mount that this one is mounted on
  dev_t device;      // of the file system; what stat reports can differ (subvolumes, overlays)
  std::string root;  // the folder of the file system that is shown at the mount point
  std::string mountPoint;  // absolute, as this process sees it
  std::string type;        // of the file system: "ext4", "tmpfs", …
};

// The lines in the kernel's order, escapes undone. A malformed line is passed over.
std::vector<Mount> ParseMountInfo(std::string_view text);

// False for the file systems that are kernel interfaces and hold no user's files.
bool HoldsFiles(std::string_view fileSystemType);

// Whether looking at something there can mean to wait for a server: over the network or FUSE.
bool NeedsAServer(std::string_view fileSystemType);

// The mounts that make each volume, by index, its place in front; the volumes in their order: the
// one of "/" first, then the kernel's order of places. Mounts of one file system are one volume.
//
// A volume's place is the mount at the process's root if it is one of its own, else its first
// reachable mount of the file system's root folder, else its first reachable mount of a folder (a
// file can be mounted alone); behind the place stand its other reachable mounts. `isFolder` is
// asked only where no mount shows the root folder and no server is on the way; where one is, it is
// taken for a folder.
//
// Reachable: not covered by another mount at its own mount point, nor by one further up the way.
// What is mounted over the process's root is never come upon, as every way begins below it.
//
// `rootID` is the id of the mount that the process's root is in. REQUIRES: it is among the mounts.
std::vector<std::vector<std::size_t>> GroupIntoVolumes(
    const std::vector<Mount>& mounts, int rootID,
    const std::function<bool(const Mount&)>& isFolder);

}  // namespace tallowmere::files
