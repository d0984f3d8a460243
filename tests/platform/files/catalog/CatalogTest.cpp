// From id to place: what was remembered is verified, and nothing but the item itself is an answer.
#include <sys/mount.h>

#include "CatalogFixture.h"
#include "support/FileSystemImage.h"

namespace tallowmere::files {
namespace {

using test::EnterOwnMountNamespace;
using test::FileSystemImage;
using test::ScopedMount;
using test::TemporaryFolder;

class TheCatalog : public testing::Test {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    mMount.emplace("tmpfs", mFolder.MakeFolder("volume"), "tmpfs");
    ASSERT_TRUE(mMount->IsMounted());
  }
  std::string Make(const std::string& name) const { return mFolder.MakeFolder("volume/" + name); }
  VolumePointer Volume() const {
    const std::string path = mFolder.Path() / "volume";
    return MountTable::OfThisProcess().OfItem(*ReadItem(AT_FDCWD, path.c_str()), path);
  }
  std::string Find(std::uint32_t id, bool folder = true) const {
    const auto place = FindItem(Volume(), id, folder);
    return place ? place->path : "(none)";
  }

  TemporaryFolder mFolder;
  std::optional<ScopedMount> mMount;
};

TEST_F(TheCatalog, FindsFoldersWithNumbersBelow16ByTheirMixedIDs) {
  for (int i = 0; i < 10; ++i) {
    const std::string path = Make("first/" + std::to_string(i));
    EXPECT_EQ(Find(IDOf(path)), path);
  }
}

TEST_F(TheCatalog, FindsARememberedItemWhereItIsNow) {
  for (int i = 0; i < 20; ++i) Make("filler/" + std::to_string(i));
  const std::string path = Make("a/b/c");
  const std::uint32_t id = IDOf(path);
  EXPECT_EQ(Find(id), path);
  std::filesystem::rename(mFolder.Path() / "volume/a/b", mFolder.Path() / "volume/d");
  EXPECT_EQ(Find(id), mFolder.Path() / "volume/d/c");
}

TEST_F(TheCatalog, FindsWhatMovesInAFolderWhoseNameIsTheFolderAboveInAUrl) {
  for (int i = 0; i < 20; ++i) Make("filler/" + std::to_string(i));
  const std::uint32_t id = IDOf(Make("a/%2E%2E/b"));
  const std::filesystem::path volume = mFolder.Path() / "volume";
  std::filesystem::rename(volume / "a/%2E%2E/b", volume / "a/%2E%2E/c");
  EXPECT_EQ(Find(id), volume / "a/%2E%2E/c");
  std::filesystem::rename(volume / "a/%2E%2E", volume / "a/%2e");
  EXPECT_EQ(Find(id), volume / "a/%2e/c");
}

TEST_F(TheCatalog, DoesNotTakeAFileForAFolder) {
  for (int i = 0; i < 20; ++i) Make("filler/" + std::to_string(i));
  const std::string file = mFolder.MakeFile("volume/file");
  EXPECT_EQ(Find(IDOf(file), true), "(none)");
  EXPECT_EQ(Find(IDOf(file), false), file);
}

TEST_F(TheCatalog, KnowsTheVolumeWhereItIsMountedNow) {
  for (int i = 0; i < 20; ++i) Make("filler/" + std::to_string(i));
  const std::uint32_t id = IDOf(Make("a/b/c"));
  const std::string elsewhere = mFolder.MakeFolder("elsewhere");
  const std::string here = mFolder.Path() / "volume";
  EXPECT_EQ(Find(id), here + "/a/b/c");
  ASSERT_EQ(mount(here.c_str(), elsewhere.c_str(), nullptr, MS_MOVE, nullptr), 0);
  const VolumePointer volume =
      MountTable::OfThisProcess().OfItem(*ReadItem(AT_FDCWD, elsewhere.c_str()), elsewhere);
  const auto place = FindItem(volume, id, true);
  umount2(elsewhere.c_str(), MNT_DETACH);
  ASSERT_TRUE(place);
  EXPECT_EQ(place->path, elsewhere + "/a/b/c");
}

TEST_F(TheCatalog, SearchesANewVolumeThatHasTheNumberOfAFormerOne) {
  // The first numbers are too low to be ids.
  const auto fill = [&](const std::string& folder) {
    for (int i = 0; i < 20; ++i) mFolder.MakeFolder(folder + "/" + std::to_string(i));
    return mFolder.MakeFolder(folder + "/a/b");
  };
  const auto searchFor = [&](const std::string& path) {
    return Find(static_cast<std::uint32_t>(ReadItem(AT_FDCWD, path.c_str())->inode));
  };
  const std::string path = fill("volume");
  EXPECT_EQ(searchFor(path), path);
  const VolumeNumber number = Volume()->Number();
  const auto mountID = [&] {
    return ReadItem(AT_FDCWD, (mFolder.Path() / "volume").c_str())->mount;
  };
  const std::int32_t former = mountID();

  ScopedMount other("tmpfs", mFolder.MakeFolder("other"), "tmpfs");
  fill("other");
  // The kernel gives the lowest free number, which another process can have taken for a while.
  for (int attempt = 0; attempt == 0 || (attempt < 1000 && mountID() != former); ++attempt) {
    mMount->Unmount();
    mMount.emplace(mFolder.Path() / "other", mFolder.Path() / "volume", "", MS_BIND);
  }
  other.Unmount();
  if (Volume()->Number() != number) GTEST_SKIP() << "another mount has the number";
  EXPECT_EQ(searchFor(path), path);
}

// A file system that gives the number of a deleted item to the next one.
class NumbersThatAreTakenAgain : public testing::Test {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    mImage.emplace("ext4", std::vector<std::string>{"mkfs.ext4", "-q", "-F"}, 16 << 20);
    if (!mImage->IsMade() || !mImage->Mount()) GTEST_SKIP() << "no ext4 image here";
  }
  std::string PathTo(const std::string& name) const { return mImage->Path() / name; }

  std::optional<FileSystemImage> mImage;
};

TEST_F(NumbersThatAreTakenAgain, AreNotAnsweredWithARememberedPlace) {
  std::filesystem::create_directory(PathTo("old"));
  const FSCatalogInfo info = InfoOf(PathTo("old"));
  std::filesystem::remove(PathTo("old"));
  std::ofstream(PathTo("new")) << "x";
  ASSERT_EQ(IDOf(PathTo("new")), info.nodeID) << "the number was not taken again";

  FSRef found{};
  ASSERT_EQ(FSResolveNodeID(info.volume, info.nodeID, &found), noErr);
  EXPECT_EQ(PathOf(found), PathTo("new"));
  EXPECT_EQ(ItemOf(MakeRecord(info.volume, info.nodeID, "x")), "(-120)");
}

TEST_F(NumbersThatAreTakenAgain, DoNotMakeAReferenceOneToTheNewItem) {
  std::ofstream(PathTo("file")) << "old";
  const FSRef old = ReferenceTo(PathTo("file"));
  const std::uint32_t id = IDOf(PathTo("file"));
  std::filesystem::remove(PathTo("file"));
  std::ofstream(PathTo("file")) << "new";
  ASSERT_EQ(IDOf(PathTo("file")), id) << "the number was not taken again";
  FSSpec spec{};
  EXPECT_EQ(FSGetCatalogInfo(&old, kFSCatInfoNone, nullptr, nullptr, &spec, nullptr), fnfErr);
}

}  // namespace
}  // namespace tallowmere::files
