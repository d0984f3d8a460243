#include "support/LoopDevice.h"

#include <fcntl.h>
#include <linux/loop.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <cerrno>

namespace tallowmere::test {
namespace {

// Another process may take the free device first.
constexpr int kMostTries = 100;

}  // namespace

LoopDevice::LoopDevice(int file) {
  const int control = open("/dev/loop-control", O_RDWR | O_CLOEXEC);
  if (control < 0) return;
  int tries = 1;
  while (!AttachFreeOne(control, file) && errno == EBUSY && tries < kMostTries) ++tries;
  close(control);
}

bool LoopDevice::AttachFreeOne(int control, int file) {
  const int number = ioctl(control, LOOP_CTL_GET_FREE);
  if (number < 0) return false;
  mNumber = static_cast<unsigned>(number);
  const int device = open(Path().c_str(), O_RDWR | O_CLOEXEC);
  if (device < 0) return false;
  loop_config config{};
  config.fd = static_cast<__u32>(file);
  config.info.lo_flags = LO_FLAGS_AUTOCLEAR;
  if (ioctl(device, LOOP_CONFIGURE, &config) == 0) {
    mDescriptor = device;
    return true;
  }
  const int error = errno;
  close(device);
  errno = error;
  return false;
}

std::string LoopDevice::Path() const {
  return "/dev/loop" + std::to_string(mNumber);
}

void LoopDevice::Close() {
  if (mDescriptor >= 0) close(mDescriptor);
  mDescriptor = -1;
}

}  // namespace tallowmere::test
