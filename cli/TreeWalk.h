// Every item of a folder that lstat can see, whatever its kind, the folder itself first.
//
// The folders of kernel interfaces (proc, sysfs, ...) are items too, what is in them is left out.
#pragma once

#include <sys/stat.h>

#include <functional>
#include <string>

namespace tallowmere::cli {

struct TreeVisitor {
  // An item, and how much of the walk lies behind it, 0 to 1: an estimate that never falls. False
  // ends the walk.
  std::function<bool(const std::string& path, const struct stat& status, double done)> item;
  // Whether a folder is on a volume, asked of the first one and of each on another device than the
  // folder that holds it.
  std::function<bool(const std::string& path, const struct stat& status)> isOnVolume;
  // What could not be looked at, and why, in a few words. Not called for what has vanished.
  std::function<void(const std::string& path, const std::string& reason)> leftOut;
};

// REQUIRES: `folder` is an absolute path.
void WalkTree(const std::string& folder, const TreeVisitor& visitor);

}  // namespace tallowmere::cli
