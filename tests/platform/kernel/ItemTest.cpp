// What distinguishes an item from others, and from a later item with the same inode number.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>
#include <unistd.h>

#include <chrono>
#include <fstream>
#include <optional>

#include "kernel/Descriptor.h"
#include "kernel/Item.h"
#include "support/FileSystemImage.h"
#include "support/MountNamespace.h"
#include "support/OtherKernel.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::kernel {
namespace {

using test::OtherTime;
using test::ScopedMount;
using test::TemporaryFolder;

class AnItemOfTheKernel : public testing::Test {
 protected:
  std::string PathOf(const char* name) const { return mFolder.Path() / name; }
  Result<Item> Read(const char* name) const { return ReadItem(AtPath(PathOf(name).c_str())); }
  bool IsAtX(const Item& item) const { return IsAt(item, AtPath(PathOf("x").c_str())); }
  // Returns whether the file system records birth times, from statx(2) itself.
  bool TellsBirths() const {
    struct statx about {};
    EXPECT_EQ(statx(AT_FDCWD, PathOf("x").c_str(), AT_SYMLINK_NOFOLLOW, STATX_BTIME, &about), 0);
    return (about.stx_mask & STATX_BTIME) != 0;
  }
  // Returns an item such as any file system could give for "x": with neither birth time nor handle.
  Item PlainReferenceToX() const {
    Item item{};
    struct stat about = {};
    EXPECT_EQ(lstat(PathOf("x").c_str(), &about), 0);
    item.inode = about.st_ino;
    item.device = about.st_dev;
    item.type = about.st_mode & S_IFMT;
    return item;
  }

