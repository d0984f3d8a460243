#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>
#include <unistd.h>

#include <cstring>

#include "files/ItemReference.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::files {
namespace {

using test::TemporaryFolder;

class AnItemReference : public testing::Test {
 protected:
  std::string PathOf(const char* name) const { return mFolder.Path() / name; }
  std::optional<ItemReference> Read(const char* name) const {
    return ReadItem(AT_FDCWD, PathOf(name).c_str());
  }
  bool IsAtX(const ItemReference& item) const { return IsAt(item, AT_FDCWD, PathOf("x").c_str()); }
  // One that any file system could have given for "x": neither birth nor handle.
  ItemReference PlainReferenceToX() const {
    ItemReference item{};
    struct stat about = {};
    EXPECT_EQ(lstat(PathOf("x").c_str(), &about), 0);
    item.inode = about.st_ino;
    item.device = about.st_dev;
    item.type = about.st_mode & S_IFMT;
    return item;
  }

  const TemporaryFolder mFolder;
};

TEST_F(AnItemReference, HoldsDeviceInodeAndType) {
  mFolder.MakeFile("x");
  const auto item = Read("x");
  ASSERT_TRUE(item);
  const ItemReference plain = PlainReferenceToX();
  EXPECT_EQ(item->device, plain.device);
  EXPECT_EQ(item->inode, plain.inode);
  EXPECT_EQ(item->type, static_cast<std::uint32_t>(S_IFREG));
}

TEST_F(AnItemReference, IsToALinkItself) {
  mFolder.MakeLink("x", "nowhere");
  EXPECT_EQ(Read("x")->type, static_cast<std::uint32_t>(S_IFLNK));
}

TEST_F(AnItemReference, IsNoneForAMissingItem) {
  EXPECT_FALSE(Read("x"));
}

TEST_F(AnItemReference, IsReadFromAnOpenItem) {
  mFolder.MakeFolder("x");
  const Descriptor folder(open(PathOf("x").c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  const auto item = ReadItem(folder.Get(), "");
  ASSERT_TRUE(item);
  EXPECT_TRUE(IsAtX(*item));
  EXPECT_TRUE(IsAt(*item, folder.Get(), ""));
}

TEST_F(AnItemReference, OfANewbornItemCarriesItsHandle) {
  mFolder.MakeFile("x");
  const FileHandle handle = ReadHandle(AT_FDCWD, PathOf("x").c_str());
  if (handle.size == 0) GTEST_SKIP() << "no file handles here";
  EXPECT_EQ(Read("x")->handle, handle);
}

TEST_F(AnItemReference, OfAnOldItemOnADiskIsSettledByItsBirth) {
  const auto root = ReadItem(AT_FDCWD, "/");
  ASSERT_TRUE(root);
  if (root->birthNanoseconds == kNoBirth || root->birthSeconds + 60 > time(nullptr) ||
      major(root->device) == 0) {
    GTEST_SKIP() << "the root folder is new, its birth is not known, or it is on no disk";
  }
  EXPECT_EQ(root->handle.size, 0U);
}

TEST_F(AnItemReference, IsToItsItemWithAndWithoutAHandle) {
  mFolder.MakeFile("x");
  ItemReference item = *Read("x");
  EXPECT_TRUE(IsAtX(item));
  item.handle = FileHandle{};
  EXPECT_EQ(IsAtX(item), item.birthNanoseconds != kNoBirth || item.mount != kNoMount);
}

TEST_F(AnItemReference, IsNotToAnItemThatDiffersInAnyProof) {
  mFolder.MakeFile("x");
  const ItemReference item = *Read("x");
  ItemReference other = item;
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

TEST_F(AnItemReference, WithoutAHandleIsNotToAnItemOfAnotherBirth) {
  mFolder.MakeFile("x");
  ItemReference item = *Read("x");
  item.handle = FileHandle{};
  ItemReference other = item;
  other.birthSeconds += 1;
  EXPECT_FALSE(IsAtX(other));
  other = item;
  other.birthNanoseconds -= 1;
  EXPECT_FALSE(IsAtX(other));
}

TEST_F(AnItemReference, IsToOneItemOnEveryMountWhenItsBirthIsKnown) {
  mFolder.MakeFile("x");
  ItemReference item = *Read("x");
  if (item.birthNanoseconds == kNoBirth) GTEST_SKIP() << "no birth known here";
  item.mount += 1;
  EXPECT_TRUE(IsAtX(item));
}

TEST_F(AnItemReference, WithoutBirthIsNotToAnItemWithBirth) {
  mFolder.MakeFile("x");
  if (Read("x")->birthNanoseconds == kNoBirth) GTEST_SKIP() << "no birth known here";
  ItemReference item = PlainReferenceToX();
  item.mount = Read("x")->mount;
  item.birthNanoseconds = kNoBirth;
  EXPECT_FALSE(IsAtX(item));
}

TEST(AnItemReferenceWithoutBirthAndHandle, IsToAnItemOnItsOwnMountAlone) {
  constexpr char kItem[] = "/proc/version";
  auto item = ReadItem(AT_FDCWD, kItem);
  if (!item || item->birthNanoseconds != kNoBirth) GTEST_SKIP() << "no item without a birth here";
  item->handle = FileHandle{};
  EXPECT_TRUE(IsAt(*item, AT_FDCWD, kItem));
  item->mount += 1;
  EXPECT_FALSE(IsAt(*item, AT_FDCWD, kItem));
}

TEST(PackedReference, ComesBack) {
  const auto item = ReadItem(AT_FDCWD, "/");
  ASSERT_TRUE(item);
  const FSRef packed = Pack(*item);
  const auto unpacked = Unpack(&packed);
  ASSERT_TRUE(unpacked);
  EXPECT_EQ(std::memcmp(&*unpacked, &*item, sizeof *item), 0);
}

TEST(PackedReference, IsNoneForNullForZeroAndForRubbish) {
  FSRef reference = {};
  EXPECT_FALSE(Unpack(nullptr));
  EXPECT_FALSE(Unpack(&reference));
  std::memset(&reference, 0xFF, sizeof reference);
  EXPECT_FALSE(Unpack(&reference));
}

TEST(EqualItemReferences, HaveDeviceAndInodeInCommon) {
  const ItemReference item = *ReadItem(AT_FDCWD, "/");
  ItemReference other = item;
  other.mount += 1;
  other.birthSeconds += 1;
  other.type = S_IFREG;
  other.handle.size = 8;
  EXPECT_TRUE(AreEqual(item, other));
  other.inode += 1;
  EXPECT_FALSE(AreEqual(item, other));
  other = item;
  other.device += 1;
  EXPECT_FALSE(AreEqual(item, other));
}

}  // namespace
}  // namespace tallowmere::files
