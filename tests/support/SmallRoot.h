// A root folder with just some programs and what they need to start, so that other mounts of the
// machine do not affect a test and no search visits its disks.
#pragma once

#include <filesystem>
#include <string>
#include <vector>

namespace tallowmere::test {

// Copies programs and libraries, and the libraries that ldd lists for them, to their paths below a
// folder.
void CopyPrograms(const std::vector<std::string>& programs, const std::filesystem::path& root);

// Moves this process into a mount namespace of its own with such a root folder, in memory: the
// programs at their paths, the libraries that ldd lists, /proc, and an empty folder for temporary
// files. Returns false where that is not permitted. For good.
bool EnterSmallRoot(const std::vector<std::string>& programs);

}  // namespace tallowmere::test
