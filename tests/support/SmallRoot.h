// A root folder with nothing in it but some programs and what they need to start, so that what else
// is mounted on the machine takes no part in a test, and no search goes over its disks.
#pragma once

#include <filesystem>
#include <string>
#include <vector>

namespace tallowmere::test {

// Copies programs and libraries, and the libraries that ldd names for them, to their paths below a
// folder.
void CopyPrograms(const std::vector<std::string>& programs, const std::filesystem::path& root);

// Puts this process into a mount namespace of its own with such a root folder, in memory: the
// programs at their paths, the libraries that ldd names, /proc, and an empty folder for temporary
// files. False where that is not permitted. For good.
bool EnterSmallRoot(const std::vector<std::string>& programs);

}  // namespace tallowmere::test
