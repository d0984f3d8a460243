// XFS: opening items by inode number and generation.
#include <linux/capability.h>

#include "KernelFixture.h"
#include "kernel/Xfs.h"
#include "support/Privileges.h"

namespace tallowmere::kernel {
namespace {

constexpr std::uint64_t k31Bits = std::uint64_t{1} << 31;
constexpr std::uint64_t k32Bits = std::uint64_t{1} << 32;

class AnXfsVolume : public AMountedImage {
 protected:
  void SetUp() override {
    MakeImage("xfs", {"mkfs.xfs", "-q", "-d", "agcount=4"}, 320 * kMebibyte);
  }

  // Opens the item that now has the inode number. Returns 0, or the error of the step that failed.
  int ErrorOfOpeningNow(std::uint64_t inode, const std::filesystem::path& path = {}) const {
    const auto generation = ReadXfsGeneration(Root(), inode);
    if (!generation) return generation.Error().number;
    return ErrorOfOpening({inode, 0, *generation}, path);
  }

  // Makes files until one has the inode number. Returns its name, or an empty string.
  std::string NameWithInode(std::uint64_t inode) const {
    for (int i = 0; i < 1000; ++i) {
      const std::string name = "again" + std::to_string(i);
      if (InodeOf(MakeFile(name)) == inode) return name;
    }
    return "";
  }
};

TEST_F(AnXfsVolume, OpensFoldersAndFilesByNumber) {
  const auto folder = MakeFolder("a/b");
  const auto file = MakeFile("a/f");
  for (const bool afterMountingAgain : {false, true}) {
    if (afterMountingAgain) MountAgain();
    EXPECT_EQ(ErrorOfOpeningNow(InodeOf(PathOf("")), PathOf("")), 0);
    EXPECT_EQ(ErrorOfOpeningNow(InodeOf(folder), folder), 0);
    EXPECT_EQ(ErrorOfOpeningNow(InodeOf(file), file), 0);
  }
}

TEST_F(AnXfsVolume, DoesNotOpenAnItemWithAnotherGeneration) {
  const std::uint64_t inode = InodeOf(MakeFile("f"));
  const auto generation = ReadXfsGeneration(Root(), inode);
  ASSERT_TRUE(generation);
  EXPECT_EQ(ErrorOfOpening({inode, 0, *generation + 1}), ESTALE);
}

TEST_F(AnXfsVolume, HasNoGenerationForAnUnknownNumber) {
  const std::uint64_t inode = InodeOf(MakeFile("f"));
  MakeFile("next");
  std::filesystem::remove(PathOf("f"));
  EXPECT_EQ(ReadXfsGeneration(Root(), inode).Error().number, ENOENT);
  EXPECT_EQ(ReadXfsGeneration(Root(), 0).Error().number, ENOENT);
  EXPECT_EQ(ReadXfsGeneration(Root(), 1).Error().number, ENOENT);
  EXPECT_EQ(ReadXfsGeneration(Root(), 0xFFFFFFFF).Error().number, ENOENT);
  EXPECT_EQ(ReadXfsGeneration(Root(), ~std::uint64_t{0}).Error().number, ENOENT);
}

TEST_F(AnXfsVolume, ReusesANumberWithAnotherGeneration) {
  const std::uint64_t inode = InodeOf(MakeFile("f"));
  const auto before = ReadXfsGeneration(Root(), inode);
  ASSERT_TRUE(before);
  std::filesystem::remove(PathOf("f"));
  const std::string again = NameWithInode(inode);
  ASSERT_NE(again, "") << "the number was not given again";
  EXPECT_EQ(ErrorOfOpening({inode, 0, *before}), ESTALE);
  EXPECT_EQ(ErrorOfOpeningNow(inode, PathOf(again)), 0);
}

TEST_F(AnXfsVolume, WithShortNumbersHasHandlesOfAnotherForm) {
  const auto file = MakeFile("f");
  MountAgain("inode32");
  EXPECT_EQ(HandleOfRoot().size, 8u);
  EXPECT_EQ(ErrorOfOpeningNow(InodeOf(file), file), 0);
}

TEST_F(AnXfsVolume, HasNoNumberAboveTheHighest) {
  const auto highest = ReadHighestXfsInode(Root());
  ASSERT_TRUE(highest);
  // Four groups of 80 MiB are numbered like groups of 128 MiB, with eight inodes per block of 4
  // KiB.
  EXPECT_EQ(*highest, 4 * (128 * kMebibyte / 4096) * 8 - 1);
}

TEST_F(AnXfsVolume, ShowsGenerationsOnlyToAdministratorsAndItsSizeToAll) {
  const std::uint64_t inode = InodeOf(MakeFile("f"));
  const auto knowsSizeOnly = [&] {
    return ReadXfsGeneration(Root(), inode).Error().number == EPERM && ReadHighestXfsInode(Root());
  };
  EXPECT_FALSE(knowsSizeOnly());
  EXPECT_TRUE(test::HoldsForNobody(knowsSizeOnly));
  EXPECT_TRUE(test::HoldsWithout(CAP_SYS_ADMIN, knowsSizeOnly));
}

// A sparse volume with groups of 1 TiB. Inode numbers have 32 bits in the second group and more in
// later ones. XFS spreads new folders over the groups.
class ALargeXfsVolume : public AnXfsVolume {
 protected:
  void SetUp() override {
    MakeImage("xfs", {"mkfs.xfs", "-q", "-l", "size=64m"}, 8 * kMebibyte * kMebibyte);
  }
};

TEST_F(ALargeXfsVolume, OpensFoldersAndFilesWithLongNumbers) {
  bool hasMiddle = false;
  bool hasLong = false;
  for (int i = 0; i < 8; ++i) {
    const auto folder = MakeFolder(std::to_string(i));
    const auto file = MakeFile(std::to_string(i) + "/f");
    const std::uint64_t inode = InodeOf(folder);
    hasMiddle = hasMiddle || (inode >= k31Bits && inode < k32Bits);
    hasLong = hasLong || inode >= k32Bits;
    EXPECT_EQ(ErrorOfOpeningNow(inode, folder), 0) << inode;
    EXPECT_EQ(ErrorOfOpeningNow(InodeOf(file), file), 0) << InodeOf(file);
  }
  EXPECT_TRUE(hasMiddle);
  EXPECT_TRUE(hasLong);
}

TEST_F(ALargeXfsVolume, HasLongNumbers) {
  const auto highest = ReadHighestXfsInode(Root());
  ASSERT_TRUE(highest);
  EXPECT_EQ(*highest, 8 * k31Bits - 1);
}

TEST(Xfs, AsksNoOtherKind) {
  const Descriptor root(open("/dev", O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  ASSERT_TRUE(root.IsOpen());
  EXPECT_EQ(ReadXfsGeneration(root.Get(), 128).Error().number, ENOTTY);
  EXPECT_EQ(ReadHighestXfsInode(root.Get()).Error().number, ENOTTY);
}

TEST(Xfs, NeedsAFolderThatIsOpenForReading) {
  const Descriptor root(open("/", O_PATH | O_DIRECTORY | O_CLOEXEC));
  ASSERT_TRUE(root.IsOpen());
  EXPECT_EQ(ReadXfsGeneration(root.Get(), 128).Error().number, EBADF);
}

}  // namespace
}  // namespace tallowmere::kernel
