// Volumes on which two items can share device and inode number and differ only in their places.
#include <sys/stat.h>

#include <algorithm>
#include <climits>
#include <string>
#include <vector>

#include "FolderIndexFixture.h"
#include "NumberedFileSystem.h"
#include "platform/HostCalls.h"
#include "support/FileSystemImage.h"

namespace tallowmere::catalog {
namespace {

using test::BeforeEntries;
using test::FileSystemImage;
using test::NumberedFileSystem;
using test::RefusedOpenat2;
using test::RunTool;
using test::ScopedMount;
using test::TemporaryFolder;

constexpr unsigned long kShared = 500;

std::string PathOfDescriptor(int descriptor) {
  const std::string link = "/proc/self/fd/" + std::to_string(descriptor);
  return std::filesystem::read_symlink(link);
}

// Served so that two items have the same number.
class AnUntrustedVolume : public AnIndex {
 protected:
  void SetUp() override {
    if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    mNumbered.emplace(NumberedFileSystem::On::kNothing, NumberedFileSystem::Case::kCounts, mTicks);
    if (!mNumbered->IsMounted()) GTEST_SKIP() << "no FUSE here";
    std::filesystem::permissions(mNumbered->Path().parent_path(), std::filesystem::perms(0755));
    mTop = mNumbered->Path();
    UseVolumeOf(mTop);
    ASSERT_FALSE(mVolume->NumbersIdentifyItems());
    for (const char* name : {"a", "b", "c"}) Make(name);
  }
  std::string MakeShared(const std::string& name) { return mNumbered->MakeFolder(name, kShared); }
  std::string FindShared() { return Find(kShared); }

