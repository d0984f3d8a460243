// What xfs tells of itself beyond the calls that all file systems answer.
//
// ENOTTY: the volume is of another kind.
#pragma once

#include <cstdint>

#include "kernel/Result.h"

namespace tallowmere::kernel {

// The generation of an inode number, which its handle needs. `onVolume` is open for reading.
//
//   EPERM    the process lacks CAP_SYS_ADMIN
//   ENOENT   no item has the number
Result<std::uint32_t> ReadXfsGeneration(int onVolume, std::uint64_t inode);

// No inode number of the volume is higher, until the volume grows. No privilege needed.
Result<std::uint64_t> ReadHighestXfsInode(int onVolume);

}  // namespace tallowmere::kernel
