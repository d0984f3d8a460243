#include "faults/SmallRoot.h"

#include <fcntl.h>
#include <link.h>
#include <sys/mount.h>
#include <unistd.h>

#include <cstdint>
#include <cstdlib>
#include <system_error>

namespace tallowmere::test {
namespace {

constexpr std::uintmax_t kImageSize = 8 << 20;

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
    : mRoot("tallowmere", mFolder.Path().string(), "tmpfs") {
  if (!mRoot.IsMounted()) return;
  std::vector<std::string> all = LoadedLibraries();
  all.insert(all.end(), files.begin(), files.end());
  for (const std::string& file : all) {
    std::filesystem::create_directories(Outside(file).parent_path());
    std::filesystem::copy_file(file, Outside(file));
  }
  for (const char* const folder : {"/proc", "/tmp", kDisk, kImage}) {
    std::filesystem::create_directories(Outside(folder));
  }
  mProc.emplace("/proc", Outside("/proc").string(), nullptr, MS_BIND);
  mDisk.emplace("tallowmere", Outside(kDisk).string(), "tmpfs");
  mImage.emplace("ext4", std::vector<std::string>{"mkfs.ext4", "-q", "-F"}, kImageSize);
  if (mImage->IsMade() && mImage->Mount()) {
    mImagePlace.emplace(mImage->Path().string(), Outside(kImage).string(), nullptr, MS_BIND);
  }
  mFormerRoot = open("/", O_PATH | O_DIRECTORY | O_CLOEXEC);
  mIsEntered = mProc->IsMounted() && mDisk->IsMounted() && mFormerRoot >= 0 &&
               chroot(mFolder.Path().c_str()) == 0 && chdir("/") == 0;
}

SmallRoot::~SmallRoot() {
  if (mIsEntered && (fchdir(mFormerRoot) != 0 || chroot(".") != 0)) std::abort();
  if (mFormerRoot >= 0) close(mFormerRoot);
}

}  // namespace tallowmere::test
