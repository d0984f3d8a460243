// File handles: reading them, making them from inode numbers, and opening items by them.
#include <linux/capability.h>

#include <cstring>

#include "KernelFixture.h"
#include "kernel/FileHandle.h"
#include "support/Privileges.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::kernel {
namespace {

using test::TemporaryFolder;

constexpr std::uint64_t kTopSubvolume = 5;  // BTRFS_FS_TREE_OBJECTID in <linux/btrfs_tree.h>

// Makes a handle of inode number and generation, the form that most file systems use.
FileHandle MakeHandle(std::uint32_t inode, std::uint32_t generation) {
  FileHandle handle{1, 8, {}};
  std::memcpy(handle.bytes.data(), &inode, sizeof inode);
  std::memcpy(handle.bytes.data() + sizeof inode, &generation, sizeof generation);
  return handle;
}

TEST(FileHandle, OfAMissingItemIsAnError) {
  const TemporaryFolder folder;
  EXPECT_EQ(ReadHandle(AT_FDCWD, (folder.Path() / "x").c_str()).Error().number, ENOENT);
  EXPECT_EQ(ReadHandleToIdentify(AT_FDCWD, (folder.Path() / "x").c_str()).Error().number, ENOENT);
}

TEST(FileHandle, OfAnInodeNumberHasTheFormOfASibling) {
  EXPECT_EQ(HandleOf({4711}, MakeHandle(2, 77), 2), MakeHandle(4711, 0));
  EXPECT_EQ(HandleOf({4711, 0, 5}, MakeHandle(2, 77), 2), MakeHandle(4711, 5));
}

TEST(FileHandle, IsNotMadeFromOneOfAnotherForm) {
  FileHandle otherType = MakeHandle(2, 0);
  otherType.type = 2;
  FileHandle longer = MakeHandle(2, 0);
  longer.size = 12;
  EXPECT_EQ(HandleOf({4711}, otherType, 2), std::nullopt);
  EXPECT_EQ(HandleOf({4711}, longer, 2), std::nullopt);
  EXPECT_EQ(HandleOf({4711}, MakeHandle(3, 0), 2), std::nullopt);
  EXPECT_EQ(HandleOf({4711}, FileHandle{}, 0), std::nullopt);
}

TEST(FileHandle, WithRoomFor32BitsIsNotMadeForALongerNumber) {
  EXPECT_EQ(HandleOf({std::uint64_t{1} << 32}, MakeHandle(2, 0), 2), std::nullopt);
}

TEST(FileHandle, OfAnotherKindNamesNoSubvolume) {
  EXPECT_EQ(SubvolumeOf(MakeHandle(2, 0)), std::nullopt);
  EXPECT_EQ(SubvolumeOf(FileHandle{}), std::nullopt);
}

class AFileHandleOnExt4 : public AMountedImage {
 protected:
  void SetUp() override { MakeImage("ext4", {"mkfs.ext4", "-q", "-F"}, 16 * kMebibyte); }
};

TEST_F(AFileHandleOnExt4, OpensItsItemAndNotTheNextOneWithItsNumber) {
  const auto path = MakeFile("x");
  const std::uint64_t inode = InodeOf(path);
  const auto handle = ReadHandle(AT_FDCWD, path.c_str());
  ASSERT_TRUE(handle);
  EXPECT_TRUE(OpenByHandle(Root(), *handle));
  std::filesystem::remove(path);
  EXPECT_EQ(OpenByHandle(Root(), *handle).Error().number, ESTALE);
  ASSERT_EQ(InodeOf(MakeFile("y")), inode);
  EXPECT_EQ(OpenByHandle(Root(), *handle).Error().number, ESTALE);
}

TEST_F(AFileHandleOnExt4, OfANumberOpensFoldersAndFiles) {
  const auto folder = MakeFolder("a/b");
  const auto file = MakeFile("a/f");
  EXPECT_EQ(ErrorOfOpening({InodeOf(folder)}, folder), 0);
  EXPECT_EQ(ErrorOfOpening({InodeOf(file)}, file), 0);
  MountAgain();
  EXPECT_EQ(ErrorOfOpening({InodeOf(folder)}, folder), 0);
  EXPECT_EQ(ErrorOfOpening({InodeOf(file)}, file), 0);
}

TEST_F(AFileHandleOnExt4, OfANumberThatNoItemHasIsStale) {
  const std::uint64_t inode = InodeOf(MakeFile("x"));
  std::filesystem::remove(PathOf("x"));
  EXPECT_EQ(ErrorOfOpening({inode}), ESTALE);
  EXPECT_EQ(ErrorOfOpening({0xFFFFFFFF}), ESTALE);
}

TEST_F(AFileHandleOnExt4, IsReadByEveryoneAndOpensForThePrivilegedOnly) {
  const auto refusesToOpen = [&] {
    const auto handle = ReadHandle(Root(), "");
    return handle && OpenByHandle(Root(), *handle).Error().number == EPERM;
  };
  EXPECT_FALSE(refusesToOpen());
  EXPECT_TRUE(test::HoldsForNobody(refusesToOpen));
  EXPECT_TRUE(test::HoldsWithout(CAP_DAC_READ_SEARCH, refusesToOpen));
}

class AFileHandleOnBtrfs : public AMountedImage {
 protected:
  void SetUp() override {
    MakeImage("btrfs", {"mkfs.btrfs", "-q"}, 128 * kMebibyte);
    if (!IsSkipped()) MakeSubvolumes();
  }

  // Makes two subvolumes with the same content. Their numbers are 256 and 257.
  void MakeSubvolumes() {
    for (const std::string name : {"one", "two"}) {
      ASSERT_TRUE(test::RunTool({"btrfs", "subvolume", "create", PathOf(name).string()}));
      MakeFolder(name + "/folder");
      MakeFile(name + "/file");
    }
    MakeFolder("folder");
  }

