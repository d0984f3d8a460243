// Where an index finds items, whichever folder it starts from.
#include <sys/mount.h>

#include "FolderIndexFixture.h"

namespace tallowmere::catalog {
namespace {

using test::EnterOwnMountNamespace;
using test::ScopedMount;
using test::TemporaryFolder;

class AFolderIndex : public testing::Test {
 protected:
  kernel::Item ItemAt(const std::string& name) const { return ItemOf(mFolder.Path() / name); }
  // Checks that a search from a folder finds the item at `name`, which must exist.
  void ExpectFoundFrom(const std::string& start, const std::string& name) const {
    EXPECT_EQ(Search(ItemAt(name), mFolder.Path() / start), mFolder.Path() / name);
  }

  // Searches with a new index of the item's volume.
  std::optional<std::string> Search(const kernel::Item& item, const std::string& start) const {
    volumes::VolumeTable table;
    const auto volume = VolumeOf(table, start);
    if (!volume) return "(on no volume)";
    const SearchedItem wanted{volume->IDOf(item), &item, kernel::IsFolder(item)};
    return FolderIndex(volume).Find(wanted, start, *table.Now());
  }

  const TemporaryFolder mFolder;
};

TEST_F(AFolderIndex, FindsAnItemInItsStart) {
  mFolder.MakeFolder("a");
  mFolder.MakeFile("a/x");
  mFolder.MakeFile("a/y");
  ExpectFoundFrom("a", "a/x");
}

TEST_F(AFolderIndex, FindsAnItemBelowBesideAndAbove) {
  mFolder.MakeFolder("a/b/c/d");
  mFolder.MakeFolder("a/e/f");
  mFolder.MakeFile("a/b/c/d/x");
  mFolder.MakeFile("a/e/f/y");
  mFolder.MakeFile("z");
  for (const char* start : {"a", "a/b", "a/b/c", "a/e/f"}) {
    for (const char* name : {"a/b/c/d/x", "a/e/f/y", "z"}) ExpectFoundFrom(start, name);
  }
}

TEST_F(AFolderIndex, FindsAFolderAndItsOwnStart) {
  mFolder.MakeFolder("a/b/c");
  mFolder.MakeFolder("d");
  for (const char* name : {"a", "a/b", "a/b/c", "d"}) ExpectFoundFrom("a/b", name);
}

TEST_F(AFolderIndex, FindsEveryKindOfItem) {
  mFolder.MakeFolder("a");
  mFolder.MakeLink("a/link", "nowhere");
  ASSERT_EQ(mkfifo((mFolder.Path() / "a/pipe").c_str(), 0600), 0);
  mFolder.MakeFile("a/\xFF\n: name");
  for (const char* name : {"a/link", "a/pipe", "a/\xFF\n: name"}) ExpectFoundFrom("", name);
}

TEST_F(AFolderIndex, FindsItemsInFoldersWhoseNamesBeginWithDots) {
  for (const std::string folder : {".a", "..a", "..."}) {
    mFolder.MakeFolder(folder);
    mFolder.MakeFile(folder + "/x");
    ExpectFoundFrom("", folder + "/x");
  }
}

TEST_F(AFolderIndex, FollowsNoLinkToAFolder) {
  mFolder.MakeFolder("a");
  mFolder.MakeFolder("b");
  mFolder.MakeFile("b/x");
  mFolder.MakeLink("a/link", "../b");
  mFolder.MakeLink("a/loop", "..");
  ExpectFoundFrom("a", "b/x");
}

TEST_F(AFolderIndex, SkipsFoldersWithoutAPathFromTheRoot) {
  mFolder.MakeFolder("a");
  mFolder.MakeFolder("b");
  mFolder.MakeFile("b/x");
  kernel::Descriptor folder(
      open((mFolder.Path() / "a").c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  const std::string name(250, 'd');
  for (int depth = 0; depth < 20; ++depth) {
    ASSERT_EQ(mkdirat(folder.Get(), name.c_str(), 0700), 0);
    folder =
        kernel::Descriptor(openat(folder.Get(), name.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  }
  ExpectFoundFrom("a", "b/x");
}

// Uses a volume of its own, so that a pass over it ends soon.
class AFolderIndexOfAVolume : public AFolderIndex {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    mVolume.emplace("tmpfs", mFolder.MakeFolder("volume"), "tmpfs");
    ASSERT_TRUE(mVolume->IsMounted());
    mFolder.MakeFolder("volume/a/mounted");
    mFolder.MakeFile("volume/a/x");
  }

  std::string PathOf(const std::string& name) const { return mFolder.Path() / name; }

  std::optional<ScopedMount> mVolume;
};

TEST_F(AFolderIndexOfAVolume, EndsWhenTheItemIsGone) {
  const kernel::Item item = ItemAt("volume/a/x");
  std::filesystem::remove(PathOf("volume/a/x"));
  EXPECT_EQ(Search(item, PathOf("volume/a")), std::nullopt);
  EXPECT_EQ(Search(item, PathOf("volume")), std::nullopt);
}

TEST_F(AFolderIndexOfAVolume, PrefersAnItemsOwnPlaceToASecondMount) {
  const kernel::Item item = ItemAt("volume/a/x");
  std::filesystem::rename(PathOf("volume/a"), PathOf("volume/b"));
  // The same files again, at another mount.
  const ScopedMount again(PathOf("volume/b"), mFolder.MakeFolder("volume/first"), "", MS_BIND);
  ASSERT_TRUE(again.IsMounted());
  EXPECT_EQ(Search(item, PathOf("volume")), PathOf("volume/b/x"));
}

TEST_F(AFolderIndexOfAVolume, DoesNotTakeACoveredFolderForItsCover) {
  const kernel::Item covered = ItemAt("volume/a/mounted");
  const ScopedMount cover("tmpfs", PathOf("volume/a/mounted"), "tmpfs");
  ASSERT_TRUE(cover.IsMounted());
  EXPECT_EQ(Search(covered, PathOf("volume")), std::nullopt);
}

TEST_F(AFolderIndexOfAVolume, StaysBelowItsRoot) {
  mFolder.MakeFile("outside");
  const kernel::Item outside = ItemAt("outside");
  kernel::Item item = outside;
  item.mount = ItemAt("volume/a/x").mount;
  EXPECT_EQ(Search(item, PathOf("volume/a")), std::nullopt);
}

}  // namespace
}  // namespace tallowmere::catalog
