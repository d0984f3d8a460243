// What the kernel reports about a mounted file system as a whole.
#pragma once

#include <cstdint>
#include <string>

#include "kernel/FileSystemKinds.h"
#include "kernel/Result.h"

namespace tallowmere::kernel {

// The kind of the file system at a mount point whose root folder is on this device: statfs(2). The
// result is valid for the life of the process.
Result<const FileSystemKind*> ReadKind(const std::string& mountPoint, std::uint64_t device);

// The highest inode number that the file system at a mount point can have now. It may grow.
std::uint64_t HighestInode(const FileSystemKind& kind, const std::string& mountPoint);

}  // namespace tallowmere::kernel
