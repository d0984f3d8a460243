#include "faults/SmallRoot.h"

#include <fcntl.h>
#include <link.h>
#include <sys/mount.h>
#include <unistd.h>

#include <cstdint>
#include <cstdlib>
#include <fstream>

namespace tallowmere::test {
namespace {

// In bytes.
constexpr std::uintmax_t kImageSize = 64 << 20;

std::vector<std::string> LoadedLibraries() {
  std::vector<std::string> libraries;
  dl_iterate_phdr(
      [](dl_phdr_info* info, std::size_t, void* found) {
        if (info->dlpi_name[0] == '/') {
          static_cast<std::vector<std::string>*>(found)->emplace_back(info->dlpi_name);
        }
        return 0;
      },
      &libraries);
  return libraries;
}

}  // namespace

SmallRoot::SmallRoot(const std::vector<std::string>& files)
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

void SmallRoot::Furnish(const std::vector<std::string>& files) {
  std::vector<std::string> all = LoadedLibraries();
  all.insert(all.end(), files.begin(), files.end());
  for (const std::string& file : all) {
    std::filesystem::create_directories(Outside(file).parent_path());
    std::filesystem::copy_file(file, Outside(file));
  }
  for (const char* const folder : {"/proc", "/tmp", "/etc", kDisk, kHome}) {
    std::filesystem::create_directories(Outside(folder));
  }
  std::ofstream(Outside("/etc/passwd"))
      << "user:x:" << getuid() << ":" << getgid() << "::" << kHome << ":/bin/sh\n";
}

SmallRoot::~SmallRoot() {
  if (mIsEntered && (fchdir(mFormerRoot) != 0 || chroot(".") != 0)) std::abort();
  if (mFormerRoot >= 0) close(mFormerRoot);
}

}  // namespace tallowmere::test
