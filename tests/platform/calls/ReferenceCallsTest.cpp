// References to items from URLs, and URLs from references.
#include <CoreServices/CoreServices.h>
#include <gtest/gtest.h>
#include <sys/mount.h>
#include <unistd.h>

#include <chrono>
#include <cstring>
#include <filesystem>
#include <optional>

#include "platform/HostCalls.h"
#include "platform/foundation/TestStrings.h"
#include "support/FileSystemImage.h"
#include "support/OtherKernel.h"
#include "support/OwnMountNamespace.h"
#include "support/Privileges.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

using foundation::test::MakeUrl;
using foundation::test::ParseUrl;

bool HasReference(CFURLRef url) {
  FSRef item = {};
  return CFURLGetFSRef(url, &item) != 0;
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

TEST_F(AReferenceToAnItem, IsMadeFromAFileUrl) {
  mFolder.MakeFile("x");
  EXPECT_TRUE(HasReference(MakeUrl(PathOf("x"), false).Get()));
  EXPECT_TRUE(HasReference(ParseUrl("file://localhost/").Get()));
}

TEST_F(AReferenceToAnItem, IsNotMadeFromAnotherUrl) {
  EXPECT_FALSE(HasReference(ParseUrl("http://localhost/").Get()));
  EXPECT_FALSE(HasReference(ParseUrl("file://elsewhere/").Get()));
  EXPECT_FALSE(HasReference(ParseUrl("mailto:x").Get()));
  EXPECT_FALSE(HasReference(ParseUrl("file:///%00").Get()));
}

TEST_F(AReferenceToAnItem, IsNotMadeForAMissingItem) {
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

TEST_F(AReferenceToAnItem, IsToALinkItselfEvenWithAFolderMark) {
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

TEST_F(AReferenceToAnItem, OfARelativeUrlIsRelativeToTheFolderWhereItWasMade) {
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

TEST_F(AReferenceToAnItem, IsNotTakenForANewItemOfItsName) {
  mFolder.MakeFile("x");
  mFolder.MakeFile("y");
  const FSRef item = ReferenceTo(PathOf("x"));
  Move("x", "z");
  Move("y", "x");
  EXPECT_EQ(PlaceOf(item), PathOf("z"));
}

TEST_F(AReferenceToAnItem, IsNotTakenForALinkToItInItsPlace) {
  mFolder.MakeFile("x");
  const FSRef item = ReferenceTo(PathOf("x"));
  Move("x", "y");
  mFolder.MakeLink("x", "y");
  EXPECT_EQ(PlaceOf(item), PathOf("y"));
}

TEST_F(AReferenceToAnItem, GivesTheCanonicalPathWhenALinkIsNowOnTheWay) {
  mFolder.MakeFolder("a");
  mFolder.MakeFile("a/x");
  const FSRef item = ReferenceTo(PathOf("a/x"));
  ASSERT_EQ(PlaceOf(item), PathOf("a/x"));
  Move("a", "b");
  mFolder.MakeLink("a", "b");
  EXPECT_EQ(PlaceOf(item), PathOf("b/x"));
}

TEST_F(AReferenceToAnItem, WithTwoNamesGivesTheOneLastSeen) {
  mFolder.MakeFile("x");
  ASSERT_EQ(link(PathOf("x").c_str(), PathOf("y").c_str()), 0);
  const FSRef first = ReferenceTo(PathOf("x"));
  EXPECT_EQ(PlaceOf(first), PathOf("x"));
  const FSRef second = ReferenceTo(PathOf("y"));
  EXPECT_EQ(PlaceOf(second), PathOf("y"));
  EXPECT_EQ(FSCompareFSRefs(&first, &second), noErr);
}

TEST_F(AReferenceToAnItem, FollowsItsRenameInAProcessWithoutPrivileges) {
  mFolder.MakeFolder("a");
  mFolder.MakeFolder("b/c");
  mFolder.MakeFile("a/x");
  const FSRef item = ReferenceTo(PathOf("a/x"));
  Move("a/x", "b/c/y");
  EXPECT_TRUE(HoldsWithout(CAP_DAC_READ_SEARCH, [&] { return PlaceOf(item) == PathOf("b/c/y"); }));
}

// Uses a volume of its own, on which a search for a deleted item ends soon.
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

TEST_F(AReferenceOnAVolume, GivesNoUrlWhenTheItemMovedToAnotherVolume) {
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

TEST_F(AReferenceOnAVolume, DoesNotKeepTheVolumeMounted) {
  mFolder.MakeFolder("volume/a");
  mFolder.MakeFile("volume/x");
  const FSRef item = ReferenceTo(PathOf("volume/x"));
  Move("volume/x", "volume/a/y");
  ASSERT_EQ(PlaceOf(item), PathOf("volume/a/y"));
  EXPECT_EQ(umount2(PathOf("volume").c_str(), 0), 0) << std::strerror(errno);
}

TEST_F(AReferenceOnAVolume, FindsItsItemAfterItsPlaceIsForgotten) {
  mFolder.MakeFolder("volume/a/b");
  mFolder.MakeFile("volume/a/b/x");
  const FSRef item = ReferenceTo(PathOf("volume/a/b/x"));
  // More places than the platform remembers.
  mFolder.MakeFolder("volume/many");
  for (int i = 0; i < 5000; ++i) {
    ReferenceTo(mFolder.MakeFile("volume/many/" + std::string(200, 'n') + std::to_string(i)));
  }
  EXPECT_EQ(PlaceOf(item), PathOf("volume/a/b/x"));
}

TEST_F(AReferenceToAnItem, FindsItAfterAllItsFoldersMoved) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  ScopedMount volume("none", mFolder.MakeFolder("a/volume"), "tmpfs");
  ASSERT_TRUE(volume.IsMounted());
  mFolder.MakeFolder("a/volume/b");
  mFolder.MakeFile("a/volume/b/x");
  const FSRef item = ReferenceTo(PathOf("a/volume/b/x"));
  Move("a", "c");
  EXPECT_EQ(PlaceOf(item), PathOf("c/volume/b/x"));
  Move("c", "a");
}

TEST_F(AReferenceOnAVolume, ToADeletedItemGivesNoUrlOfItsSuccessor) {
  mFolder.MakeFile("volume/x");
  const FSRef item = ReferenceTo(PathOf("volume/x"));
  std::filesystem::remove(PathOf("volume/x"));
  mFolder.MakeFile("volume/x");
  EXPECT_EQ(PlaceOf(item), std::nullopt);
}

// On a disk, the birth time identifies an item that was old when its reference was made.
class AReferenceOnADisk : public testing::Test {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    if (!KernelHas("ext4")) GTEST_SKIP() << "this kernel has no ext4";
    mImage.emplace("ext4", std::vector<std::string>{"mkfs.ext4", "-q", "-F"}, 8 << 20);
    if (!mImage->IsMade() || !mImage->Mount()) GTEST_SKIP() << "no ext4 image here";
  }
  std::string PathOf(const std::string& name) const { return mImage->Path() / name; }
  std::string Make(const std::string& name) const {
    std::ofstream(PathOf(name)) << name;
    return PathOf(name);
  }

  std::optional<FileSystemImage> mImage;
};

TEST_F(AReferenceOnADisk, FollowsTheRenameOfAnOldItem) {
  std::filesystem::create_directory(PathOf("a"));
  Make("x");
  const OtherTime later(std::chrono::hours(1));
  const FSRef item = ReferenceTo(PathOf("x"));
  std::filesystem::rename(PathOf("x"), PathOf("a/y"));
  EXPECT_TRUE(HoldsWithout(CAP_DAC_READ_SEARCH, [&] { return PlaceOf(item) == PathOf("a/y"); }));
  EXPECT_EQ(PlaceOf(item), PathOf("a/y"));
}

// The file system reuses a freed inode number at once, within one tick of the clock of birth times.
TEST_F(AReferenceOnADisk, ToADeletedItemIsNotTakenForItsSuccessor) {
  for (int i = 0; i < 50; ++i) {
    const std::string path = Make("x");
    const std::uint64_t inode = InodeOf(path);
    const FSRef old = ReferenceTo(path);
    std::filesystem::remove(path);
    Make("x");
    ASSERT_EQ(InodeOf(path), inode) << "the number was not taken again";
    ASSERT_EQ(PlaceOf(old), std::nullopt) << i;
    ASSERT_TRUE(HoldsWithout(CAP_DAC_READ_SEARCH, [&] { return !PlaceOf(old); })) << i;
  }
}

// --- Comparing --------------------------------------------------------------------------------

TEST_F(AReferenceToAnItem, IsEqualToAnotherReferenceToTheSameItem) {
  mFolder.MakeFolder("folder");
  mFolder.MakeFile("folder/x");
  mFolder.MakeLink("link", "folder");
  const FSRef first = ReferenceTo(PathOf("folder/x"));
  const FSRef second = ReferenceTo(PathOf("link/x"));
  EXPECT_EQ(FSCompareFSRefs(&first, &second), noErr);
}

TEST_F(AReferenceToAnItem, IsNotEqualToAReferenceToAnotherItem) {
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
