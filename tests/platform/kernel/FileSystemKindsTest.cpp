// What the table of file system kinds says about each kind.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/vfs.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "kernel/FileSystemKinds.h"
#include "support/FileSystemImage.h"
#include "support/MountNamespace.h"
#include "support/OwnMountNamespace.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::kernel {
namespace {

using names::UpperIDs;
using test::FileSystemImage;
using test::ScopedMount;
using test::TemporaryFolder;

constexpr std::uint64_t kNoDisk = 0x2C;  // 0:44
constexpr std::uint64_t kDisk = 0x803;   // 8:3
constexpr std::uintmax_t kMebibyte = 1024 * 1024;

const FileSystemKind& KindAt(const std::filesystem::path& path) {
  struct statfs fileSystem {};
  struct stat root {};
  if (statfs(path.c_str(), &fileSystem) != 0 || stat(path.c_str(), &root) != 0) std::abort();
  return KindOf(static_cast<std::uint32_t>(fileSystem.f_type), fileSystem.f_files, root.st_dev);
}

#define SKIP_WITHOUT_MOUNTS() \
  if (geteuid() != 0 || !test::EnterOwnMountNamespace()) GTEST_SKIP() << "may not mount"

TEST(FileSystemKinds, UnknownKindsPromiseNothing) {
  const FileSystemKind& kind = KindOf(0x12345678, 1000, kDisk);
  EXPECT_EQ(kind.name, "unknown");
  EXPECT_FALSE(kind.numbersTellItemsApart);
  EXPECT_FALSE(kind.entriesTellNumbers);
  EXPECT_FALSE(kind.keepsNumbers);
  EXPECT_FALSE(kind.countsSubfolders);
  EXPECT_FALSE(kind.findsAllByHandle);
  EXPECT_EQ(kind.byNumber, ByNumber::kNone);
  EXPECT_EQ(kind.upperIDs, UpperIDs::kMixed);
  EXPECT_EQ(kind.numberBits, 64u);
}

TEST(FileSystemKinds, TheKindsOfMostDisksPromiseNearlyAll) {
  for (const std::uint32_t type : {0xEF53u, 0x58465342u, 0x9123683Eu, 0x01021994u}) {
    const FileSystemKind& kind = KindOf(type, 0, kDisk);
    EXPECT_TRUE(kind.numbersTellItemsApart) << kind.name;
    EXPECT_TRUE(kind.entriesTellNumbers) << kind.name;
    EXPECT_TRUE(kind.keepsNumbers) << kind.name;
    EXPECT_TRUE(kind.findsAllByHandle) << kind.name;
    EXPECT_EQ(kind.countsSubfolders, kind.name != "btrfs") << kind.name;
  }
  EXPECT_EQ(KindOf(0xEF53, 1000, kDisk).byNumber, ByNumber::kInode);
  EXPECT_EQ(KindOf(0x73717368, 1000, kDisk).byNumber, ByNumber::kInode);
  EXPECT_EQ(KindOf(0x58465342, 1000, kDisk).byNumber, ByNumber::kInodeAndGeneration);
  EXPECT_EQ(KindOf(0x9123683E, 0, kNoDisk).byNumber, ByNumber::kInodeAndSubvolume);
  EXPECT_EQ(KindOf(0x01021994, 1000, kNoDisk).byNumber, ByNumber::kNone);
}

TEST(FileSystemKinds, HaveNumbersOf32BitsWhereThatIsKnown) {
  for (const std::uint32_t type : {0xEF53u, 0x73717368u, 0x4244u, 0x482Bu, 0x15013346u}) {
    EXPECT_EQ(KindOf(type, 1000, kDisk).numberBits, 32u) << type;
  }
  for (const std::uint32_t type : {0x58465342u, 0x4D44u, 0x9660u, 0x01021994u}) {
    EXPECT_EQ(KindOf(type, 1000, kDisk).numberBits, 64u) << type;
  }
}

TEST(FileSystemKinds, HaveTheTypesOfTheLinuxHeaders) {
  const std::pair<std::uint32_t, std::string_view> types[] = {
      {0xEF53, "ext"},         {0x58465342, "xfs"},      {0x9123683E, "btrfs"},
      {0x01021994, "tmpfs"},   {0x73717368, "squashfs"}, {0xE0F5E1E2, "erofs"},
      {0xF2F52010, "f2fs"},    {0x4244, "hfs"},          {0x482B, "hfsplus"},
      {0x4D44, "vfat"},        {0x2011BAB0, "exfat"},    {0x9660, "iso9660"},
      {0x15013346, "udf"},     {0x6969, "nfs"},          {0x01021997, "9p"},
      {0x517B, "smb"},         {0xFF534D42, "smb"},      {0xFE534D42, "smb"},
      {0xCA451A4E, "bcachefs"}};
  for (const auto& [type, name] : types) EXPECT_EQ(KindOf(type, 1000, kDisk).name, name);
}

TEST(FileSystemKinds, NumbersOfServersAndOfSharedDevicesAreNotTrusted) {
  for (const std::uint32_t type : {0x01021997u, 0x517Bu, 0xFF534D42u, 0xFE534D42u, 0xCA451A4Eu}) {
    EXPECT_FALSE(KindOf(type, 1000, kDisk).numbersTellItemsApart) << type;
  }
  EXPECT_TRUE(KindOf(0x6969, 1000, kNoDisk).numbersTellItemsApart);
}

TEST(FileSystemKinds, FUSEIsTrustedOnADiskOnly) {
  EXPECT_TRUE(KindOf(0x65735546, 1000, kDisk).numbersTellItemsApart);
  EXPECT_FALSE(KindOf(0x65735546, 1000, kNoDisk).numbersTellItemsApart);
}

TEST(FileSystemKinds, AnOverlayIsTrustedOnlyIfItCountsInodes) {
  EXPECT_TRUE(KindOf(0x794C7630, 1000, kNoDisk).numbersTellItemsApart);
  EXPECT_FALSE(KindOf(0x794C7630, 0, kNoDisk).numbersTellItemsApart);
}

TEST(FileSystemKinds, NumbersAreFoldedWhereItemsThatShareAnIDCanBeOpened) {
  for (const std::uint32_t type : {0xEF53u, 0x58465342u, 0x73717368u, 0x4244u, 0x482Bu, 0x4D44u,
                                   0x2011BAB0u, 0x9660u, 0x15013346u}) {
    EXPECT_EQ(KindOf(type, 1000, kDisk).upperIDs, UpperIDs::kFolded) << type;
  }
  EXPECT_EQ(KindOf(0x9123683E, 0, kNoDisk).upperIDs, UpperIDs::kSubvolumes);
  for (const std::uint32_t type : {0x01021994u, 0xE0F5E1E2u, 0xF2F52010u, 0x6969u, 0x65735546u}) {
    EXPECT_EQ(KindOf(type, 1000, kDisk).upperIDs, UpperIDs::kMixed) << type;
  }
}

struct Disk {
  std::string type;
  std::vector<std::string> makeCommand;
  std::uintmax_t size;
  std::string_view kind;
};

class FileSystemKindsOnADisk : public testing::TestWithParam<Disk> {};

TEST_P(FileSystemKindsOnADisk, AreFoundByWhatStatfsSays) {
  SKIP_WITHOUT_MOUNTS();
  const Disk& disk = GetParam();
  FileSystemImage image(disk.type, disk.makeCommand, disk.size);
  if (!image.IsMade() || !test::KernelHas(disk.type)) GTEST_SKIP() << "no " << disk.type;
  ASSERT_TRUE(image.Mount());
  EXPECT_EQ(KindAt(image.Path()).name, disk.kind);
}

INSTANTIATE_TEST_SUITE_P(
    Mounted, FileSystemKindsOnADisk,
    testing::Values(Disk{"ext2", {"mkfs.ext2", "-q", "-F"}, 16 * kMebibyte, "ext"},
                    Disk{"ext3", {"mkfs.ext3", "-q", "-F"}, 16 * kMebibyte, "ext"},
                    Disk{"ext4", {"mkfs.ext4", "-q", "-F"}, 16 * kMebibyte, "ext"},
                    Disk{"xfs", {"mkfs.xfs", "-q"}, 320 * kMebibyte, "xfs"},
                    Disk{"btrfs", {"mkfs.btrfs", "-q"}, 128 * kMebibyte, "btrfs"},
                    Disk{"vfat", {"mkfs.vfat"}, 16 * kMebibyte, "vfat"}),
    [](const auto& disk) { return disk.param.type; });

TEST(FileSystemKinds, OnATmpfs) {
  SKIP_WITHOUT_MOUNTS();
  TemporaryFolder folder;
  ScopedMount mount("none", folder.Path(), "tmpfs");
  ASSERT_TRUE(mount.IsMounted());
  EXPECT_EQ(KindAt(folder.Path()).name, "tmpfs");
}

// Mounts an overlay of two folders and returns the name of its kind.
std::string NameOfOverlay(const std::filesystem::path& lower, const std::filesystem::path& upper) {
  TemporaryFolder place;
  ScopedMount overlay("none", place.Path(), "overlay", 0,
                      "lowerdir=" + lower.string() + ":" + upper.string());
  return overlay.IsMounted() ? std::string(KindAt(place.Path()).name) : "not mounted";
}

TEST(FileSystemKinds, OnAnOverlayOfTmpfs) {
  SKIP_WITHOUT_MOUNTS();
  TemporaryFolder folder;
  ScopedMount mount("none", folder.Path(), "tmpfs");
  EXPECT_EQ(NameOfOverlay(folder.MakeFolder("a"), folder.MakeFolder("b")), "overlay");
}

TEST(FileSystemKinds, OnAnOverlayOfSubvolumesWhoseNumbersRepeat) {
  SKIP_WITHOUT_MOUNTS();
  FileSystemImage image("btrfs", {"mkfs.btrfs", "-q"}, 128 * kMebibyte);
  if (!image.IsMade() || !image.Mount()) GTEST_SKIP() << "no btrfs";
  for (const std::string name : {"one", "two"}) {
    const auto subvolume = image.Path() / name;
    ASSERT_TRUE(test::RunTool({"btrfs", "subvolume", "create", subvolume.string()}));
    ASSERT_TRUE(std::filesystem::create_directory(subvolume / ("in " + name)));
  }
  EXPECT_EQ(NameOfOverlay(image.Path() / "one", image.Path() / "two"),
            "overlay that counts no inodes");
}

TEST(FileSystemKinds, OnAFolderServedByFUSE) {
  SKIP_WITHOUT_MOUNTS();
  TemporaryFolder folder, place;
  if (!test::RunTool({"bindfs", folder.Path().string(), place.Path().string()})) {
    GTEST_SKIP() << "no bindfs";
  }
  EXPECT_EQ(KindAt(place.Path()).name, "fuse");
  EXPECT_TRUE(test::RunTool({"umount", place.Path().string()}));
}

TEST(FileSystemKinds, KernelInterfacesHoldNoFiles) {
  for (const std::string_view type : {"proc", "sysfs", "devtmpfs", "anon_inodefs", "xenfs"}) {
    EXPECT_FALSE(HoldsFiles(type)) << type;
  }
  for (const std::string_view type : {"ext4", "tmpfs", "overlay", "fuse.sshfs", "a new one", ""}) {
    EXPECT_TRUE(HoldsFiles(type)) << type;
  }
}

TEST(FileSystemKinds, NetworksAndFUSENeedAServer) {
  for (const std::string_view type :
       {"nfs", "nfs4", "cifs", "9p", "vmhgfs", "fuse", "fuseblk", "fuse.sshfs"}) {
    EXPECT_TRUE(NeedsServer(type)) << type;
  }
  for (const std::string_view type : {"ext4", "tmpfs", "overlay", "btrfs", ""}) {
    EXPECT_FALSE(NeedsServer(type)) << type;
  }
}

}  // namespace
}  // namespace tallowmere::kernel