  NumberedFileSystem::Ticks mTicks = NumberedFileSystem::Ticks::kFine;
  std::optional<NumberedFileSystem> mNumbered;
};

TEST_F(AnUntrustedVolume, AnswersWhenOnePlaceHasTheNumber) {
  const std::string only = MakeShared("a/f");
  EXPECT_EQ(FindShared(), only);
  EXPECT_EQ(FindAny(kShared), only);
}

TEST_F(AnUntrustedVolume, AnswersNothingWhenTwoPlacesHaveTheNumber) {
  const std::string first = MakeShared("a/f");
  const std::string second = MakeShared("b/f");
  ASSERT_TRUE(kernel::HaveSameNumbers(ItemOf(first), ItemOf(second)));
  EXPECT_EQ(FindShared(), "(none)");
  EXPECT_EQ(FindAny(kShared), "(none)");
  EXPECT_EQ(Find(kShared, "a"), "(none)");
}

TEST_F(AnUntrustedVolume, NoticesWhenTheSecondAppearsAndTheFirstVanishes) {
  const std::string first = MakeShared("a/f");
  LetChangesAge();
  EXPECT_EQ(FindShared(), first);
  EXPECT_EQ(FindShared(), first);
  const std::string second = MakeShared("b/f");
  EXPECT_EQ(FindShared(), "(none)");
  Remove(first);
  EXPECT_EQ(FindShared(), second);
}

TEST_F(AnUntrustedVolume, AnswersNothingWhenOneIsInTheOther) {
  MakeShared("a/f");
  MakeShared("a/f@500/f");
  EXPECT_EQ(FindShared(), "(none)");
}

TEST_F(AnUntrustedVolume, AnswersNothingWhereEveryItemHasOneNumber) {
  for (const char* name : {"x", "y", "x@500/x", "x@500/y", "y@500/z"}) MakeShared(name);
  EXPECT_EQ(FindShared(), "(none)");
  EXPECT_EQ(FindAny(kShared), "(none)");
  EXPECT_EQ(Find(ID("a")), PathTo("a"));
}

TEST_F(AnUntrustedVolume, WithAFolderAndAFileAnswersTheFolderWhenOneIsWanted) {
  const std::string folder = MakeShared("a/f");
  mNumbered->MakeFile("b/x", kShared);
  EXPECT_EQ(FindShared(), folder);
  EXPECT_EQ(FindAny(kShared), "(none)");
}

TEST_F(AnUntrustedVolume, SearchesForTheNumbersOfAReference) {
  const std::string first = MakeShared("a/f");
  const kernel::Item reference = ItemOf(first);
  const SearchedItem wanted{kShared, &reference, true};
  EXPECT_EQ(Search(wanted, mTop), first);
  MakeShared("b/f");
  EXPECT_EQ(Search(wanted, mTop), std::nullopt);
}

// Simulates an item that vanishes while its canonical path is looked up.
TEST_F(AnUntrustedVolume, HasNoOtherItemForAReferenceByALinkedPathThatCouldNotBeHeld) {
  const std::string first = MakeShared("a/f");
  MakeShared("b/f");
  const std::string link = mFolder.Path() / "link";
  std::filesystem::create_symlink(PathTo("a"), link);
  FSRef reference{};
  {
    const RefusedOpenat2 refused(EIO);
    reference = test::ReferenceTo(link + "/f@500");
  }
  Remove(first);
  EXPECT_EQ(test::PlaceOf(reference), std::nullopt);
}

TEST_F(AnUntrustedVolume, AnswersNothingUnlessEveryFolderMayBeRead) {
  MakeShared("a/f");
  MakeShared("b/f");
  chmod(PathTo("b").c_str(), 0700);
  EXPECT_TRUE(HoldsForNobody([&] { return FindShared() == "(none)"; }));
  chmod(PathTo("b").c_str(), 0711);
  EXPECT_TRUE(HoldsForNobody([&] { return FindShared() == "(none)"; }));
}

TEST_F(AnUntrustedVolume, AnswersNothingWhileSomethingIsMountedInIt) {
  const std::string first = MakeShared("a/f");
  MakeShared("b/f");
  {
    const ScopedMount cover("tmpfs", PathTo("b"), "tmpfs");
    ASSERT_TRUE(cover.IsMounted());
    EXPECT_EQ(FindShared(), "(none)");
    EXPECT_EQ(FindAny(kShared), "(none)");
  }
  Remove(PathTo("b/f@500"));
  EXPECT_EQ(FindShared(), first);
}

TEST_F(AnUntrustedVolume, CountsOnceWhatTwoMountsShow) {
  const std::string path = MakeShared("a/f");
  const ScopedMount again(PathTo("a"), mFolder.MakeFolder("again"), "", MS_BIND);
  ASSERT_TRUE(again.IsMounted());
  UseVolumeOf(mTop);
  ASSERT_EQ(mVolume->Listed().MountPoints().size(), 2u);
  EXPECT_EQ(FindShared(), path);
  MakeShared("b/f");
  EXPECT_EQ(FindShared(), "(none)");
}

TEST_F(AnUntrustedVolume, KeepsNothingFromOneSearchToTheNext) {
  Make("a/d/e");
  LetChangesAge();
  const std::uint64_t opened = OpenedFor(kOfNoItem);
  EXPECT_GE(opened, 6u);
  EXPECT_EQ(OpenedFor(kOfNoItem), opened);
}

TEST_F(AnUntrustedVolume, IsReadOnceWhereverTheSearchStarts) {
  Make("a/d/e");
  const std::uint64_t opened = OpenedForAny(kOfNoItem);
  EXPECT_EQ(OpenedForAny(kOfNoItem, "a/d"), opened);
}

// In one of the two rounds, the item moves from a folder not yet read to one already read.
TEST_F(AnUntrustedVolume, MissesNothingThatMovesDuringASearch) {
  MakeShared("c/f");
  MakeShared("a/f");
  MakeShared("b/f");
  for (const auto& [from, to] : {std::pair("a", "b"), std::pair("b", "a")}) {
    std::filesystem::remove(PathTo(to) + "/f@500");
    int moves = 0;
    const BeforeEntries entries([&, source = PathTo(from), target = PathTo(to)](int folder) {
      if (moves > 0 || PathOfDescriptor(folder) != source) return;
      std::filesystem::rename(source + "/f@500", target + "/f@500");
      ++moves;
    });
    EXPECT_EQ(FindShared(), "(none)");
    EXPECT_EQ(moves, 1);
  }
}

TEST_F(AnUntrustedVolume, AnswersWhenItChangedOnceDuringTheSearch) {
  const std::string path = MakeShared("c/f");
  bool hasChanged = false;
  const BeforeEntries entries([&](int folder) {
    if (hasChanged || PathOfDescriptor(folder) != PathTo("a")) return;
    hasChanged = true;
    std::filesystem::create_directory(PathTo("b/new"));
  });
  EXPECT_EQ(FindShared(), path);
  EXPECT_TRUE(hasChanged);
}

TEST_F(AnUntrustedVolume, AnswersNothingWhileItKeepsChanging) {
  MakeShared("c/f");
  int changes = 0;
  const BeforeEntries entries([&](int folder) {
    if (PathOfDescriptor(folder) != PathTo("a")) return;
    std::filesystem::create_directory(PathTo("b/" + std::to_string(++changes)));
  });
  EXPECT_EQ(FindShared(), "(none)");
  EXPECT_LT(changes, 20);
}

// One that counts time in seconds.
class AnUntrustedVolumeWithCoarseTimes : public AnUntrustedVolume {
 protected:
  AnUntrustedVolumeWithCoarseTimes() { mTicks = NumberedFileSystem::Ticks::kSeconds; }

