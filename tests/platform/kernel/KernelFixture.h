// A mounted image for opening items by number.
#pragma once

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>
#include <fstream>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "kernel/FileHandle.h"
#include "support/FileSystemImage.h"
#include "support/MountNamespace.h"
#include "support/OwnMountNamespace.h"

namespace tallowmere::kernel {

inline constexpr std::uintmax_t kMebibyte = 1024 * 1024;

inline struct stat StatusOf(const std::filesystem::path& path) {
  struct stat status {};
  EXPECT_EQ(lstat(path.c_str(), &status), 0) << path;
  return status;
}

inline std::uint64_t InodeOf(const std::filesystem::path& path) {
  return StatusOf(path).st_ino;
}

class AMountedImage : public testing::Test {
 protected:
  // Skips the test where the image cannot be made or mounted.
  void MakeImage(const std::string& type, std::vector<std::string> makeCommand,
                 std::uintmax_t size) {
    if (geteuid() != 0 || !test::EnterOwnMountNamespace()) GTEST_SKIP() << "may not mount";
    mImage.emplace(type, std::move(makeCommand), size);
    if (!mImage->IsMade() || !test::KernelHas(type)) GTEST_SKIP() << "no " << type;
    Mount();
  }

  void Mount(const std::string& options = "") {
    ASSERT_TRUE(mImage->Mount(options));
    mRoot = Descriptor(open(mImage->Path().c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    ASSERT_TRUE(mRoot.IsOpen());
  }

  // Also empties the kernel's caches of the volume.
  void MountAgain(const std::string& options = "") {
    mRoot.Close();
    mImage->Unmount();
    Mount(options);
  }

  std::filesystem::path PathOf(const std::string& name) const { return mImage->Path() / name; }

  std::filesystem::path MakeFolder(const std::string& name) const {
    std::filesystem::create_directories(PathOf(name));
    return PathOf(name);
  }

  std::filesystem::path MakeFile(const std::string& name) const {
    std::ofstream(PathOf(name)) << name;
    return PathOf(name);
  }

  int Root() const { return mRoot.Get(); }

  FileHandle HandleOfRoot() const {
    const auto handle = ReadHandle(Root(), "");
    EXPECT_TRUE(handle) << handle.Error().number;
    return handle ? *handle : FileHandle{};
  }

  // Opens an item by its numbers. Returns the error, or 0 after checking that it is at `path`.
  int ErrorOfOpening(const HandleNumbers& numbers, const std::filesystem::path& path = {}) const {
    struct stat status {};
    EXPECT_EQ(fstat(Root(), &status), 0);
    const auto handle = HandleOf(numbers, HandleOfRoot(), status.st_ino);
    if (!handle) return EINVAL;
    const auto opened = OpenByHandle(Root(), *handle);
    if (!opened) return opened.Error().number;
    EXPECT_EQ(fstat(opened->Get(), &status), 0);
    EXPECT_EQ(status.st_ino, InodeOf(path)) << path;
    EXPECT_EQ(status.st_dev, StatusOf(path).st_dev) << path;
    return 0;
  }

  std::optional<test::FileSystemImage> mImage;

 private:
  Descriptor mRoot;  // closed before the image is unmounted
};

}  // namespace tallowmere::kernel
