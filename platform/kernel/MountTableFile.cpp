#include "kernel/MountTableFile.h"

#include <fcntl.h>
#include <linux/fs.h>
#include <poll.h>
#include <sys/ioctl.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>

#include <array>

namespace tallowmere::kernel {
namespace {

constexpr int kWithoutWaiting = AT_STATX_DONT_SYNC | AT_NO_AUTOMOUNT;

// What ioctl(2) returns where a file system has no labels.
bool MeansNoLabels(Error error) {
  return error.number == ENOTTY || error.number == EOPNOTSUPP || error.number == EINVAL ||
         error.number == ENOSYS;
}

}  // namespace

Result<std::string> MountTableFile::Read() {
  if (!mDescriptor.IsOpen()) mDescriptor = Descriptor(open(mPath.c_str(), O_RDONLY | O_CLOEXEC));
  if (!mDescriptor.IsOpen()) return Error::OfLastCall();
  std::string text;
  std::array<char, 16384> piece;
  ssize_t got = 0;
  while ((got = pread(mDescriptor.Get(), piece.data(), piece.size(),
                      static_cast<off_t>(text.size()))) > 0) {
    text.append(piece.data(), static_cast<std::size_t>(got));
  }
  if (got == 0) return text;
  const Error error = Error::OfLastCall();
  mDescriptor.Close();
  return error;
}

bool MountTableFile::HasChanged() const {
  pollfd table{mDescriptor.Get(), POLLPRI, 0};
  return poll(&table, 1, 0) != 0;
}

RootMount ReadRootMount() {
  struct statx about {};
  if (statx(AT_FDCWD, "/", kWithoutWaiting, STATX_TYPE | STATX_MNT_ID, &about) != 0) return {};
  const bool hasMount = (about.stx_mask & STATX_MNT_ID) != 0;
  return {hasMount ? static_cast<int>(about.stx_mnt_id) : 0,
          makedev(about.stx_dev_major, about.stx_dev_minor)};
}

bool IsFolderByMemory(const std::string& mountPoint) {
  struct statx about {};
  return statx(AT_FDCWD, mountPoint.c_str(), kWithoutWaiting, STATX_TYPE, &about) == 0 &&
         S_ISDIR(about.stx_mode);
}

Result<std::string> ReadRootLabel() {
  const Descriptor root(open("/", O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (!root.IsOpen()) return Error::OfLastCall();
  std::array<char, FSLABEL_MAX + 1> label{};
  if (ioctl(root.Get(), FS_IOC_GETFSLABEL, label.data()) == 0) return std::string(label.data());
  const Error error = Error::OfLastCall();
  if (MeansNoLabels(error)) return std::string();
  return error;
}

}  // namespace tallowmere::kernel
