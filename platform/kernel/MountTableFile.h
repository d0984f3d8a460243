// The kernel's table of mounted file systems as a file: proc(5), /proc/[pid]/mountinfo.
#pragma once

#include <sys/types.h>

#include <cstdint>
#include <string>

#include "kernel/Descriptor.h"
#include "kernel/Result.h"

namespace tallowmere::kernel {

class MountTableFile {
 public:
  explicit MountTableFile(std::string path = "/proc/self/mountinfo") : mPath(std::move(path)) {}

  // The whole text. It comes in several pieces: a mount made between two of them can be missing or
  // shift others out, which HasChanged() then signals.
  Result<std::string> Read();

  // Whether the kernel has signalled a change since the last time that it was asked, or cannot be
  // asked: poll(2), POLLPRI. One system call.
  bool HasChanged() const;

 private:
  std::string mPath;
  Descriptor mDescriptor;
};

// The mount that the process's root is in, as the kernel tells without the table.
struct RootMount {
  int id;  // 0: not told
  dev_t device;
};
RootMount ReadRootMount();

// Whether a mount point is a folder, from what the kernel has: neither a dead server nor an
// automounter is waited for.
bool IsFolderByMemory(const std::string& mountPoint);

// The label of the file system of "/", which takes the right to read "/". Empty for a file system
// that has none; EACCES, EPERM, EIO and others where it cannot be told now.
Result<std::string> ReadRootLabel();

}  // namespace tallowmere::kernel