  static std::int64_t ChangeOf(const std::string& path) {
    struct stat about {};
    EXPECT_EQ(lstat(path.c_str(), &about), 0) << path;
    return about.st_ctim.tv_sec;
  }
};

// One of two items moves during the walk, from a folder that is still to be read into one that has
// been read, and all changes have one time.
TEST_F(AnUntrustedVolumeWithCoarseTimes, NoticesAnItemThatAWalkMissedAsItMoved) {
  const std::string other = MakeShared("c/f");
  bool isInOneTick = false;
  for (int i = 0; i < 100 && !isInOneTick; ++i) {
    const std::string name = "f" + std::to_string(i);
    const std::string moved = MakeShared("a/" + name);
    std::vector<std::string> read;
    std::string where = moved;
    std::filesystem::create_directory(PathTo("b/" + name));
    const std::int64_t begin = ChangeOf(PathTo("b"));
    {
      const BeforeEntries entries([&](int folder) {
        const std::string path = PathOfDescriptor(folder);
        const std::string away = path == PathTo("a") ? PathTo("b") : PathTo("a");
        const bool isAboutToBeSeen = where.starts_with(path + "/");
        const bool isRead = std::find(read.begin(), read.end(), away) != read.end();
        read.push_back(path);
        if (!isAboutToBeSeen || !isRead || where != moved) return;
        const std::string next = away + "/moved " + std::to_string(i);
        std::filesystem::rename(where, next);
        where = next;
      });
      EXPECT_EQ(FindShared(), "(none)") << other << " is not the only one";
    }
    isInOneTick =
        ChangeOf(PathTo("b")) == begin && ChangeOf(PathTo("a")) == begin && where != moved;
    Remove(where);
  }
  EXPECT_TRUE(isInOneTick);
}

// Two file systems that bindfs presents as one.
class TwoFileSystemsAsOne : public AnIndex {
 protected:
  void SetUp() override {
    if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    const std::string source = mFolder.MakeFolder("source");
    for (const std::string name : {"/e1", "/e2"}) {
      std::filesystem::create_directory(source + name);
      mParts.emplace_back(std::make_unique<ScopedMount>("tmpfs", source + name, "tmpfs"));
      ASSERT_TRUE(mParts.back()->IsMounted());
      std::filesystem::create_directories(source + name + "/d/f");
    }
    mTop = mFolder.MakeFolder("volume");
    if (!RunTool({"bindfs", source, mTop})) GTEST_SKIP() << "no bindfs here";
    UseVolumeOf(mTop);
    const kernel::Item item = ItemAt("e1/d/f");
    ASSERT_TRUE(kernel::HaveSameNumbers(item, ItemAt("e2/d/f")));
    mID = mVolume->IDOf(item);
  }
  void TearDown() override { umount2(mTop.c_str(), MNT_DETACH); }

  std::vector<std::unique_ptr<ScopedMount>> mParts;
  std::uint32_t mID = 0;
};

TEST_F(TwoFileSystemsAsOne, HaveNoItemWithANumberThatBothHave) {
  for (const char* start : {"", "e1/d", "e2/d"}) {
    EXPECT_EQ(Find(mID, start), "(none)") << start;
    EXPECT_EQ(FindAny(mID, start), "(none)") << start;
  }
}

TEST_F(TwoFileSystemsAsOne, HaveAnItemWithANumberThatOneHas) {
  Remove(PathTo("e2/d/f"));
  EXPECT_EQ(Find(mID), PathTo("e1/d/f"));
  Make("e2/d/f");
  EXPECT_EQ(Find(ID("e2/d/f")), PathTo("e2/d/f"));
}

TEST_F(TwoFileSystemsAsOne, HaveNoItemForAReferenceWhoseNumbersBothHave) {
  const kernel::Item reference = ItemAt("e1/d/f");
  EXPECT_EQ(Search({mID, &reference, true}, PathTo("e1/d")), std::nullopt);
}

constexpr std::uintmax_t kBtrfsSize = 128 << 20;

class ABtrfsVolume : public AnIndex {
 protected:
  void SetUp() override {
    if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    mImage.emplace("btrfs", std::vector<std::string>{"mkfs.btrfs", "-q"}, kBtrfsSize);
    if (!mImage->IsMade() || !mImage->Mount()) GTEST_SKIP() << "no btrfs here";
    mTop = mImage->Path();
    for (const char* name : {"/s1", "/s2"}) {
      if (!RunTool({"btrfs", "subvolume", "create", mTop + name})) GTEST_SKIP() << "no btrfs here";
    }
    UseVolumeOf(mTop);
    for (const char* name : {"s1/d/f", "s2/d/f"}) Make(name);
    ASSERT_EQ(ItemAt("s1/d/f").inode, ItemAt("s2/d/f").inode);
  }

