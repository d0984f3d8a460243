// The parts of the kernel's mount table that a client needs: proc_pid_mountinfo(5).
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace tallowmere {

// Every path at which something is mounted, once each: "/" first, then in the kernel's order. Of
// several mounts at one path the last one counts, as it covers the others. Malformed lines are
// skipped. Just "/" for an empty text.
std::vector<std::string> MountPointsIn(std::string_view mountInfo);

// The mount points of this process; just "/" where there is no /proc.
std::vector<std::string> ReadMountPoints();

}  // namespace tallowmere
