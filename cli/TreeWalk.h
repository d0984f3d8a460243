// Visits every item in a folder that lstat can see, whatever its kind, the folder itself first.
//
// Folders of kernel interfaces (proc, sysfs, ...) are visited, but their contents are left out.
#pragma once

#include <sys/stat.h>

#include <functional>
#include <string>

namespace tallowmere::cli {

struct TreeVisitor {
  // Called for each item with the part of the walk that is done, 0 to 1, an estimate that never
  // falls. Returning false ends the walk.
  std::function<bool(const std::string& path, const struct stat& status, double done)> item;
  // Whether a folder is on a volume. Called for the first folder and for each on another device
  // than its parent.
  std::function<bool(const std::string& path, const struct stat& status)> isOnVolume;
  // Called for what could not be examined, with the reason in a few words; not for what has
  // vanished.
  std::function<void(const std::string& path, const std::string& reason)> leftOut;
};

// REQUIRES: `folder` is an absolute path.
void WalkTree(const std::string& folder, const TreeVisitor& visitor);

}  // namespace tallowmere::cli
