#include <CoreServices/CoreServices.h>
#include <fcntl.h>
#include <gtest/gtest.h>
#include <linux/capability.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstring>
#include <filesystem>

#include "files/Catalog.h"
#include "platform/foundation/TestStrings.h"
#include "support/OwnMountNamespace.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

using foundation::test::MakeUrl;
using foundation::test::ParseUrl;

// The FSRef of what is at a path; all zero when there is none.
FSRef ReferenceTo(const std::string& path) {
  FSRef item = {};
  CFURLGetFSRef(MakeUrl(path, false).Get(), &item);
  return item;
}

bool HasReference(CFURLRef url) {
  FSRef item = {};
  return CFURLGetFSRef(url, &item) != 0;
}

// Where the item is now.
std::optional<std::string> PlaceOf(const FSRef& item) {
  const CFOwned url(CFURLCreateFromFSRef(kCFAllocatorDefault, &item));
  if (!url) return std::nullopt;
  return foundation::test::PathOf(url);
}

class AReferenceToAnItem : public testing::Test {
 protected:
  std::string PathOf(const std::string& name) const { return mFolder.Path() / name; }
  void Move(const std::string& from, const std::string& to) const {
    ASSERT_EQ(rename(PathOf(from).c_str(), PathOf(to).c_str()), 0);
  }

  const TemporaryFolder mFolder;
};

// --- Taking one -------------------------------------------------------------------------------

TEST_F(AReferenceToAnItem, IsTakenFromAFileUrl) {
  mFolder.MakeFile("x");
  EXPECT_TRUE(HasReference(MakeUrl(PathOf("x"), false).Get()));
  EXPECT_TRUE(HasReference(ParseUrl("file://localhost/").Get()));
}

TEST_F(AReferenceToAnItem, IsNotTakenFromAnotherUrl) {
  EXPECT_FALSE(HasReference(ParseUrl("http://localhost/").Get()));
  EXPECT_FALSE(HasReference(ParseUrl("file://elsewhere/").Get()));
  EXPECT_FALSE(HasReference(ParseUrl("mailto:x").Get()));
  EXPECT_FALSE(HasReference(ParseUrl("file:///%00").Get()));
}

TEST_F(AReferenceToAnItem, IsNotTakenFromWhatIsMissing) {
  mFolder.MakeFile("x");
  EXPECT_FALSE(HasReference(MakeUrl(PathOf("y"), false).Get()));
  EXPECT_FALSE(HasReference(MakeUrl(PathOf("x/y"), false).Get()));
  EXPECT_FALSE(HasReference(MakeUrl("/" + std::string(5000, 'x'), false).Get()));
  EXPECT_FALSE(HasReference(MakeUrl(PathOf(std::string(256, 'x')), false).Get()));
}

TEST_F(AReferenceToAnItem, IsToADanglingLinkItself) {
  mFolder.MakeLink("link", "nowhere");
  const FSRef item = ReferenceTo(PathOf("link"));
  EXPECT_EQ(PlaceOf(item), PathOf("link"));
}

TEST_F(AReferenceToAnItem, IsToALinkItselfThoughAFolderIsMeant) {
  mFolder.MakeFolder("folder");
  mFolder.MakeLink("link", "folder");
  FSRef item = {};
  ASSERT_TRUE(CFURLGetFSRef(MakeUrl(PathOf("link"), true).Get(), &item));
  EXPECT_EQ(PlaceOf(item), PathOf("link"));
  CFURLGetFSRef(ParseUrl("file://" + PathOf("link") + "//").Get(), &item);
  EXPECT_EQ(PlaceOf(item), PathOf("link"));
}

TEST_F(AReferenceToAnItem, IsFoundThroughLinksOnTheWay) {
  mFolder.MakeFolder("folder");
  mFolder.MakeFile("folder/x");
  mFolder.MakeLink("link", "folder");
  EXPECT_EQ(PlaceOf(ReferenceTo(PathOf("link/x"))), PathOf("folder/x"));
  EXPECT_EQ(PlaceOf(ReferenceTo(PathOf("link/."))), PathOf("folder"));
  EXPECT_EQ(PlaceOf(ReferenceTo(PathOf("link/.."))), mFolder.Path());
}