  std::optional<FileSystemImage> mImage;
};

TEST_F(ABtrfsVolume, HasAnIDForEachItemOfEachSubvolume) {
  MakeFile("s1/d/x");
  MakeFile("s2/d/x");
  ASSERT_NE(ID("s1/d/f"), ID("s2/d/f"));
  for (const char* name : {"s1", "s2", "s1/d", "s2/d", "s1/d/f", "s2/d/f"}) ExpectFound(name);
  for (const char* name : {"s1/d/x", "s2/d/x"}) {
    EXPECT_EQ(FindAny(ID(name), "s1/d"), PathTo(name));
    EXPECT_EQ(FindAny(ID(name), "s2/d"), PathTo(name));
  }
}

TEST_F(ABtrfsVolume, FindsWhatMovedWithItsSubvolume) {
  KnowEverything();
  Move("s1", "s3");
  Move("s2", "s1");
  for (const char* name : {"s3", "s1", "s1/d", "s3/d", "s1/d/f", "s3/d/f"}) ExpectFound(name);
}

// An overlay with layers in two subvolumes: its change times can be trusted, its numbers cannot.
class AnOverlayOfSubvolumes : public ABtrfsVolume {
 protected:
  void SetUp() override {
    ABtrfsVolume::SetUp();
    if (IsSkipped()) return;
    Move("s1/d", "s1/e1");
    Move("s2/d", "s2/e2");
    for (const char* name : {"upper", "work"}) Make(name);
    const std::string place = mFolder.MakeFolder("overlay");
    mOverlay.emplace("overlay", place, "overlay", 0,
                     "lowerdir=" + mTop + "/s1:" + mTop + "/s2,upperdir=" + mTop +
                         "/upper,workdir=" + mTop + "/work");
    if (!mOverlay->IsMounted()) GTEST_SKIP() << "no overlay here";
    mTop = place;
    UseVolumeOf(mTop);
    ASSERT_FALSE(mVolume->NumbersIdentifyItems());
    ASSERT_TRUE(mVolume->Kind().keepsNumbers);
  }

  std::optional<ScopedMount> mOverlay;
};

TEST_F(AnOverlayOfSubvolumes, HasNoItemForANumberOfTwoItems) {
  ASSERT_TRUE(kernel::HaveSameNumbers(ItemAt("e1/f"), ItemAt("e2/f")));
  for (int round = 0; round < 2; ++round) {
    EXPECT_EQ(Find(ID("e1/f")), "(none)");
    EXPECT_EQ(FindAny(ID("e1/f")), "(none)");
    LetChangesAge();
  }
}

TEST_F(AnOverlayOfSubvolumes, ReadsOnlyFoldersThatHaveChanged) {
  for (int i = 0; i < 20; ++i) Make("new/" + std::to_string(i) + "/x");
  KnowEverything();
  EXPECT_LE(OpenedFor(kOfNoItem), 1u);
  Make("new/7/y");
  const std::uint32_t id = ID("new/7/y");
  LetChangesAge();
  EXPECT_LE(OpenedFor(id), 4u);
  EXPECT_EQ(Find(id), PathTo("new/7/y"));
}

TEST_F(AnOverlayOfSubvolumes, FollowsMovedItemsAndTheirSuccessors) {
  for (const char* name : {"x/a/b", "y/a/b"}) Make(name);
  KnowEverything();
  const std::uint32_t first = ID("x/a/b");
  const std::uint32_t second = ID("y/a/b");
  ASSERT_NE(first, second);
  Move("x/a", "z");
  Move("y/a", "x/a");
  Move("z", "y/a");
  EXPECT_EQ(Find(first), PathTo("y/a/b"));
  EXPECT_EQ(Find(second), PathTo("x/a/b"));
}

}  // namespace
}  // namespace tallowmere::catalog
