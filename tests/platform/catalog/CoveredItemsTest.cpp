// Mounts over parts of a volume, and mount points that move: an item hidden at one place of its
// volume may be visible at another.
#include <sys/mount.h>
#include <sys/stat.h>
#include <sys/syscall.h>

#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <memory>
#include <optional>
#include <vector>

#include "names/HFSNames.h"
#include "platform/HostCalls.h"
#include "support/OwnMountNamespace.h"
#include "support/Privileges.h"
#include "support/RefusedCalls.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

// Runs without privileges, so that nothing is used that the kernel reserves for the superuser.
void ExpectRoundTrip(const std::string& path) {
  const FSSpec spec = SpecOf(path);
  const auto comesBack = [&] {
    std::error_code error;
    const std::string found = ItemOf(spec);
    return found == path || std::filesystem::equivalent(found, path, error);
  };
  EXPECT_EQ(ItemOf(spec).front(), '/')
      << path << " is (" << spec.vRefNum << ", " << ParentOf(spec) << ", " << NameOf(spec) << ")";
  EXPECT_TRUE(comesBack()) << path << " came back as " << ItemOf(spec);
  EXPECT_TRUE(HoldsForNobody(comesBack)) << path;
}

class CoveredItems : public testing::Test {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    chmod(mFolder.Path().c_str(), 0755);
    mVolume.emplace("none", mFolder.MakeFolder("volume"), "tmpfs");
    ASSERT_TRUE(mVolume->IsMounted());
    mFolder.MakeFolder("volume/folder/below");
    mFolder.MakeFile("volume/folder/below/x");
    mFolder.MakeFile("volume/file", "covered");
    mFolder.MakeFile("volume/\xE6\x97\xA5", "covered");
    mFolder.MakeFile("other", "covering");
  }

  std::string PathTo(const std::string& name) const { return mFolder.Path() / name; }

  void ShowAt(const std::string& name) {
    mMounts.emplace_back(
        std::make_unique<ScopedMount>(PathTo("volume"), mFolder.MakeFolder(name), "", MS_BIND));
    ASSERT_TRUE(mMounts.back()->IsMounted());
  }
  void Cover(const std::string& name, const std::string& source = "none") {
    mMounts.emplace_back(std::make_unique<ScopedMount>(
        source, PathTo(name), source == "none" ? "tmpfs" : "", source == "none" ? 0 : MS_BIND));
    ASSERT_TRUE(mMounts.back()->IsMounted());
  }

  TemporaryFolder mFolder;
  std::optional<ScopedMount> mVolume;
  std::vector<std::unique_ptr<ScopedMount>> mMounts;
};

TEST_F(CoveredItems, ComeBackWhereAnotherMountShowsThem) {
  ShowAt("again");
  Cover("volume/folder");
  Cover("volume/file", PathTo("other"));
  Cover("volume/\xE6\x97\xA5", PathTo("other"));
  mFolder.MakeFile("volume/folder/new");
  for (const char* name : {"volume", "volume/folder", "volume/folder/new", "volume/file",
                           "volume/\xE6\x97\xA5", "again", "again/folder", "again/folder/below",
                           "again/folder/below/x", "again/file", "again/\xE6\x97\xA5"}) {
    ExpectRoundTrip(PathTo(name));
  }
}

TEST_F(CoveredItems, ComeBackWhereTheFirstPlaceShowsThem) {
  ShowAt("again");
  Cover("again/folder");
  Cover("again/file", PathTo("other"));
  for (const char* name : {"volume/folder", "volume/folder/below/x", "volume/file", "again/folder",
                           "again/file", "again/\xE6\x97\xA5"}) {
    ExpectRoundTrip(PathTo(name));
  }
}

TEST_F(CoveredItems, HaveARecordOfTheirOwn) {
  ShowAt("again");
  Cover("volume/file", PathTo("other"));
  const FSSpec covered = SpecOf(PathTo("again/file"));
  const FSSpec covering = SpecOf(PathTo("volume/file"));
  EXPECT_EQ(ParentOf(covered), ParentOf(covering));
  EXPECT_EQ(NameOf(covering), "file");
  EXPECT_NE(NameOf(covered), "file");
}

