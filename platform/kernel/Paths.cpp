#include "kernel/Paths.h"

#include <fcntl.h>
#include <linux/fs.h>
#include <linux/openat2.h>
#include <sys/ioctl.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <array>
#include <climits>
#include <cstdlib>
#include <memory>

#include "foundation/PathText.h"

namespace tallowmere::kernel {
namespace {

constexpr int kHeld = O_PATH | O_NOFOLLOW | O_CLOEXEC;

Result<Descriptor> AsResult(int descriptor) {
  if (descriptor < 0) return Error::OfLastCall();
  return Descriptor(descriptor);
}

// Opens folder by folder; an open link has nothing in it, so a link on the way fails.
Result<Descriptor> HoldStepByStep(std::string_view path, int flags) {
  if (path.size() >= PATH_MAX) return Error{ENAMETOOLONG};
  auto item = AsResult(open("/", kHeld));
  while (item && path.size() > 1) {
    path.remove_prefix(1);
    const std::string name(path.substr(0, path.find('/')));
    const bool isLast = name.size() == path.size();
    item = AsResult(openat(item->Get(), name.c_str(), isLast ? flags : kHeld));
    path.remove_prefix(name.size());
  }
  return item;
}

Result<Descriptor> Hold(const std::string& path, int flags) {
  open_how how{};
  how.flags = static_cast<unsigned>(flags);
  how.resolve = RESOLVE_NO_SYMLINKS;
  const long descriptor = syscall(SYS_openat2, AT_FDCWD, path.c_str(), &how, sizeof how);
  // The call is missing before Linux 5.6, and some sandboxes forbid it: openat2(2).
  const bool isCallMissing = descriptor < 0 && (errno == ENOSYS || errno == EPERM);
  return isCallMissing ? HoldStepByStep(path, flags) : AsResult(static_cast<int>(descriptor));
}

}  // namespace

bool IsNormalized(std::string_view path) {
  if (path == "/") return true;
  if (!path.starts_with('/')) return false;
  const std::size_t size = path.size();
  for (std::size_t slash = 0; slash < size; slash = path.find('/', slash + 1)) {
    // The component after the slash must not be empty, "." or "..".
    const auto isEnd = [&](std::size_t at) { return at == size || path[at] == '/'; };
    if (isEnd(slash + 1)) return false;
    if (path[slash + 1] != '.') continue;
    if (isEnd(slash + 2) || (path[slash + 2] == '.' && isEnd(slash + 3))) return false;
  }
  return true;
}

Result<Descriptor> HoldWithoutLinks(const std::string& path) {
  return Hold(path, kHeld);
}

Result<Descriptor> HoldFolderWithoutLinks(const std::string& path) {
  return Hold(path, kHeld | O_DIRECTORY);
}

Result<Descriptor> HoldFolderIn(const Spot& spot) {
  return AsResult(openat(spot.folder, spot.name, kHeld | O_DIRECTORY));
}

Result<Descriptor> HoldFollowing(const Spot& spot) {
  return AsResult(openat(spot.folder, spot.name, O_PATH | O_CLOEXEC));
}

Result<Descriptor> OpenForReading(const Spot& spot) {
  return AsResult(openat(spot.folder, spot.name, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
}

bool HasCasefold(const Spot& folder) {
  const auto open = OpenForReading(folder);
  int flags = 0;
  return open && ioctl(open->Get(), FS_IOC_GETFLAGS, &flags) == 0 && (flags & FS_CASEFOLD_FL) != 0;
}

Result<std::string> RealPath(const std::string& path) {
  struct Free {
    void operator()(char* text) const { std::free(text); }
  };
  const std::unique_ptr<char, Free> real(realpath(path.c_str(), nullptr));
  if (!real) return Error::OfLastCall();
  return std::string(real.get());
}

Result<std::string> CanonicalPath(const std::string& path) {
  const std::string_view name = *foundation::LastComponent(path);
  if (name == "/" || name == "." || name == "..") return RealPath(path);
  const auto length = static_cast<std::size_t>(name.data() - path.data());
  const auto folder = RealPath(path.substr(0, length));
  if (!folder) return folder.Error();
  return foundation::JoinPath(*folder, name);
}

bool LeadsToFile(const std::string& path) {
  struct stat about {};
  return stat(path.c_str(), &about) == 0 && S_ISREG(about.st_mode);
}

Result<std::string> PathOfDescriptor(const Descriptor& descriptor) {
  const std::string link = "/proc/self/fd/" + std::to_string(descriptor.Get());
  std::array<char, PATH_MAX> text{};
  const ssize_t length = readlink(link.c_str(), text.data(), text.size());
  if (length < 0) return Error::OfLastCall();
  // The text for an item that no path leads to does not begin with "/".
  if (length == 0 || text[0] != '/') return kNotThere;
  return std::string(text.data(), static_cast<std::size_t>(length));
}

}  // namespace tallowmere::kernel
