// The parts of the kernel's mount table that a client needs: proc_pid_mountinfo(5).
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace tallowmere {

struct Mount {
  std::string point;
  std::string kind;  // of its file system, such as "ext4"; empty when it is not told
};

// Every mount, in the order and with the omissions of MountPointsIn.
std::vector<Mount> MountsIn(std::string_view mountInfo);

// Every path at which something is mounted, once each: "/" first, then in the kernel's order. Of
// several mounts at one path the last one counts, as it covers the others. Malformed lines are
// skipped. Just "/" for an empty text.
std::vector<std::string> MountPointsIn(std::string_view mountInfo);

// Those of this process; just "/" where there is no /proc. Nothing but the table is touched.
std::vector<std::string> ReadMountPoints();
std::vector<Mount> ReadMounts();

// Whether looking at the mount may wait for a program or another machine.
bool HasServer(const Mount& mount);

}  // namespace tallowmere