TEST_F(CoveredItems, AreFoundAgainWhenTheCoverIsGone) {
  const FSSpec spec = SpecOf(PathTo("volume/folder/below/x"));
  Cover("volume/folder");
  EXPECT_EQ(ItemOf(spec), "(-120)");
  mMounts.clear();
  EXPECT_EQ(ItemOf(spec), PathTo("volume/folder/below/x"));
}

TEST_F(CoveredItems, AreNotReachedByAFullPathWhereverTheyWereSeen) {
  mFolder.MakeFolder("volume/second");
  Cover("volume/second", PathTo("volume/folder"));
  Cover("volume/folder/below");
  const FSSpec covered = SpecOf(PathTo("volume/second/below/x"));
  FSSpec spec{};
  const Str255Of path("volume:second:below:x");
  EXPECT_EQ(FSMakeFSSpec(0, 0, path.bytes, &spec), fnfErr);
  EXPECT_NE(spec.vRefNum, covered.vRefNum);
  mFolder.MakeFile("volume/folder/below/x", "covering");
  EXPECT_EQ(FSMakeFSSpec(0, 0, path.bytes, &spec), noErr);
  EXPECT_EQ(ItemOf(spec), PathTo("volume/folder/below/x"));
}

// A name is looked up at the volume's first place, in every folder on the way.
TEST_F(CoveredItems, OfTheFirstPlaceAreReachedByAFullPathThroughAnother) {
  ShowAt("again");
  Cover("again/folder");
  const std::string covering = mFolder.MakeFile("again/folder/new");
  std::string path = NameOf(SpecOf("/")) + covering;
  std::replace(path.begin(), path.end(), '/', ':');
  FSSpec spec{};
  EXPECT_EQ(FSMakeFSSpec(0, 0, Str255Of(path).bytes, &spec), fnfErr);
  mFolder.MakeFile("volume/folder/new");
  EXPECT_EQ(FSMakeFSSpec(0, 0, Str255Of(path).bytes, &spec), noErr);
  EXPECT_EQ(spec.vRefNum, SpecOf(PathTo("volume/folder/new")).vRefNum);
}

// The volume still shows each of its folders in one place only.
TEST_F(CoveredItems, AreNoneWhereAFileOfTheVolumeIsMountedElsewhere) {
  mFolder.MakeFile("elsewhere");
  Cover("elsewhere", PathTo("volume/file"));
  const FSSpec spec = SpecOf(PathTo("volume/file"));
  EXPECT_EQ(NameOf(spec), "file");
  EXPECT_EQ(ItemOf(spec), PathTo("volume/file"));
  ExpectRoundTrip(PathTo("elsewhere"));
}

// The mount point is in another volume, which may have a folder of the same name there.
TEST_F(CoveredItems, OfAPartMountedByItselfHaveTheVolumesOwnFolder) {
  // Uses up the inode numbers below 16, which differ from their ids.
  for (int i = 0; i < 20; ++i) mFolder.MakeFolder("volume/filler/" + std::to_string(i));
  mFolder.MakeFolder("volume/inner/below");
  mFolder.MakeFolder("volume/part");
  mFolder.MakeFolder("part");
  Cover("part", PathTo("volume/inner"));
  const FSSpec inside = SpecOf(PathTo("part/below"));
  Str255 name;
  CInfoPBRec block{};
  block.dirInfo = {name, inside.vRefNum, -1, inside.parID, 0};
  ASSERT_EQ(PBGetCatInfoSync(&block), noErr);
  EXPECT_EQ(names::TextOfPascal(name), "inner");
  EXPECT_EQ(static_cast<std::uint32_t>(block.dirInfo.ioDrParID), 2U);
}

