// FSMakeFSSpec: the record that an HFS path leads to.
#include <sys/mount.h>

#include <algorithm>
#include <cstring>
#include <vector>

#include "platform/HostCalls.h"
#include "support/OwnMountNamespace.h"
#include "support/Privileges.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

class HFSPathsToRecords : public testing::Test {
 protected:
  void SetUp() override {
    EnterOwnMountNamespace();
    mTop = mFolder.Path();
    mFolder.MakeFolder("a/b/c");
    mFolder.MakeFile("a/b/file");
    mFolder.MakeFile("a/top");
    mInfo = InfoOf(mTop + "/a/b");
  }

  OSErr Make(SInt16 volume, std::uint32_t folder, std::string_view path) {
    std::memset(&mSpec, 0xA5, sizeof mSpec);
    return FSMakeFSSpec(volume, static_cast<SInt32>(folder), Str255Of(path).bytes, &mSpec);
  }
  // Returns where a path relative to a/b leads: a path below the top, or the result in brackets.
  std::string From(std::string_view path) { return From(mInfo.volume, mInfo.nodeID, path); }
  std::string From(SInt16 volume, std::uint32_t folder, std::string_view path) {
    const OSErr error = Make(volume, folder, path);
    if (error != noErr) return "(" + std::to_string(error) + ")";
    const std::string found = ItemOf(mSpec);
    if (found == mTop) return ".";
    return found.starts_with(mTop + "/") ? found.substr(mTop.size() + 1) : found;
  }
  // Returns a Linux path as a full HFS path.
  static std::string Full(std::string path) {
    std::replace(path.begin(), path.end(), '/', ':');
    return NameOf(SpecOf("/")) + path;
  }
  bool IsUntouched() const {
    return std::string(sizeof mSpec, '\xA5') ==
           std::string(reinterpret_cast<const char*>(&mSpec), sizeof mSpec);
  }

  TemporaryFolder mFolder;
  std::string mTop;
  FSCatalogInfo mInfo{};
  FSSpec mSpec{};
};

TEST_F(HFSPathsToRecords, ANameIsOneInTheFolder) {
  EXPECT_EQ(From("file"), "a/b/file");
  EXPECT_EQ(From(":file"), "a/b/file");
  EXPECT_EQ(From("c"), "a/b/c");
  EXPECT_EQ(ParentOf(mSpec), mInfo.nodeID);
  EXPECT_EQ(mSpec.vRefNum, mInfo.volume);
}

TEST_F(HFSPathsToRecords, AnEmptyNameIsTheFolder) {
  EXPECT_EQ(From(""), "a/b");
  EXPECT_EQ(From(":"), "a/b");
  EXPECT_EQ(NameOf(mSpec), "b");
}

TEST_F(HFSPathsToRecords, AColonAtTheEndIsTheFolderItself) {
  EXPECT_EQ(From(":c:"), "a/b/c");
  EXPECT_EQ(From(Full(mTop + "/a/")), "a");
}

TEST_F(HFSPathsToRecords, FurtherColonsClimb) {
  EXPECT_EQ(From("::"), "a");
  EXPECT_EQ(From("::top"), "a/top");
  EXPECT_EQ(From(":::"), ".");
  EXPECT_EQ(From(":::a:top"), "a/top");
  EXPECT_EQ(From(":c::file"), "a/b/file");
  EXPECT_EQ(From(":c:::top"), "a/top");
  EXPECT_EQ(From(":c::"), "a/b");
}

TEST_F(HFSPathsToRecords, AboveTheRootThereIsNoFolder) {
  EXPECT_EQ(From(0, 2, "::"), "(-120)");
  EXPECT_EQ(From(std::string(200, ':')), "(-120)");
  EXPECT_TRUE(IsUntouched());
}

TEST_F(HFSPathsToRecords, AFullPathIgnoresVolumeAndFolder) {
  const std::string full = Full(mTop + "/a/b/file");
  EXPECT_EQ(From(full), "a/b/file");
  EXPECT_EQ(From(32767, 0xFFFFFFFF, full), "a/b/file");
  EXPECT_EQ(From(0, 1, full), "a/b/file");
}

TEST_F(HFSPathsToRecords, AVolumeAloneIsItsRoot) {
  const std::string root = NameOf(SpecOf("/"));
  EXPECT_EQ(From(root + ":"), "/");
  EXPECT_EQ(ParentOf(mSpec), 1U);
  EXPECT_EQ(From(0, 1, root), "/");
  EXPECT_EQ(From(root + "::"), "(-120)");
}

TEST_F(HFSPathsToRecords, AnUnknownVolumeIsReported) {
  EXPECT_EQ(From("no such volume:x"), "(-35)");
  EXPECT_EQ(From(32767, 2, "x"), "(-35)");
  EXPECT_EQ(From(32767, 0, ""), "(-35)");
  EXPECT_EQ(From(32767, 1, "x"), "(-35)");
  EXPECT_TRUE(IsUntouched());
}

