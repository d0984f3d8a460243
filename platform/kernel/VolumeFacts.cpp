#include "kernel/VolumeFacts.h"

#include <sys/vfs.h>

#include <limits>

#include "kernel/Paths.h"
#include "kernel/Xfs.h"

namespace tallowmere::kernel {

Result<const FileSystemKind*> ReadKind(const std::string& mountPoint, std::uint64_t device) {
  struct statfs about {};
  if (statfs(mountPoint.c_str(), &about) != 0) return Error::OfLastCall();
  return &KindOf(static_cast<std::uint32_t>(about.f_type), about.f_files, device);
}

std::uint64_t HighestInode(const FileSystemKind& kind, const std::string& mountPoint) {
  if (kind.numberBits == 32) return std::numeric_limits<std::uint32_t>::max();
  if (kind.byNumber == ByNumber::kInodeAndGeneration) {
    const auto root = OpenForReading(AtPath(mountPoint.c_str()));
    const auto highest =
        root ? ReadHighestXfsInode(root->Get()) : Result<std::uint64_t>(root.Error());
    if (highest) return *highest;
  }
  return std::numeric_limits<std::uint64_t>::max();
}

}  // namespace tallowmere::kernel