TEST_F(CoveredItems, APartThatNothingElseShowsIsTheTopOfAClimb) {
  mFolder.MakeFolder("part");
  Cover("part", PathTo("volume/folder"));
  Cover("volume");
  const FSSpec inside = SpecOf(PathTo("part/below"));
  Str255 name;
  CInfoPBRec block{};
  block.dirInfo = {name, inside.vRefNum, -1, inside.parID, 0};
  ASSERT_EQ(PBGetCatInfoSync(&block), noErr);
  EXPECT_EQ(static_cast<std::uint32_t>(block.dirInfo.ioDrParID), 1U);
}

// The current folder of a process still shows the items after a mount covers it.
class CoveredItemsInTheCurrentFolder : public CoveredItems {
 protected:
  void SetUp() override {
    CoveredItems::SetUp();
    if (IsSkipped()) return;
    mFormer = std::filesystem::current_path();
    std::filesystem::current_path(PathTo("volume/folder/below"));
  }
  void TearDown() override {
    if (!mFormer.empty()) std::filesystem::current_path(mFormer);
  }
  static OSErr MakeSpec(const std::string& path, FSSpec& spec) {
    const FSRef reference = ReferenceTo(path);
    return FSGetCatalogInfo(&reference, kFSCatInfoNone, nullptr, nullptr, &spec, nullptr);
  }

  std::filesystem::path mFormer;
};

TEST_F(CoveredItemsInTheCurrentFolder, HaveNoRecordWhereNothingShowsTheirFolder) {
  Cover("volume/folder");
  mFolder.MakeFolder("volume/folder/below");
  mFolder.MakeFile("volume/folder/below/x", "covering");
  FSSpec spec{};
  EXPECT_EQ(MakeSpec("/proc/self/cwd/x", spec), fnfErr);
  ExpectRoundTrip(PathTo("volume/folder/below/x"));
}

TEST_F(CoveredItemsInTheCurrentFolder, HaveTheirRecordWhereAnotherMountShowsTheirFolder) {
  ShowAt("again");
  Cover("volume/folder");
  mFolder.MakeFolder("volume/folder/below");
  mFolder.MakeFile("volume/folder/below/x", "covering");
  FSSpec spec{};
  ASSERT_EQ(MakeSpec("/proc/self/cwd/x", spec), noErr);
  EXPECT_EQ(ItemOf(spec), PathTo("again/folder/below/x"));
}

// A second mount of the volume shows the folder at its old path again, but without the mount in it.
TEST_F(CoveredItemsInTheCurrentFolder, HaveNoRecordWhereTheirVolumeIsMountedOverItself) {
  Cover("volume/folder/below/x", PathTo("other"));
  Cover("volume", PathTo("volume"));
  FSSpec spec{};
  EXPECT_EQ(MakeSpec("/proc/self/cwd/x", spec), fnfErr);
  ExpectRoundTrip(PathTo("volume/folder/below/x"));
}

TEST_F(CoveredItemsInTheCurrentFolder, AreNotTakenForWhatTheirPathLeadsToNow) {
  Cover("volume/folder/below/x", PathTo("other"));
  Cover("volume", PathTo("volume"));
  mFolder.MakeLink("link", "/proc/self/cwd");
  const FSCatalogInfo top = InfoOf(mFolder.Path());
  FSSpec spec{};
  EXPECT_EQ(
      FSMakeFSSpec(top.volume, static_cast<SInt32>(top.nodeID), Str255Of(":link:x").bytes, &spec),
      dirNFErr);
}

// --- Links on the way ---------------------------------------------------------------------------

// Behind a folder with search permission only, where only a remembered place leads to an item.
class ItemsBehindALink : public testing::Test {
 protected:
  void SetUp() override {
    mFolder.MakeFolder("real/closed/folder");
    mFolder.MakeFile("real/closed/folder/x");
    mFolder.MakeFile("real/closed/" + mLongName);
    chmod((mFolder.Path() / "real/closed").c_str(), 0711);
    chmod(mFolder.Path().c_str(), 0777);
    std::filesystem::create_directory_symlink("real", Link());
  }
  std::string Link() const { return mFolder.Path() / "link"; }

  const std::string mLongName = std::string(80, 'n');
  TemporaryFolder mFolder;
};

