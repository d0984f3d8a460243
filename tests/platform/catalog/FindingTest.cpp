// Finding items by id: remembered places are verified, and only the item itself is an answer.
#include <fcntl.h>
#include <sys/mount.h>
#include <sys/stat.h>

#include <filesystem>
#include <fstream>
#include <optional>

#include "platform/HostCalls.h"
#include "support/FileSystemImage.h"
#include "support/OtherKernel.h"
#include "support/OwnMountNamespace.h"
#include "support/Privileges.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

class TheCatalog : public testing::Test {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    std::filesystem::permissions(mFolder.Path(), std::filesystem::perms(0755));
    mMount.emplace("tmpfs", mFolder.MakeFolder("volume"), "tmpfs");
    ASSERT_TRUE(mMount->IsMounted());
  }
  std::string Make(const std::string& name) const { return mFolder.MakeFolder("volume/" + name); }
  std::string Top() const { return mFolder.Path() / "volume"; }
  // Returns the mount's id, straight from statx(2).
  std::uint64_t MountID() const {
    struct statx about {};
    EXPECT_EQ(statx(AT_FDCWD, Top().c_str(), 0, STATX_MNT_ID, &about), 0);
    return about.stx_mnt_id;
  }
  SInt16 Number() const { return InfoOf(Top()).volume; }
  // Both return the path of what has the id on the volume, or the result code in brackets.
  std::string FindFolder(std::uint32_t id) const { return FolderWithID(Number(), id); }
  std::string FindItem(std::uint32_t id) const { return ItemWithID(Number(), id); }

  TemporaryFolder mFolder;
  std::optional<ScopedMount> mMount;
};

TEST_F(TheCatalog, FindsFoldersWithNumbersBelow16) {
  for (int i = 0; i < 10; ++i) {
    const std::string path = Make("first/" + std::to_string(i));
    EXPECT_EQ(IDOf(path), 0xFFFFFFEF + InodeOf(path));
    EXPECT_EQ(FindFolder(IDOf(path)), path);
    EXPECT_TRUE(HoldsForNobody([&] { return FindFolder(IDOf(path)) == path; }));
  }
}

TEST_F(TheCatalog, FindsARememberedItemWhereItIsNow) {
  for (int i = 0; i < 20; ++i) Make("filler/" + std::to_string(i));
  const std::string path = Make("a/b/c");
  const std::uint32_t id = IDOf(path);
  EXPECT_EQ(FindFolder(id), path);
  std::filesystem::rename(mFolder.Path() / "volume/a/b", mFolder.Path() / "volume/d");
  EXPECT_EQ(FindFolder(id), mFolder.Path() / "volume/d/c");
}

TEST_F(TheCatalog, FindsWhatMovesInAFolderWhoseNameMeansItsParentInAUrl) {
  for (int i = 0; i < 20; ++i) Make("filler/" + std::to_string(i));
  const std::uint32_t id = IDOf(Make("a/%2E%2E/b"));
  const std::filesystem::path volume = mFolder.Path() / "volume";
  std::filesystem::rename(volume / "a/%2E%2E/b", volume / "a/%2E%2E/c");
  EXPECT_EQ(FindFolder(id), volume / "a/%2E%2E/c");
  std::filesystem::rename(volume / "a/%2E%2E", volume / "a/%2e");
  EXPECT_EQ(FindFolder(id), volume / "a/%2e/c");
}

TEST_F(TheCatalog, FindsWhatMovesBetweenThePassThatMeetsItAndTheLastLook) {
  for (int i = 0; i < 20; ++i) Make("filler/" + std::to_string(i));
  const std::string before = Make("a/folder");
  const std::string after = Make("b") + "/folder";
  for (const char* const name : {"/a", "/a/folder", "/b"}) {
    std::filesystem::permissions(Top() + name, std::filesystem::perms(0777));
  }
  const auto id = static_cast<std::uint32_t>(InodeOf(before));
  // Without privilege, as with it a handle finds the folder and no pass is made.
  EXPECT_TRUE(HoldsForNobody([&] {
    bool hasMoved = false;
    const BeforeOpenat2 looks([&](const char* path) {
      if (hasMoved || path != before) return;
      hasMoved = true;
      std::filesystem::rename(before, after);
    });
    return FindFolder(id) == after && hasMoved;
  }));
}

TEST_F(TheCatalog, DoesNotTakeAFileForAFolder) {
  for (int i = 0; i < 20; ++i) Make("filler/" + std::to_string(i));
  const std::string file = mFolder.MakeFile("volume/file");
  EXPECT_EQ(FindFolder(IDOf(file)), "(-120)");
  EXPECT_EQ(FindItem(IDOf(file)), file);
}

TEST_F(TheCatalog, KnowsTheVolumeWhereItIsMountedNow) {
  for (int i = 0; i < 20; ++i) Make("filler/" + std::to_string(i));
  const std::uint32_t id = IDOf(Make("a/b/c"));
  const std::string elsewhere = mFolder.MakeFolder("elsewhere");
  const std::string here = mFolder.Path() / "volume";
  EXPECT_EQ(FindFolder(id), here + "/a/b/c");
  ASSERT_EQ(mount(here.c_str(), elsewhere.c_str(), nullptr, MS_MOVE, nullptr), 0);
  const std::string found = FolderWithID(InfoOf(elsewhere).volume, id);
  umount2(elsewhere.c_str(), MNT_DETACH);
  EXPECT_EQ(found, elsewhere + "/a/b/c");
}

TEST_F(TheCatalog, SearchesANewVolumeThatHasTheNumberOfAFormerOne) {
  // Uses up the inode numbers below 16, which differ from their ids.
  const auto fill = [&](const std::string& folder) {
    for (int i = 0; i < 20; ++i) mFolder.MakeFolder(folder + "/" + std::to_string(i));
    return mFolder.MakeFolder(folder + "/a/b");
  };
  const auto searchFor = [&](const std::string& path) {
    return FindFolder(static_cast<std::uint32_t>(InodeOf(path)));
  };
  const std::string path = fill("volume");
  EXPECT_EQ(searchFor(path), path);
  const std::uint64_t former = MountID();
  ScopedMount other("tmpfs", mFolder.MakeFolder("other"), "tmpfs");
  fill("other");
  // The kernel assigns the lowest free mount id, which another process may hold for a while.
  for (int attempt = 0; attempt == 0 || (attempt < 1000 && MountID() != former); ++attempt) {
    mMount->Unmount();
    mMount.emplace(mFolder.Path() / "other", Top(), "", MS_BIND);
  }
  other.Unmount();
  if (MountID() != former) GTEST_SKIP() << "another mount has the number";
  EXPECT_EQ(searchFor(path), path);
}

// A file system that reuses the inode number of a deleted item for the next one.
class ReusedNumbers : public testing::Test {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    mImage.emplace("ext4", std::vector<std::string>{"mkfs.ext4", "-q", "-F"}, 16 << 20);
    if (!mImage->IsMade() || !mImage->Mount()) GTEST_SKIP() << "no ext4 image here";
  }
  std::string PathTo(const std::string& name) const { return mImage->Path() / name; }

  std::optional<FileSystemImage> mImage;
};

TEST_F(ReusedNumbers, AreNotAnsweredWithARememberedPlace) {
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

TEST_F(ReusedNumbers, DoNotLeadAReferenceToTheNewItem) {
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
}  // namespace tallowmere::test
