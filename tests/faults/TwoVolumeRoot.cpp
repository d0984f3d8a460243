#include "faults/TwoVolumeRoot.h"

#include <fcntl.h>
#include <sys/mount.h>
#include <unistd.h>

#include <cstdint>
#include <cstdlib>
#include <fstream>

#include "support/SmallRoot.h"

namespace tallowmere::test {
namespace {

// In bytes.
constexpr std::uintmax_t kImageSize = 64 << 20;

}  // namespace

TwoVolumeRoot::TwoVolumeRoot(const std::vector<std::string>& files)
    : mImage("ext4", {"mkfs.ext4", "-q", "-F", "-L", kLabel}, kImageSize) {
  if (mImage.IsMade() && mImage.Mount()) {
    mTop = mImage.Path();
  } else {
    mTop = mFolder.Path();
    mRoot.emplace("tallowmere", mTop.string(), "tmpfs");
    if (!mRoot->IsMounted()) return;
  }
  Furnish(files);
  mProc.emplace("/proc", Outside("/proc").string(), nullptr, MS_BIND);
  mDisk.emplace("tallowmere", Outside(kDisk).string(), "tmpfs");
  mFormerRoot = open("/", O_PATH | O_DIRECTORY | O_CLOEXEC);
  mIsEntered = mProc->IsMounted() && mDisk->IsMounted() && mFormerRoot >= 0 &&
               chroot(mTop.c_str()) == 0 && chdir("/") == 0;
}

void TwoVolumeRoot::Furnish(const std::vector<std::string>& files) {
  CopyPrograms(files, mTop);
  for (const char* const folder : {"/proc", "/tmp", "/etc", kDisk, kHome}) {
    std::filesystem::create_directories(Outside(folder));
  }
  std::ofstream(Outside("/etc/passwd"))
      << kUser << ":x:" << getuid() << ":" << getgid() << "::" << kHome << ":/bin/sh\n";
}

TwoVolumeRoot::~TwoVolumeRoot() {
  if (mIsEntered && (fchdir(mFormerRoot) != 0 || chroot(".") != 0)) std::abort();
  if (mFormerRoot >= 0) close(mFormerRoot);
}

}  // namespace tallowmere::test