TEST_F(AReferenceToAnItem, OfARelativeUrlIsSeenFromTheFolderOfItsMaking) {
  mFolder.MakeFolder("folder");
  mFolder.MakeFile("folder/x");
  const auto former = std::filesystem::current_path();
  std::filesystem::current_path(PathOf("folder"));
  const auto url = MakeUrl("x", false);
  std::filesystem::current_path(former);
  FSRef item = {};
  ASSERT_TRUE(CFURLGetFSRef(url.Get(), &item));
  EXPECT_EQ(PlaceOf(item), PathOf("folder/x"));
}

// --- The URL of one ---------------------------------------------------------------------------

TEST_F(AReferenceToAnItem, GivesAUrlWithTheFolderMarkExactlyForAFolder) {
  mFolder.MakeFile("x");
  mFolder.MakeLink("link", "/");
  for (const std::string& path : {PathOf("x"), PathOf("link"), mFolder.Path().string()}) {
    const FSRef item = ReferenceTo(path);
    const CFOwned url(CFURLCreateFromFSRef(kCFAllocatorDefault, &item));
    EXPECT_TRUE(CFEqual(url.Get(), MakeUrl(path, path == mFolder.Path()).Get())) << path;
    EXPECT_EQ(CFGetRetainCount(url.Get()), 1);
  }
}

TEST_F(AReferenceToAnItem, GivesThePathOfAnyName) {
  for (const char* name : {"\xFF\xFE", "e\xCC\x81", "a\nb", ":", "%41", "\xED\xA0\x80"}) {
    mFolder.MakeFile(name);
    EXPECT_EQ(PlaceOf(ReferenceTo(PathOf(name))), PathOf(name));
  }
}

TEST_F(AReferenceToAnItem, OfTheRootGivesTheRoot) {
  EXPECT_EQ(PlaceOf(ReferenceTo("/")), "/");
  EXPECT_EQ(PlaceOf(ReferenceTo("/..")), "/");
}

TEST(AReferenceToNothing, GivesNoUrl) {
  const FSRef nothing = {};
  FSRef rubbish;
  std::memset(&rubbish, 0xFF, sizeof rubbish);
  EXPECT_EQ(CFURLCreateFromFSRef(kCFAllocatorDefault, &nothing), nullptr);
  EXPECT_EQ(CFURLCreateFromFSRef(kCFAllocatorDefault, &rubbish), nullptr);
  EXPECT_EQ(CFURLCreateFromFSRef(kCFAllocatorDefault, nullptr), nullptr);
}

// --- Following the item -----------------------------------------------------------------------

TEST_F(AReferenceToAnItem, FollowsItsRename) {
  mFolder.MakeFile("x");
  const FSRef item = ReferenceTo(PathOf("x"));
  Move("x", "y");
  EXPECT_EQ(PlaceOf(item), PathOf("y"));
  Move("y", "z");
  EXPECT_EQ(PlaceOf(item), PathOf("z"));
}

TEST_F(AReferenceToAnItem, FollowsTheRenameOfItsFolder) {
  mFolder.MakeFolder("a/b");
  mFolder.MakeFile("a/b/x");
  const FSRef file = ReferenceTo(PathOf("a/b/x"));
  const FSRef folder = ReferenceTo(PathOf("a/b"));
  Move("a", "c");
  EXPECT_EQ(PlaceOf(file), PathOf("c/b/x"));
  EXPECT_EQ(PlaceOf(folder), PathOf("c/b"));
}

TEST_F(AReferenceToAnItem, FollowsItsMoveToAnotherFolder) {
  mFolder.MakeFolder("a");
  mFolder.MakeFolder("b/c");
  mFolder.MakeFile("a/x");
  const FSRef item = ReferenceTo(PathOf("a/x"));
  Move("a/x", "b/c/y");
  EXPECT_EQ(PlaceOf(item), PathOf("b/c/y"));
}

TEST_F(AReferenceToAnItem, IsNotTakenForWhatTakesItsName) {
  mFolder.MakeFile("x");
  mFolder.MakeFile("y");
  const FSRef item = ReferenceTo(PathOf("x"));
  Move("x", "z");
  Move("y", "x");
  EXPECT_EQ(PlaceOf(item), PathOf("z"));
}

TEST_F(AReferenceToAnItem, IsNotTakenForALinkInItsPlaceThatLeadsToIt) {
  mFolder.MakeFile("x");
  const FSRef item = ReferenceTo(PathOf("x"));
  Move("x", "y");
  mFolder.MakeLink("x", "y");
  EXPECT_EQ(PlaceOf(item), PathOf("y"));
}