TEST_F(ItemsBehindALink, ComeBackByTheirShortForm) {
  EXPECT_TRUE(HoldsForNobody([&] {
    return ItemOf(SpecOf(Link() + "/closed/" + mLongName)) ==
           mFolder.Path() / "real/closed" / mLongName;
  }));
}

TEST_F(ItemsBehindALink, ComeBackWhenTheLinkIsGone) {
  EXPECT_TRUE(HoldsForNobody([&] {
    const FSSpec spec = SpecOf(Link() + "/closed/folder/x");
    std::filesystem::remove(Link());
    return ItemOf(spec) == mFolder.Path() / "real/closed/folder/x";
  }));
}

// The path to a folder now leads through a link and is no longer the path first used.
class CoveredItemsBehindANewLink : public CoveredItems {
 protected:
  void SetUp() override {
    CoveredItems::SetUp();
    if (IsSkipped()) return;
    // Uses up the inode numbers below 16, which differ from their ids.
    for (int i = 0; i < 20; ++i) mFolder.MakeFile("volume/" + std::to_string(i));
    mFolder.MakeFolder("volume/way/folder");
    mFolder.MakeFile("volume/way/folder/x");
    mFolder.MakeFile("volume/way/folder/\xE6\x97\xA5");
    mFolder.MakeFile("volume/source");
    mSpec = SpecOf(PathTo("volume/way/folder/x"));
    std::filesystem::rename(PathTo("volume/way"), PathTo("volume/moved"));
    std::filesystem::create_directory_symlink("moved", PathTo("volume/way"));
  }

  FSSpec mSpec{};
};

TEST_F(CoveredItemsBehindANewLink, LeaveTheirShortFormToTheirCover) {
  Cover("volume/moved/folder/\xE6\x97\xA5", PathTo("volume/source"));
  const FSSpec covering = SpecOf(PathTo("volume/way/folder/\xE6\x97\xA5"));
  EXPECT_EQ(ItemOf(SpecOf(PathTo("volume/source"))), PathTo("volume/source"));
  EXPECT_EQ(ItemOf(covering), PathTo("volume/moved/folder/\xE6\x97\xA5"));
}

TEST_F(CoveredItemsBehindANewLink, ComeBackWhereAnotherMountShowsThem) {
  ShowAt("again");
  const auto id = static_cast<std::uint32_t>(InodeOf(PathTo("volume/moved/folder/x")));
  Cover("volume/moved/folder/x", PathTo("other"));
  const FSSpec spec = MakeRecord(mSpec.vRefNum, ParentOf(mSpec), names::ShortHFSName("x", id));
  EXPECT_EQ(ItemOf(spec), PathTo("again/moved/folder/x"));
}

// --- Kernels that answer differently ------------------------------------------------------------

class ItemsInAClosedFolder : public CoveredItems {};

TEST_F(ItemsInAClosedFolder, AreFoundNearTheLastOneWithoutOpenat2) {
  // Uses up the inode numbers below 16, which differ from their ids.
  for (int i = 0; i < 20; ++i) mFolder.MakeFile("volume/" + std::to_string(i));
  mFolder.MakeFolder("volume/closed/open");
  mFolder.MakeFile("volume/closed/open/x");
  mFolder.MakeFile("volume/closed/open/y");
  chmod(PathTo("volume/closed").c_str(), 0711);
  const auto id = static_cast<std::uint32_t>(InodeOf(PathTo("volume/closed/open/y")));
  for (const int error : {ENOSYS, EPERM}) {
    EXPECT_TRUE(HoldsForNobody([&] {
      if (!RefuseCall(SYS_openat2, error)) return false;
      const FSSpec last = SpecOf(PathTo("volume/closed/open/x"));
      return ItemWithID(last.vRefNum, id) == PathTo("volume/closed/open/y");
    })) << error;
  }
}

// A process that may open by handle only thanks to its user namespace gets ESTALE for an item that
// is not below the mount it asked.
class ItemsOnTwoMounts : public CoveredItems {};

