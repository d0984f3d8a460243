// The file with the kernel's table of mounts: proc(5), /proc/[pid]/mountinfo.
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

  // The whole text. It is read in several pieces: a mount made between two of them may be missing
  // or displace others, which HasChanged() then reports.
  Result<std::string> Read();

  // Whether the kernel has signalled a change since the last call, or cannot be asked: poll(2),
  // POLLPRI. One system call.
  bool HasChanged() const;

 private:
  std::string mPath;
  Descriptor mDescriptor;
};

// The mount that contains the process's root, found without the table.
struct RootMount {
  int id;  // 0: not known
  dev_t device;
};
RootMount ReadRootMount();

// Whether a mount point is a folder, from what the kernel has in memory: waits for neither a dead
// server nor an automounter.
bool IsFolderByMemory(const std::string& mountPoint);

// The label of the file system of "/", which requires permission to read "/". Empty for a file
// system without one; returns EACCES, EPERM, EIO and others when it cannot be read now.
Result<std::string> ReadRootLabel();

}  // namespace tallowmere::kernel