TEST_F(AReferenceToAnItem, GivesTheCanonicalPathAlsoAfterALinkCameIntoTheWay) {
  mFolder.MakeFolder("a");
  mFolder.MakeFile("a/x");
  const FSRef item = ReferenceTo(PathOf("a/x"));
  ASSERT_EQ(PlaceOf(item), PathOf("a/x"));
  Move("a", "b");
  mFolder.MakeLink("a", "b");
  EXPECT_EQ(PlaceOf(item), PathOf("b/x"));
}

TEST_F(AReferenceToAnItem, OfTwoNamesGivesTheOneLastSeen) {
  mFolder.MakeFile("x");
  ASSERT_EQ(link(PathOf("x").c_str(), PathOf("y").c_str()), 0);
  const FSRef first = ReferenceTo(PathOf("x"));
  EXPECT_EQ(PlaceOf(first), PathOf("x"));
  const FSRef second = ReferenceTo(PathOf("y"));
  EXPECT_EQ(PlaceOf(second), PathOf("y"));
  EXPECT_EQ(FSCompareFSRefs(&first, &second), noErr);
}

// Takes from this process the privilege to open by handle.
bool GiveUpOpeningByHandle() {
  __user_cap_header_struct header{_LINUX_CAPABILITY_VERSION_3, 0};
  __user_cap_data_struct sets[_LINUX_CAPABILITY_U32S_3] = {};
  if (syscall(SYS_capget, &header, sets) != 0) return false;
  sets[0].effective &= ~(1U << CAP_DAC_READ_SEARCH);
  return syscall(SYS_capset, &header, sets) == 0;
}

TEST_F(AReferenceToAnItem, FollowsItsRenameInAProcessWithoutPrivileges) {
  mFolder.MakeFolder("a");
  mFolder.MakeFolder("b/c");
  mFolder.MakeFile("a/x");
  const FSRef item = ReferenceTo(PathOf("a/x"));
  Move("a/x", "b/c/y");
  const pid_t child = fork();
  if (child == 0) _exit(GiveUpOpeningByHandle() && PlaceOf(item) == PathOf("b/c/y") ? 0 : 1);
  int status = 0;
  waitpid(child, &status, 0);
  EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0);
}

// As an item that was old when its reference was taken.
TEST_F(AReferenceToAnItem, WithoutAHandleFollowsItsRename) {
  mFolder.MakeFolder("a");
  mFolder.MakeFile("x");
  auto item = files::ReadItem(AT_FDCWD, PathOf("x").c_str());
  ASSERT_TRUE(item);
  item->handle = files::FileHandle{};
  files::RememberPlace({PathOf("x"), *item});
  Move("x", "a/y");
  EXPECT_EQ(files::FindCanonicalPath(*item), PathOf("a/y"));
}

// On a volume of its own, so that looking for what is gone comes to an end soon.
class AReferenceOnAVolume : public AReferenceToAnItem {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    mVolume.emplace("tmpfs", mFolder.MakeFolder("volume"), "tmpfs");
    ASSERT_TRUE(mVolume->IsMounted());
  }

  std::optional<ScopedMount> mVolume;
};

TEST_F(AReferenceOnAVolume, GivesNoUrlWhenTheItemIsGone) {
  mFolder.MakeFile("volume/x");
  const FSRef item = ReferenceTo(PathOf("volume/x"));
  std::filesystem::remove(PathOf("volume/x"));
  EXPECT_EQ(PlaceOf(item), std::nullopt);
}

TEST_F(AReferenceOnAVolume, GivesNoUrlWhenTheItemIsOnAnotherVolumeNow) {
  mFolder.MakeFile("volume/x");
  const FSRef item = ReferenceTo(PathOf("volume/x"));
  std::filesystem::copy(PathOf("volume/x"), PathOf("x"));
  std::filesystem::remove(PathOf("volume/x"));
  EXPECT_EQ(PlaceOf(item), std::nullopt);
}

TEST_F(AReferenceOnAVolume, GivesNoUrlWhenTheVolumeIsGone) {
  mFolder.MakeFile("volume/x");
  const FSRef item = ReferenceTo(PathOf("volume/x"));
  mVolume->Unmount();
  mFolder.MakeFile("volume/x");
  EXPECT_EQ(PlaceOf(item), std::nullopt);
}

