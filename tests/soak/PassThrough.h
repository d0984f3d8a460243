// A FUSE server that passes every call through to a folder of another file system.
#pragma once

#include <string>

namespace tallowmere::soak {

struct PassThrough {
  bool onBlockDevice = false;  // mounts as fuseblk, like a file system on a disk
  bool oneNumber = false;      // gives every item but the root folder the same inode number
};

// Starts the server in a child process that ends with this one. Returns whether it is mounted.
// REQUIRES: this process is in a mount namespace of its own.
bool MountPassThrough(const std::string& source, const std::string& place, PassThrough how);

}  // namespace tallowmere::soak