  // Returns the subvolume of an item below the root folder, or 0 when there is none.
  std::uint64_t SubvolumeAt(const char* path) const {
    const auto handle = ReadHandle(Root(), path);
    return handle ? SubvolumeOf(*handle).value_or(0) : 0;
  }
};

TEST_F(AFileHandleOnBtrfs, NamesTheSubvolume) {
  EXPECT_EQ(SubvolumeAt(""), kTopSubvolume);
  EXPECT_EQ(SubvolumeAt("folder"), kTopSubvolume);
  EXPECT_EQ(SubvolumeAt("one"), 256u);
  EXPECT_EQ(SubvolumeAt("one/file"), 256u);
  EXPECT_EQ(SubvolumeAt("two/folder"), 257u);
}

TEST_F(AFileHandleOnBtrfs, NamesTheSubvolumeToEveryone) {
  EXPECT_TRUE(test::HoldsForNobody([&] { return SubvolumeAt("two/file") == 257; }));
}

TEST_F(AFileHandleOnBtrfs, OfNumbersOpensFoldersAndFilesOfEachSubvolume) {
  ASSERT_EQ(InodeOf(PathOf("one/file")), InodeOf(PathOf("two/file")));
  for (const bool afterMountingAgain : {false, true}) {
    if (afterMountingAgain) MountAgain();
    EXPECT_EQ(ErrorOfOpening({InodeOf(PathOf("folder")), kTopSubvolume}, PathOf("folder")), 0);
    for (const auto& [name, subvolume] : {std::pair{"one", 256}, std::pair{"two", 257}}) {
      for (const std::string item : {"", "/folder", "/file"}) {
        const auto path = PathOf(name + item);
        const HandleNumbers numbers{InodeOf(path), static_cast<std::uint64_t>(subvolume)};
        EXPECT_EQ(ErrorOfOpening(numbers, path), 0) << path;
      }
    }
  }
}

TEST_F(AFileHandleOnBtrfs, OfNumbersThatNoItemHasIsStale) {
  const std::uint64_t removed = InodeOf(PathOf("one/file"));
  std::filesystem::remove(PathOf("one/file"));
  EXPECT_EQ(ErrorOfOpening({removed, 256}), ESTALE);
  EXPECT_EQ(ErrorOfOpening({removed, 257}, PathOf("two/file")), 0);
  EXPECT_EQ(ErrorOfOpening({4711, 256}), ESTALE);
  EXPECT_EQ(ErrorOfOpening({256, 258}), ESTALE);
  EXPECT_EQ(ErrorOfOpening({256, 0}), ESTALE);
}

TEST_F(AFileHandleOnBtrfs, OfADeletedSubvolumeIsStale) {
  ASSERT_TRUE(test::RunTool({"btrfs", "subvolume", "delete", PathOf("one").string()}));
  EXPECT_EQ(ErrorOfOpening({256, 256}), ESTALE);
}

TEST_F(AFileHandleOnBtrfs, OfNumbersIsRefusedWithoutPrivileges) {
  const HandleNumbers numbers{InodeOf(PathOf("one/file")), 256};
  EXPECT_TRUE(test::HoldsForNobody([&] { return ErrorOfOpening(numbers) == EPERM; }));
}

// An image that mksquashfs makes of a folder.
class AFileHandleOnSquashfs : public AMountedImage {
 protected:
  void Make(const std::vector<std::string>& options) {
    mSource.MakeFolder("a/b");
    mSource.MakeFile("a/f", "content");
    const auto image = mSource.Path() / "image";
    std::string command = "mksquashfs " + mSource.Path().string() + " \"$0\" -noappend -quiet";
    for (const std::string& option : options) command += " " + option;
    MakeImage("squashfs", {"sh", "-c", command}, 0);
  }

 private:
  TemporaryFolder mSource;
};

TEST_F(AFileHandleOnSquashfs, OfANumberOpensFoldersAndFiles) {
  ASSERT_NO_FATAL_FAILURE(Make({}));
  if (IsSkipped()) return;
  for (const std::string name : {"a", "a/b", "a/f"}) {
    EXPECT_EQ(ErrorOfOpening({InodeOf(PathOf(name))}, PathOf(name)), 0) << name;
  }
  EXPECT_EQ(ErrorOfOpening({0}), ESTALE);
  EXPECT_EQ(ErrorOfOpening({4711}), ESTALE);
}

TEST_F(AFileHandleOnSquashfs, WithoutAnExportTableOpensNothing) {
  ASSERT_NO_FATAL_FAILURE(Make({"-no-exports"}));
  if (IsSkipped()) return;
  EXPECT_EQ(ReadHandle(Root(), "").Error().number, EOPNOTSUPP);
  const auto identity = ReadHandleToIdentify(Root(), "");
  if (!identity) GTEST_SKIP() << "no handles to identify before Linux 6.5";
  EXPECT_EQ(OpenByHandle(Root(), *identity).Error().number, ESTALE);
}

TEST(FileHandle, OfTmpfsIsNotMadeOfNumbers) {
  if (geteuid() != 0 || !test::EnterOwnMountNamespace()) GTEST_SKIP() << "may not mount";
  const TemporaryFolder folder;
  const test::ScopedMount mount("none", folder.Path(), "tmpfs");
  ASSERT_TRUE(mount.IsMounted());
  const auto root = ReadHandle(AT_FDCWD, folder.Path().c_str());
  ASSERT_TRUE(root);
  EXPECT_EQ(HandleOf({4711}, *root, InodeOf(folder.Path())), std::nullopt);
}

}  // namespace
}  // namespace tallowmere::kernel
