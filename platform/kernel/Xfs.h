// What xfs reports about itself beyond the calls that all file systems support.
//
// Returns ENOTTY when the volume is not xfs.
#pragma once

#include <cstdint>

#include "kernel/Result.h"

namespace tallowmere::kernel {

// The generation of an inode number, which its handle needs. REQUIRES: `onVolume` is open for
// reading.
//
//   EPERM    the process lacks CAP_SYS_ADMIN
//   ENOENT   no item has the number
Result<std::uint32_t> ReadXfsGeneration(int onVolume, std::uint64_t inode);

// The highest inode number that the volume can have until it grows. Needs no privilege.
Result<std::uint64_t> ReadHighestXfsInode(int onVolume);

}  // namespace tallowmere::kernel
