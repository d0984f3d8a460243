// A FUSE server that shows a folder of another file system.
#pragma once

#include <string>

namespace tallowmere::soak {

struct PassThrough {
  bool onBlockDevice = false;  // it then passes for a file system of a disk: fuseblk
  bool oneNumber = false;      // every item but the root folder has the same inode number
};

// Starts the server in a child process that ends with this one. Returns whether it is mounted.
// REQUIRES: this process is in a mount namespace of its own.
bool MountPassThrough(const std::string& source, const std::string& place, PassThrough how);

}  // namespace tallowmere::soak
