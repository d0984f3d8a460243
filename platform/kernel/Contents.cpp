#include "kernel/Contents.h"

#include <fcntl.h>
#include <linux/limits.h>
#include <sys/stat.h>
#include <sys/xattr.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <chrono>
#include <thread>

namespace tallowmere::kernel {
namespace {

// What is there by now may be a device or a pipe, which must not make the process wait.
constexpr int kReading = O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC;

// How often to try again while another process has a lease on the file. The first try asks for it,
// and servers give it back at once: fcntl(2), "Leases".
constexpr int kMostTries = 100;
constexpr std::chrono::milliseconds kBetweenTries{10};

Result<Descriptor> TryToOpen(const Spot& spot) {
  int file = openat(spot.folder, spot.name, kReading | O_NOATIME);
  // Only the owner may: open(2).
  if (file < 0 && errno == EPERM) file = openat(spot.folder, spot.name, kReading);
  if (file < 0) return Error::OfLastCall();
  return Descriptor(file);
}

Result<Descriptor> Open(const Spot& spot) {
  auto file = TryToOpen(spot);
  for (int tries = 0; !file && file.Error().number == EWOULDBLOCK && tries < kMostTries; ++tries) {
    std::this_thread::sleep_for(kBetweenTries);
    file = TryToOpen(spot);
  }
  return file;
}

}  // namespace

Result<Descriptor> OpenFile(const Spot& spot) {
  const auto seen = ReadStatus(spot);
  if (!seen) return seen.Error();
  return OpenFile(spot, seen->item);
}

Result<Descriptor> OpenFile(const Spot& spot, const Item& seen) {
  if (!S_ISREG(seen.type)) return kNotThere;
  auto file = Open(spot);
  if (!file) return file;
  const auto opened = ReadStatus(AtOpen(file->Get()));
  if (!opened) return opened.Error();
  const bool isSame = HaveSameNumbers(opened->item, seen) && opened->item.type == seen.type;
  if (!isSame) return kNotThere;
  return file;
}

Result<std::uint64_t> SizeOf(const Descriptor& file) {
  struct stat about {};
  if (fstat(file.Get(), &about) != 0) return Error::OfLastCall();
  return static_cast<std::uint64_t>(about.st_size);
}

Result<std::string> ReadBytes(const Descriptor& file, std::uint64_t offset, std::size_t most) {
  std::string bytes(most, '\0');
  std::size_t count = 0;
  while (count < most) {
    const ssize_t got =
        pread(file.Get(), bytes.data() + count, most - count, static_cast<off_t>(offset + count));
    if (got < 0 && errno == EINTR) continue;
    if (got < 0) return Error::OfLastCall();
    if (got == 0) break;
    count += static_cast<std::size_t>(got);
  }
  bytes.resize(count);
  return bytes;
}

// Most are short: a first try with a small buffer.
Result<std::string> ReadAttribute(const Descriptor& file, const char* name) {
  std::array<char, 512> few{};
  ssize_t size = fgetxattr(file.Get(), name, few.data(), few.size());
  if (size >= 0) return std::string(few.data(), static_cast<std::size_t>(size));
  if (errno != ERANGE) return Error::OfLastCall();
  std::string value(XATTR_SIZE_MAX, '\0');
  size = fgetxattr(file.Get(), name, value.data(), value.size());
  if (size < 0) return Error::OfLastCall();
  value.resize(static_cast<std::size_t>(size));
  return value;
}

Result<std::string> ReadLink(const Spot& spot) {
  std::array<char, PATH_MAX> text{};
  const ssize_t length = readlinkat(spot.folder, spot.name, text.data(), text.size());
  if (length < 0) return Error::OfLastCall();
  return std::string(text.data(), static_cast<std::size_t>(length));
}

}  // namespace tallowmere::kernel