TEST_F(ItemsOnTwoMounts, AreSearchedForWhenOneMountReportsThemGone) {
  ShowAt("again");
  const FSRef reference = ReferenceTo(PathTo("again/folder/below/x"));
  std::filesystem::rename(PathTo("volume/folder/below/x"), PathTo("volume/folder/moved"));
  EXPECT_TRUE(HoldsForNobody([&] {
    return RefuseCall(SYS_open_by_handle_at, ESTALE) &&
           PathOf(reference) == PathTo("volume/folder/moved");
  }));
}

// --- A mount point that moves -------------------------------------------------------------------

class AVolumeThatMoves : public testing::Test {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    mVolume.emplace("none", mFolder.MakeFolder("a/volume"), "tmpfs");
    ASSERT_TRUE(mVolume->IsMounted());
    // Uses up the inode numbers below 16, which differ from their ids.
    for (int i = 0; i < 20; ++i) mFolder.MakeFile("a/volume/" + std::to_string(i));
    mFolder.MakeFolder("a/volume/folder/below");
    mFolder.MakeFile("a/volume/folder/below/x");
    VolumeNamed("volume");
  }
  void TearDown() override {
    if (mIsMoved) std::filesystem::rename(PathTo("b"), PathTo("a"));
  }
  void Move() {
    std::filesystem::rename(PathTo("a"), PathTo("b"));
    mIsMoved = true;
  }

  std::string PathTo(const std::string& name) const { return mFolder.Path() / name; }

  TemporaryFolder mFolder;
  std::optional<ScopedMount> mVolume;
  bool mIsMoved = false;
};

TEST_F(AVolumeThatMoves, GivesTheSameIdsAsBefore) {
  const std::uint64_t inode = InodeOf(PathTo("a/volume/folder/below"));
  Move();
  const FSSpec spec = SpecOf(PathTo("b/volume/folder/below/x"));
  EXPECT_EQ(ParentOf(spec), inode);
  EXPECT_EQ(ItemOf(spec), PathTo("b/volume/folder/below/x"));
}

TEST_F(AVolumeThatMoves, IsNotTakenForWhatIsNowInItsOldPlace) {
  const std::uint64_t inode = InodeOf(PathTo("a/volume/folder/below"));
  Move();
  mFolder.MakeFolder("a/volume/folder/below");
  const FSSpec spec = SpecOf(PathTo("b/volume/folder/below/x"));
  EXPECT_EQ(ParentOf(spec), inode);
  EXPECT_EQ(ItemOf(spec), PathTo("b/volume/folder/below/x"));
  std::filesystem::remove_all(PathTo("a"));
}

TEST_F(AVolumeThatMoves, IsSearchedWhereItIsNow) {
  const FSSpec spec = SpecOf(PathTo("a/volume/folder/below/x"));
  ASSERT_EQ(ItemOf(spec), PathTo("a/volume/folder/below/x"));
  Move();
  EXPECT_EQ(ItemOf(spec), PathTo("b/volume/folder/below/x"));
  const FSSpec root = MakeRecord(spec.vRefNum, 2, "folder");
  EXPECT_EQ(ItemOf(root), PathTo("b/volume/folder"));
}

TEST_F(AVolumeThatMoves, IsFoundByItsNumberWithoutAnEarlierRequest) {
  const SInt16 number = VolumeNamed("volume");
  ASSERT_NE(number, 0);
  const std::uint64_t inode = InodeOf(PathTo("a/volume/folder"));
  Move();
  FSSpec missing{};
  EXPECT_EQ(FSMakeFSSpec(number, 2, Str255Of("missing").bytes, &missing), fnfErr);
  EXPECT_EQ(ParentOf(missing), 2);
  FSSpec below{};
  EXPECT_EQ(FSMakeFSSpec(number, 2, Str255Of(":folder:below").bytes, &below), noErr);
  EXPECT_EQ(ParentOf(below), inode);
  EXPECT_EQ(ItemOf(below), PathTo("b/volume/folder/below"));
}

}  // namespace
}  // namespace tallowmere::test