TEST_F(HFSPathsToRecords, VolumeAndFolder0AreTheCurrentFolder) {
  const auto before = std::filesystem::current_path();
  std::filesystem::current_path(mTop + "/a");
  EXPECT_EQ(From(0, 0, "top"), "a/top");
  EXPECT_EQ(From(0, 0, ""), "a");
  EXPECT_EQ(From(0, 0, "::"), ".");
  std::filesystem::current_path(before);
}

TEST_F(HFSPathsToRecords, Folder0IsElseTheRoot) {
  EXPECT_EQ(From(mInfo.volume, 0, ""), From(mInfo.volume, 2, ""));
  EXPECT_EQ(ParentOf(mSpec), 1U);
}

TEST_F(HFSPathsToRecords, AMissingLastNameFillsTheRecord) {
  EXPECT_EQ(Make(mInfo.volume, mInfo.nodeID, "new\x8E"), fnfErr);
  EXPECT_EQ(mSpec.vRefNum, mInfo.volume);
  EXPECT_EQ(ParentOf(mSpec), mInfo.nodeID);
  EXPECT_EQ(NameOf(mSpec), "new\x8E");
  EXPECT_EQ(Make(mInfo.volume, mInfo.nodeID, "::new"), fnfErr);
  EXPECT_EQ(ParentOf(mSpec), IDOf(mTop + "/a"));
}

TEST_F(HFSPathsToRecords, ARecordOfAMissingItemFindsItOnceItExists) {
  EXPECT_EQ(Make(mInfo.volume, mInfo.nodeID, "later"), fnfErr);
  EXPECT_EQ(ItemOf(mSpec), "(-43)");
  const std::string path = mFolder.MakeFile("a/b/later");
  EXPECT_EQ(ItemOf(mSpec), path);
}

TEST_F(HFSPathsToRecords, AMissingNameThatFitsNoRecordIsABadName) {
  EXPECT_EQ(From(std::string(63, 'n')), "(-43)");
  EXPECT_EQ(From(std::string(64, 'n')), "(-37)");
  EXPECT_EQ(From(std::string(255, 'n')), "(-37)");
  EXPECT_EQ(From(std::string("a\0b", 3)), "(-37)");
  EXPECT_TRUE(IsUntouched());
}

TEST_F(HFSPathsToRecords, DotsAreNamesThatNothingHas) {
  EXPECT_EQ(From("."), "(-37)");
  EXPECT_EQ(From(".."), "(-37)");
  EXPECT_EQ(From(":.:file"), "(-120)");
  EXPECT_EQ(From(":..:top"), "(-120)");
  EXPECT_EQ(From(Full(mTop + "/a/b/../top")), "(-120)");
}

TEST_F(HFSPathsToRecords, ALongNameThatExistsGetsAShortRecord) {
  const std::string name(200, 'n');
  mFolder.MakeFile("a/b/" + name);
  EXPECT_EQ(From(name), "a/b/" + name);
  EXPECT_LE(mSpec.name[0], 31);
}

TEST_F(HFSPathsToRecords, AMissingFolderOnTheWayIsReported) {
  EXPECT_EQ(From(":missing:x"), "(-120)");
  EXPECT_EQ(From(":file:x"), "(-120)");
  EXPECT_EQ(From(":file:"), "(-120)");
  EXPECT_EQ(From(":missing:"), "(-120)");
  EXPECT_EQ(From(":missing::file"), "(-120)");
  EXPECT_EQ(From(mInfo.volume, IDOf(mTop + "/a/top"), "x"), "(-120)");
  EXPECT_EQ(From(mInfo.volume, 0xFFFFFFFF, "x"), "(-120)");
  EXPECT_TRUE(IsUntouched());
}

// The parent of all root folders holds only root folders.
TEST_F(HFSPathsToRecords, TheParentOfRootsHoldsNothingButTheVolumesRoot) {
  EXPECT_EQ(From(mInfo.volume, 1, "no such volume"), "(-43)");
  EXPECT_EQ(ParentOf(mSpec), 1U);
  EXPECT_EQ(NameOf(mSpec), "no such volume");
  EXPECT_EQ(From(mInfo.volume, 1, ""), "(-120)");
  EXPECT_EQ(From(mInfo.volume, 1, std::string(64, 'x')), "(-37)");
}

TEST_F(HFSPathsToRecords, LinksToFoldersOnTheWayAreFollowed) {
  ASSERT_EQ(symlink("../..", (mTop + "/a/b/up").c_str()), 0);
  ASSERT_EQ(symlink("file", (mTop + "/a/b/link").c_str()), 0);
  EXPECT_EQ(From(":up:a:top"), "a/top");
  EXPECT_EQ(ParentOf(mSpec), IDOf(mTop + "/a"));
  EXPECT_EQ(From(":up:a:new"), "(-43)");
  EXPECT_EQ(ParentOf(mSpec), IDOf(mTop + "/a"));
  EXPECT_EQ(From("up"), "a/b/up");
  EXPECT_EQ(From("link"), "a/b/link");
  EXPECT_EQ(From(":link:x"), "(-120)");
  // The climb starts from the folder that the link led to.
  EXPECT_EQ(From(":up::a"), From(Full(mTop).substr(0, Full(mTop).rfind(':')) + ":a"));
}

