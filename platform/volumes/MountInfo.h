// Parses the kernel's table of mounts: proc(5), /proc/[pid]/mountinfo. Pure.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace tallowmere::volumes {

// One line of the table.
struct Mount {
  int id;                  // unique while mounted
  int parent;              // the mount that this one is mounted on
  std::uint64_t device;    // of the file system; stat may report another (subvolumes, overlays)
  std::string root;        // the folder of the file system that is shown at the mount point
  std::string mountPoint;  // absolute, as this process sees it
  std::string type;        // of the file system: "ext4", "tmpfs", …
};

// The lines in the kernel's order, with escapes undone. Malformed lines are skipped.
std::vector<Mount> ParseMountInfo(std::string_view text);

}  // namespace tallowmere::volumes