TEST_F(AReferenceOnAVolume, HoldsNothingThatKeepsTheVolumeMounted) {
  mFolder.MakeFolder("volume/a");
  mFolder.MakeFile("volume/x");
  const FSRef item = ReferenceTo(PathOf("volume/x"));
  Move("volume/x", "volume/a/y");
  ASSERT_EQ(PlaceOf(item), PathOf("volume/a/y"));
  EXPECT_EQ(umount2(PathOf("volume").c_str(), 0), 0) << std::strerror(errno);
}

TEST_F(AReferenceOnAVolume, FindsItsItemThoughItsPlaceIsForgotten) {
  mFolder.MakeFolder("volume/a/b");
  mFolder.MakeFile("volume/a/b/x");
  const FSRef item = ReferenceTo(PathOf("volume/a/b/x"));
  files::ItemReference other{};
  for (other.inode = 0; other.inode < 50000; ++other.inode) {
    files::RememberPlace({"/a place with a path that is as long as usual/and a name", other});
  }
  EXPECT_EQ(PlaceOf(item), PathOf("volume/a/b/x"));
}

TEST_F(AReferenceOnAVolume, FindsItsItemFromTheRootWhenNoFolderOfItsPlaceIsThere) {
  mFolder.MakeFolder("volume/a");
  mFolder.MakeFile("volume/a/x");
  const FSRef item = ReferenceTo(PathOf("volume/a/x"));
  files::RememberPlace({"/no such folder/x", *files::Unpack(&item)});
  EXPECT_EQ(PlaceOf(item), PathOf("volume/a/x"));
}

// File systems give a freed inode number away at once, within one tick of the clock of births.
TEST_F(AReferenceToAnItem, ThatIsDeletedIsNotTakenForANewItemOfItsNameAndNumber) {
  int sameNumber = 0;
  for (int i = 0; i < 50; ++i) {
    struct stat before = {};
    struct stat after = {};
    stat(mFolder.MakeFile("x").c_str(), &before);
    const auto old = files::ReadItem(AT_FDCWD, PathOf("x").c_str());
    std::filesystem::remove(PathOf("x"));
    stat(mFolder.MakeFile("x").c_str(), &after);
    ASSERT_TRUE(old);
    if (before.st_ino == after.st_ino) {
      ++sameNumber;
      if (old->handle.size == 0) GTEST_SKIP() << "no file handles here";
    }
    EXPECT_FALSE(files::IsAt(*old, AT_FDCWD, PathOf("x").c_str())) << i;
  }
  RecordProperty("sameNumber", sameNumber);
}

TEST_F(AReferenceOnAVolume, ThatIsDeletedGivesNoUrlOfTheNewItemOfItsName) {
  mFolder.MakeFile("volume/x");
  const FSRef item = ReferenceTo(PathOf("volume/x"));
  std::filesystem::remove(PathOf("volume/x"));
  mFolder.MakeFile("volume/x");
  EXPECT_EQ(PlaceOf(item), std::nullopt);
}

// --- Comparing --------------------------------------------------------------------------------

TEST_F(AReferenceToAnItem, IsEqualToAnotherToTheSame) {
  mFolder.MakeFolder("folder");
  mFolder.MakeFile("folder/x");
  mFolder.MakeLink("link", "folder");
  const FSRef first = ReferenceTo(PathOf("folder/x"));
  const FSRef second = ReferenceTo(PathOf("link/x"));
  EXPECT_EQ(FSCompareFSRefs(&first, &second), noErr);
}

TEST_F(AReferenceToAnItem, IsNotEqualToOneToAnother) {
  mFolder.MakeFile("x");
  mFolder.MakeLink("link", "x");
  const FSRef first = ReferenceTo(PathOf("x"));
  const FSRef second = ReferenceTo(PathOf("link"));
  EXPECT_EQ(FSCompareFSRefs(&first, &second), errFSRefsDifferent);
}

TEST_F(AReferenceToAnItem, IsNotComparedToNothing) {
  const FSRef item = ReferenceTo(mFolder.Path());
  const FSRef nothing = {};
  EXPECT_EQ(FSCompareFSRefs(&item, &nothing), errFSBadFSRef);
  EXPECT_EQ(FSCompareFSRefs(&nothing, &item), errFSBadFSRef);
  EXPECT_EQ(FSCompareFSRefs(&nothing, &nothing), errFSBadFSRef);
  EXPECT_EQ(FSCompareFSRefs(nullptr, &item), errFSBadFSRef);
}

}  // namespace
}  // namespace tallowmere::test