TEST_F(HFSPathsToRecords, ADanglingLinkOnTheWayIsAMissingFolder) {
  mFolder.MakeLink("a/b/link", "nowhere");
  EXPECT_EQ(From(":link:x"), "(-120)");
  EXPECT_TRUE(IsUntouched());
}

TEST_F(HFSPathsToRecords, ACycleOfLinksOnTheWayIsAMissingFolder) {
  mFolder.MakeLink("a/b/link", "link");
  EXPECT_EQ(From(":link:x"), "(-120)");
  EXPECT_EQ(From(0, 0, Full(mTop + "/a/b/link/x")), "(-120)");
  EXPECT_TRUE(IsUntouched());
}

TEST_F(HFSPathsToRecords, AKnownFileOnTheWayOfAFullPathIsAMissingFolder) {
  EXPECT_EQ(From(0, 0, Full(mTop + "/a/b/file")), "a/b/file");  // its place is cached from now on
  EXPECT_EQ(From(0, 0, Full(mTop + "/a/b/file/x")), "(-120)");
  EXPECT_TRUE(IsUntouched());
}

TEST_F(HFSPathsToRecords, AFullPathLeadsToTheCurrentFolders) {
  const std::string path = Full(mTop + "/a/b/file");
  EXPECT_EQ(From(path), "a/b/file");
  EXPECT_EQ(From(path), "a/b/file");
  std::filesystem::rename(mTop + "/a", mTop + "/old");
  EXPECT_EQ(From(path), "(-120)");
  mFolder.MakeFolder("other/b");
  mFolder.MakeFile("other/b/file");
  ASSERT_EQ(symlink("other", (mTop + "/a").c_str()), 0);
  EXPECT_EQ(From(path), "other/b/file");
  EXPECT_EQ(From(path), "other/b/file");
  std::filesystem::remove(mTop + "/a");
  ASSERT_EQ(symlink("old", (mTop + "/a").c_str()), 0);
  EXPECT_EQ(From(path), "old/b/file");
  EXPECT_EQ(From(Full(mTop + "/a/b/")), "old/b");
}

TEST_F(HFSPathsToRecords, AFullPathLeadsIntoANewMountOnItsWay) {
  const std::string path = Full(mTop + "/a/b/file");
  EXPECT_EQ(From(path), "a/b/file");
  const ScopedMount mounted("none", mTop + "/a/b", "tmpfs");
  if (!mounted.IsMounted()) GTEST_SKIP() << "mounting is not permitted here";
  EXPECT_EQ(From(path), "(-43)");
  mFolder.MakeFile("a/b/file");
  EXPECT_EQ(From(path), "a/b/file");
  EXPECT_NE(mSpec.vRefNum, mInfo.volume);
}

TEST_F(HFSPathsToRecords, NamesExchangeSlashesAndColons) {
  mFolder.MakeFile("a/b/x:y");
  EXPECT_EQ(From("x/y"), "a/b/x:y");
  EXPECT_EQ(From(":::a:b:x/y"), "a/b/x:y");
}

TEST_F(HFSPathsToRecords, AFolderThatMayNotBeEnteredIsReported) {
  chmod(mTop.c_str(), 0755);
  chmod((mTop + "/a/b").c_str(), 0700);
  EXPECT_TRUE(HoldsForNobody([&] { return From("file") == "(-5000)"; }));
  EXPECT_TRUE(HoldsForNobody([&] { return From(Full(mTop + "/a/b/c/x")) == "(-5000)"; }));
  EXPECT_TRUE(HoldsForNobody([&] { return From(Full(mTop + "/a/b")) == "a/b"; }));
}

TEST_F(HFSPathsToRecords, APathIntoAnotherVolumeGivesItsNumber) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const ScopedMount volume("tmpfs", mTop + "/a/b/c", "tmpfs");
  mFolder.MakeFile("a/b/c/x");
  EXPECT_EQ(From(":c:x"), "a/b/c/x");
  EXPECT_EQ(ParentOf(mSpec), 2U);
  EXPECT_NE(mSpec.vRefNum, mInfo.volume);
  EXPECT_EQ(From("c"), "a/b/c");
  EXPECT_EQ(ParentOf(mSpec), 1U);
  EXPECT_EQ(From("c:x"), "a/b/c/x");
  EXPECT_EQ(From(":c::file"), "(-120)");
}

}  // namespace
}  // namespace tallowmere::test