  const TemporaryFolder mFolder;
};

TEST_F(AnItemOfTheKernel, HoldsDeviceInodeAndType) {
  mFolder.MakeFile("x");
  const auto item = Read("x");
  ASSERT_TRUE(item);
  const Item plain = PlainReferenceToX();
  EXPECT_EQ(item->device, plain.device);
  EXPECT_EQ(item->inode, plain.inode);
  EXPECT_EQ(item->type, static_cast<std::uint32_t>(S_IFREG));
}

TEST_F(AnItemOfTheKernel, IsToALinkItself) {
  mFolder.MakeLink("x", "nowhere");
  EXPECT_EQ(Read("x")->type, static_cast<std::uint32_t>(S_IFLNK));
}

TEST_F(AnItemOfTheKernel, IsNoneForAMissingItem) {
  const auto item = Read("x");
  ASSERT_FALSE(item);
  EXPECT_EQ(item.Error(), kNotThere);
}

TEST_F(AnItemOfTheKernel, IsReadFromAnOpenItem) {
  mFolder.MakeFolder("x");
  const Descriptor folder(open(PathOf("x").c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  const auto item = ReadItem(AtOpen(folder.Get()));
  ASSERT_TRUE(item);
  EXPECT_TRUE(IsAtX(*item));
  EXPECT_TRUE(IsAt(*item, AtOpen(folder.Get())));
}

TEST_F(AnItemOfTheKernel, IsToItsItemWithAndWithoutAHandle) {
  mFolder.MakeFile("x");
  Item item = *Read("x");
  EXPECT_TRUE(IsAtX(item));
  item.handle = FileHandle{};
  EXPECT_TRUE(IsAtX(item));
}

TEST_F(AnItemOfTheKernel, IsNotToAnItemThatDiffersInAnyProof) {
  mFolder.MakeFile("x");
  const Item item = *Read("x");
  Item other = item;
  other.inode += 1;
  EXPECT_FALSE(IsAtX(other));
  other = item;
  other.device += 1;
  EXPECT_FALSE(IsAtX(other));
  other = item;
  other.type = S_IFDIR;
  EXPECT_FALSE(IsAtX(other));
  other = item;
  other.handle.size = 8;
  other.handle.bytes[0] = static_cast<std::uint8_t>(other.handle.bytes[0] + 1);
  EXPECT_FALSE(IsAtX(other));
}

TEST_F(AnItemOfTheKernel, WithoutAHandleIsNotToAnItemOfAnotherBirth) {
  mFolder.MakeFile("x");
  Item item = *Read("x");
  item.handle = FileHandle{};
  Item other = item;
  other.birthSeconds += 1;
  EXPECT_FALSE(IsAtX(other));
  other = item;
  other.birthNanoseconds -= 1;
  EXPECT_FALSE(IsAtX(other));
}

TEST_F(AnItemOfTheKernel, IsToOneItemOnEveryMountWhenItsBirthIsKnown) {
  mFolder.MakeFile("x");
  Item item = *Read("x");
  if (!TellsBirths()) GTEST_SKIP() << "no births here";
  ASSERT_NE(item.birthNanoseconds, kNoBirth);
  item.mount += 1;
  EXPECT_TRUE(IsAtX(item));
}

TEST_F(AnItemOfTheKernel, WithoutBirthIsNotToAnItemWithBirth) {
  mFolder.MakeFile("x");
  if (!TellsBirths()) GTEST_SKIP() << "no births here";
  Item item = PlainReferenceToX();
  item.mount = Read("x")->mount;
  item.birthNanoseconds = kNoBirth;
  EXPECT_FALSE(IsAtX(item));
}

// --- What proves it -----------------------------------------------------------------------------

// On a tmpfs, a file system without a device.
class AnItemInMemory : public AnItemOfTheKernel {
 protected:
  void SetUp() override {
    if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    mMount.emplace("none", mFolder.Path(), "tmpfs");
    ASSERT_TRUE(mMount->IsMounted());
    mFolder.MakeFile("x");
  }

  std::optional<ScopedMount> mMount;
};

TEST_F(AnItemInMemory, AlwaysCarriesItsHandle) {
  const OtherTime muchLater(std::chrono::hours(24));
  EXPECT_NE(Read("x")->handle.size, 0U);
  EXPECT_EQ(Read("x")->handle, HandleAt(AtPath(PathOf("x").c_str())));
}

// File systems reuse a freed inode number at once, within one tick of the clock of birth times.
class AnItemOnADisk : public AnItemOfTheKernel {
 protected:
  void SetUp() override {
    if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    if (!test::KernelHas("ext4")) GTEST_SKIP() << "this kernel has no ext4";
    mImage.emplace("ext4", std::vector<std::string>{"mkfs.ext4", "-q", "-F"}, 8 << 20);
    if (!mImage->IsMade() || !mImage->Mount()) GTEST_SKIP() << "no ext4 image here";
    Make();
  }
  std::string Path() const { return mImage->Path() / "x"; }
  void Make() const { std::ofstream(Path()) << "x"; }
  Item ReadX() const {
    const auto item = ReadItem(AtPath(Path().c_str()));
    EXPECT_TRUE(item);
    return item ? *item : Item{};
  }

  std::optional<test::FileSystemImage> mImage;
};

// The only test that uses the machine's real clock.
TEST_F(AnItemOnADisk, ThatWasJustBornCarriesItsHandle) {
  EXPECT_NE(ReadX().handle.size, 0U);
}

TEST_F(AnItemOnADisk, CarriesItsHandleUntilTwoSecondsAfterItsBirth) {
  using std::chrono::milliseconds;
  using std::chrono::seconds;
  const auto ageNow = [this] {
    const auto sinceEpoch = std::chrono::system_clock::now().time_since_epoch();
    return sinceEpoch - seconds(ReadX().birthSeconds);
  };
  const auto readAtTheAgeOf = [&](milliseconds age) {
    const auto later = std::chrono::nanoseconds(age) - ageNow();
    const OtherTime then(later);
    return ReadX();
  };
  EXPECT_NE(readAtTheAgeOf(milliseconds(2100)).handle.size, 0U);
  EXPECT_EQ(readAtTheAgeOf(milliseconds(3100)).handle.size, 0U);
}

TEST_F(AnItemOnADisk, BornInTheFutureCarriesItsHandle) {
  const OtherTime earlier(-std::chrono::hours(24));
  EXPECT_NE(ReadX().handle.size, 0U);
}

TEST_F(AnItemOnADisk, ThatIsOldIsIdentifiedByItsBirthAlone) {
  const OtherTime later(std::chrono::hours(1));
  const Item item = ReadX();
  EXPECT_EQ(item.handle.size, 0U);
  EXPECT_TRUE(IsAt(item, AtPath(Path().c_str())));
}

TEST_F(AnItemOnADisk, IsNotTakenForItsSuccessorWithTheSameNumber) {
  const Item old = ReadX();
  std::filesystem::remove(Path());
  Make();
  const Item next = ReadX();
  ASSERT_TRUE(HaveSameNumbers(old, next)) << "the number was not taken again";
  EXPECT_FALSE(IsAt(old, AtPath(Path().c_str())));
  EXPECT_FALSE(IsProvedSame(old, next));
}

TEST_F(AnItemOnADisk, MatchesNoItemWhenItWasReplacedWhileRead) {
  auto seen = ReadStatus(AtPath(Path().c_str()));
  ASSERT_TRUE(seen);
  const Item old = ReadX();
  std::filesystem::remove(Path());
  Make();
  Item item = seen->item;
  ReadProof(item, AtPath(Path().c_str()));
  EXPECT_FALSE(IsProvedSame(item, old));
}

TEST(AnItemWithoutBirthAndHandle, MatchesOnlyOnItsOwnMount) {
  constexpr char kItem[] = "/proc/version";
  auto item = ReadItem(AtPath(kItem));
  ASSERT_TRUE(item);
  ASSERT_EQ(item->birthNanoseconds, kNoBirth);
  item->handle = FileHandle{};
  EXPECT_TRUE(IsAt(*item, AtPath(kItem)));
  item->mount += 1;
  EXPECT_FALSE(IsAt(*item, AtPath(kItem)));
}

TEST(ItemsWithTheSameNumbers, HaveDeviceAndInodeInCommon) {
  const Item item = *ReadItem(AtPath("/"));
  Item other = item;
  other.mount += 1;
  other.birthSeconds += 1;
  other.type = S_IFREG;
  other.handle.size = 8;
  EXPECT_TRUE(HaveSameNumbers(item, other));
  other.inode += 1;
  EXPECT_FALSE(HaveSameNumbers(item, other));
  other = item;
  other.device += 1;
  EXPECT_FALSE(HaveSameNumbers(item, other));
}

}  // namespace
}  // namespace tallowmere::kernel
