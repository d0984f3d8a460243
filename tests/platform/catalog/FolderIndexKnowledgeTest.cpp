// What an index keeps from one search to the next, and what it never touches.
#include <sys/mount.h>
#include <sys/resource.h>
#include <sys/syscall.h>

#include <cerrno>
#include <cstring>

#include "FolderIndexFixture.h"
#include "NumberedFileSystem.h"
#include "support/DeadMount.h"
#include "support/RefusedCalls.h"

namespace tallowmere::catalog {
namespace {

using test::DeadMount;
using test::NumberedFileSystem;
using test::ScopedMount;

std::size_t OpenDescriptors() {
  std::size_t count = 0;
  for ([[maybe_unused]] const auto& entry : std::filesystem::directory_iterator("/proc/self/fd")) {
    ++count;
  }
  return count;
}

// While it exists, only so many more descriptors can be opened.
class FewDescriptors {
 public:
  explicit FewDescriptors(std::size_t more) {
    getrlimit(RLIMIT_NOFILE, &mBefore);
    const kernel::Descriptor lowest(dup(STDIN_FILENO));
    const rlimit tight{static_cast<rlim_t>(lowest.Get()) + more, mBefore.rlim_max};
    EXPECT_EQ(setrlimit(RLIMIT_NOFILE, &tight), 0);
  }
  FewDescriptors(const FewDescriptors&) = delete;
  FewDescriptors& operator=(const FewDescriptors&) = delete;
  ~FewDescriptors() { setrlimit(RLIMIT_NOFILE, &mBefore); }

 private:
  rlimit mBefore{};
};

// An open file without a name, until it is given one.
class NamelessFile {
 public:
  explicit NamelessFile(const std::string& volume)
      : mFile(open(volume.c_str(), O_TMPFILE | O_RDWR | O_CLOEXEC, 0644)) {}
  kernel::Item Item() const {
    const auto item = kernel::ReadItem(kernel::AtOpen(mFile.Get()));
    EXPECT_TRUE(item);
    return item ? *item : kernel::Item{};
  }
  void Name(const std::string& path) const {
    const std::string link = "/proc/self/fd/" + std::to_string(mFile.Get());
    EXPECT_EQ(linkat(AT_FDCWD, link.c_str(), AT_FDCWD, path.c_str(), AT_SYMLINK_FOLLOW), 0);
  }

 private:
  kernel::Descriptor mFile;
};

TEST_F(AnIndex, AnswersTheNextSearchFromWhatItLearned) {
  for (const char* name : {"a/b/c", "a/d/e", "f/g/h"}) Make(name);
  EXPECT_EQ(Find(IDOfWhatIsGone()), "(none)");
  for (const char* name : {"a", "a/b", "a/b/c", "a/d/e", "f", "f/g/h"}) {
    EXPECT_EQ(OpenedFor(ID(name)), 0u) << name;
    ExpectFound(name);
  }
}

TEST_F(AnIndex, FindsAFolderAtItsNewPlaceWhenItStartsThere) {
  for (const char* name : {"a/moved/below", "b"}) Make(name);
  EXPECT_EQ(Find(IDOfWhatIsGone()), "(none)");
  Move("a/moved", "b/moved");
  EXPECT_EQ(FindAny(ID("b/moved"), "b/moved"), PathTo("b/moved"));
  Move("b/moved", "a/moved");
  EXPECT_EQ(FindAny(ID("a/moved/below"), "a/moved"), PathTo("a/moved/below"));
}

TEST_F(AnIndex, KeepsWhatItKnowsWhenAFolderIsGone) {
  for (const char* name : {"a/b/c", "a/d/e", "f/g/h"}) Make(name);
  const std::uint32_t gone = IDOfWhatIsGone();
  LetChangesAge();
  Find(gone);
  EXPECT_EQ(OpenedFor(gone), 0u);
  EXPECT_EQ(OpenedFor(ID("f/g/h")), 0u);
  EXPECT_EQ(OpenedFor(gone), 0u);
}

TEST_F(AnIndex, ReadsOnlyFoldersThatHaveChanged) {
  for (int i = 0; i < 50; ++i) Make("a/b" + std::to_string(i) + "/c/d");
  KnowEverything();
  KnowEverything();
  Make("a/b7/c/new");
  EXPECT_LE(OpenedFor(ID("a/b7/c/new")), 2u);
  ExpectFound("a/b7/c/new");
}

TEST_F(AnIndex, FindsAnItemMadeWithinOneTickOfTheLastSearch) {
  Make("a/b");
  for (int i = 0; i < 50; ++i) {
    const std::string name = "a/b/" + std::to_string(i);
    Make(name);
    ExpectFound(name);
  }
}

// On a file system with timestamps of two seconds, a later change could get the same time.
TEST_F(AnIndex, RereadsFoldersChangedHalfASecondBeforeTheLastSearch) {
  Make("a/b");
  const std::uint32_t gone = IDOfWhatIsGone();
  const test::OtherTime later(std::chrono::milliseconds(500));
  EXPECT_GT(OpenedFor(gone), 0u);
  EXPECT_GT(OpenedFor(gone), 0u);
}

// The clock was set back, or another machine's clock is ahead: the next change may get an earlier
// time, or the same one.
TEST_F(AnIndex, RereadsFoldersChangedInTheFuture) {
  Make("a/b");
  const std::uint32_t gone = IDOfWhatIsGone();
  const test::OtherTime earlier(std::chrono::hours(-1));
  EXPECT_GT(OpenedFor(gone), 0u);
  EXPECT_GT(OpenedFor(gone), 0u);
}

TEST_F(AnIndex, FindsFoldersAndFilesWhoseEntriesHaveNoType) {
  for (const char* name : {"a/b/c", "a/d"}) Make(name);
  for (const char* name : {"a/b/x", "a/b/c/y"}) MakeFile(name);
  mFolder.MakeLink("volume/a/link", "b");
  const test::UntypedEntries untyped;
  ExpectFound("a/b/c");
  EXPECT_EQ(FindAny(ID("a/b/c/y")), PathTo("a/b/c/y"));
  EXPECT_EQ(FindAny(ID("a/link")), PathTo("a/link"));
  EXPECT_EQ(FindAny(kOfNoItem), "(none)");
  ExpectFound("a/d");
}

TEST_F(AnIndex, RereadsNothingWhereEntriesHaveNoType) {
  Make("a/b/c");
  MakeFile("a/x");
  const test::UntypedEntries untyped;
  KnowEverything();
  EXPECT_EQ(OpenedFor(kOfNoItem), 0u);
}

TEST_F(AnIndex, FindsAFolderDeepInASubtreeThatHasMoved) {
  Make("a/b/c/d");
  Make("e");
  Find(IDOfWhatIsGone());
  KnowEverything();
  Move("a/b", "e/z");
  ExpectFound("e/z/c/d");
  ExpectFound("e/z/c");
  ExpectFound("e/z");
}

TEST_F(AnIndex, FindsEverythingInExchangedFolders) {
  Make("a/x/below");
  Make("b/x/below");
  ExpectFound("a/x/below");
  ExpectFound("b/x/below");
  KnowEverything();
  Move("a", "c");
  Move("b", "a");
  Move("c", "b");
  for (const char* name : {"a", "b", "a/x", "b/x", "a/x/below", "b/x/below"}) ExpectFound(name);
}

TEST_F(AnIndex, FindsFoldersExchangedOnTheWay) {
  Make("a/b");
  ExpectFound("a/b");
  const std::uint32_t outer = ID("a");
  Move("a/b", "b");
  Move("a", "b/a");
  EXPECT_EQ(Find(outer), PathTo("b/a"));
  ExpectFound("b");
}

TEST_F(AnIndex, DoesNotTakeASuccessorForADeletedFolder) {
  const std::string path = Make("a/b/c");
  const std::uint32_t id = ID("a/b/c");
  ExpectFound("a/b/c");
  Remove(path);
  Make("a/b/c");
  EXPECT_EQ(Find(id), "(none)");
  ExpectFound("a/b/c");
}

TEST_F(AnIndex, FindsAFolderAgainThatWasGoneForAWhile) {
  Make("a/b/c");
  const std::uint32_t id = ID("a/b/c");
  ExpectFound("a/b/c");
  const std::string outside = mFolder.MakeFolder("volume/hidden");
  Move("a/b", "hidden/b");
  const ScopedMount cover("tmpfs", outside, "tmpfs");
  EXPECT_EQ(Find(id), "(none)");
  umount2(outside.c_str(), MNT_DETACH);
  EXPECT_EQ(Find(id), PathTo("hidden/b/c"));
}

TEST_F(AnIndex, IsNotLedOutsideByALinkInAFoldersPlace) {
  Make("a/b/c");
  const std::string outside = mFolder.MakeFolder("outside");
  std::filesystem::create_directories(outside + "/b/c");
  ExpectFound("a/b/c");
  Move("a", "moved");
  std::filesystem::create_directory_symlink(outside, PathTo("a"));
  ExpectFound("moved/b/c");
  ExpectFound("moved/b");
}

TEST_F(AnIndex, StopsAsSoonAsTheAnswerIsCertain) {
  for (int i = 0; i < 200; ++i) Make("a/b" + std::to_string(i) + "/c/d");
  Make("near/x/y");
  EXPECT_EQ(Search({ID("near/x/y"), nullptr, true}, PathTo("near")), PathTo("near/x/y"));
  EXPECT_LT(mIndex->OpenedFolders(), 10u);
}

TEST_F(AnIndex, ResumesWhereItStopped) {
  for (int i = 0; i < 200; ++i) Make("a/b" + std::to_string(i) + "/c/d");
  LetChangesAge();
  for (int i = 0; i < 200; ++i) ExpectFound("a/b" + std::to_string(i) + "/c/d");
  // Each folder with subfolders about once, plus once where a search had stopped.
  EXPECT_LE(mIndex->OpenedFolders(), 2u * (200 * 2 + 2));
}

TEST_F(AnIndex, HoldsNothingOpenBetweenTwoSearches) {
  Make("a/b/c/d");
  Find(ID("a/b/c/d"));
  const std::size_t before = OpenDescriptors();
  mIndex.emplace(mVolume);
  Find(ID("a/b"));
  Find(IDOfWhatIsGone());
  EXPECT_EQ(OpenDescriptors(), before);
  EXPECT_EQ(umount2(PathTo("").c_str(), 0), 0) << std::strerror(errno);
}

TEST_F(AnIndex, FindsTheEndOfAChainOf300Folders) {
  std::string name = "d";
  for (int depth = 1; depth < 300; ++depth) name += "/d";
  Make(name);
  ExpectFound(name);
}

TEST_F(AnIndex, NeedsFewDescriptorsHoweverDeepTheFolders) {
  std::string name = "d";
  for (int depth = 1; depth < 60; ++depth) {
    Make(name + "/side/x");
    Make(name + "/zzz/x");
    name += "/d";
  }
  name.resize(name.size() - 2);
  const std::uint32_t id = ID(name + "/side/x");
  rlimit limit{};
  ASSERT_EQ(getrlimit(RLIMIT_NOFILE, &limit), 0);
  const rlimit tight{OpenDescriptors() + 20, limit.rlim_max};
  ASSERT_EQ(setrlimit(RLIMIT_NOFILE, &tight), 0);
  const std::string deepest = Find(id);
  const std::string none = Find(kOfNoItem);
  EXPECT_EQ(setrlimit(RLIMIT_NOFILE, &limit), 0);
  EXPECT_EQ(deepest, PathTo(name + "/side/x"));
  EXPECT_EQ(none, "(none)");
  EXPECT_EQ(OpenedFor(ID("d/side/x")), 0u);
}

TEST_F(AnIndex, KeepsLessThan64BytesAndTheNameOfAFolder) {
  constexpr std::size_t kFolders = 20000;
  constexpr std::size_t kNameSize = 8;
  for (std::size_t i = 0; i < kFolders; ++i) {
    Make(std::to_string(i % 10) + "/" + std::to_string(10000000 + i));
    if ((i & (i - 1)) != 0 && i != kFolders - 1 && i % 3000 != 0) continue;
    mIndex.emplace(mVolume);
    Find(kOfNoItem);
    const std::size_t folders = i + 12;
    const std::size_t names = (kNameSize + 1) * folders * 5 / 4;
    EXPECT_LE(mIndex->Size(), 64 * folders + names + 8192) << i;
  }
}

TEST_F(AnIndex, DoesNotGrowWithFoldersThatComeAndGo) {
  for (int i = 0; i < 100; ++i) Make("a/" + std::to_string(i) + "/x");
  Find(kOfNoItem);
  const std::size_t size = mIndex->Size();
  for (int round = 0; round < 100; ++round) {
    const std::string path = Make("b/c");
    for (int i = 0; i < 20; ++i) Make("b/c/a folder of some length " + std::to_string(i));
    Find(kOfNoItem);
    Remove(path);
    Find(kOfNoItem);
  }
  EXPECT_LT(mIndex->Size(), 4 * size);
  ExpectFound("a/99/x");
}

TEST_F(AnIndex, FindsAFolderThatMayNotBeReadAgainAndAgain) {
  Make("a/b/c");
  Make("open/x");
  chmod(PathTo("a/b").c_str(), 0711);
  LetChangesAge();
  const std::uint32_t id = ID("a/b");
  const std::uint32_t gone = IDOfWhatIsGone();
  EXPECT_TRUE(HoldsForNobody([&] {
    FolderIndex index(mVolume);
    const auto find = [&](std::uint32_t wanted) {
      return index.Find({wanted, nullptr, true}, PathTo(""), *mTable.Now());
    };
    return !find(gone) && find(id) == PathTo("a/b") && !find(gone) && find(id) == PathTo("a/b");
  }));
}

TEST_F(AnIndex, ReadsAFolderThatHasBecomeReadable) {
  Make("a/b/c");
  chmod(PathTo("a/b").c_str(), 0700);
  const std::uint32_t id = ID("a/b/c");
  if (seteuid(65534) != 0) GTEST_SKIP() << "not permitted here";
  EXPECT_EQ(Find(id), "(none)");
  ASSERT_EQ(seteuid(0), 0);
  LetChangesAge();
  ASSERT_EQ(seteuid(65534), 0);
  EXPECT_EQ(Find(id), "(none)");
  ASSERT_EQ(seteuid(0), 0);
  chmod(PathTo("a/b").c_str(), 0755);
  ASSERT_EQ(seteuid(65534), 0);
  const std::string found = Find(id);
  ASSERT_EQ(seteuid(0), 0);
  EXPECT_EQ(found, PathTo("a/b/c"));
}

TEST_F(AnIndex, DoesNotEnterMountsInTheVolume) {
  Make("a/mounted");
  const ScopedMount other("tmpfs", PathTo("a/mounted"), "tmpfs");
  ASSERT_TRUE(other.IsMounted());
  for (int i = 0; i < 40; ++i) Make("a/mounted/" + std::to_string(i));
  Find(IDOfWhatIsGone());
  const std::uint64_t opened = mIndex->OpenedFolders();
  for (int i = 20; i < 40; ++i) {
    const auto inode = static_cast<std::uint32_t>(ItemAt("a/mounted/" + std::to_string(i)).inode);
    const std::string found = Find(inode);
    EXPECT_FALSE(found.starts_with(PathTo("a/mounted/"))) << found;
  }
  EXPECT_LT(opened, 10u);
}

TEST_F(AnIndex, FindsAFolderOnceWhereverElseItIsMounted) {
  Make("a/b/c");
  const ScopedMount again(PathTo("a"), mFolder.MakeFolder("again").string(), "", MS_BIND);
  ASSERT_TRUE(again.IsMounted());
  UseVolumeOf(PathTo("a"));
  ASSERT_EQ(mVolume->Listed().MountPoints().size(), 2u);
  ExpectFound("a/b/c");
  EXPECT_EQ(Search({ID("a/b"), nullptr, true}, mFolder.Path() / "again/b"), PathTo("a/b"));
}

TEST_F(AnIndex, ReadsTheFoldersThatItKnowsForAFile) {
  Make("a/b/c");
  MakeFile("a/b/c/x");
  MakeFile("a/y");
  KnowEverything();
  EXPECT_EQ(FindAny(ID("a/b/c/x")), PathTo("a/b/c/x"));
  EXPECT_EQ(FindAny(ID("a/y")), PathTo("a/y"));
}

TEST_F(AnIndex, ReadsEachFolderOnceForAFileHoweverRecentItIs) {
  constexpr std::uint64_t kFolders = 1 + 3 + 10;
  Make("a/b/c");
  for (int i = 0; i < 10; ++i) Make("a/b/" + std::to_string(i));
  EXPECT_EQ(OpenedForAny(kOfNoItem, "a/b/c"), kFolders);
  EXPECT_EQ(OpenedForAny(0x12345679, "a/b"), kFolders);
  LetChangesAge();
  EXPECT_EQ(OpenedForAny(0x1234567A, "a/b/c"), kFolders);
  EXPECT_EQ(OpenedForAny(0x1234567B, "a/b/c"), kFolders);
}

TEST_F(AnIndex, KeepsItsFoldersWhileItSearchesForAFile) {
  for (int i = 0; i < 20; ++i) Make("a/b" + std::to_string(i) + "/c/d");
  MakeFile("a/x");
  KnowEverything();
  EXPECT_EQ(FindAny(ID("a/x"), "a"), PathTo("a/x"));
  EXPECT_EQ(OpenedFor(kOfNoItem), 0u);
  EXPECT_EQ(FindAny(kOfNoItem), "(none)");
  EXPECT_EQ(OpenedFor(kOfNoItem), 0u);
  EXPECT_EQ(OpenedFor(ID("a/b7/c/d")), 0u);
}

TEST_F(AnIndex, LooksForAFileNearItsStartFirst) {
  for (int i = 0; i < 200; ++i) Make("a/b" + std::to_string(i) + "/c/d");
  Make("near/y");
  MakeFile("near/y/x");
  KnowEverything();
  EXPECT_LE(OpenedForAny(ID("near/y/x"), "near"), 2u);
}

TEST_F(AnIndex, ResumesWhereItStoppedAfterASearchForAFile) {
  for (int i = 0; i < 200; ++i) Make("a/b" + std::to_string(i) + "/c/d");
  MakeFile("a/b99/x");
  const std::uint32_t file = ID("a/b99/x");
  LetChangesAge();
  // Counts the folders opened by searches for folders.
  const auto opened = [&](bool looksForAFile) {
    mIndex.emplace(mVolume);
    std::uint64_t ofFile = 0;
    for (int i = 0; i < 200; ++i) {
      ExpectFound("a/b" + std::to_string(i) + "/c/d");
      if (looksForAFile && i == 100) ofFile = OpenedForAny(file, "a/b99");
    }
    Find(kOfNoItem);
    return mIndex->OpenedFolders() - ofFile;
  };
  EXPECT_LE(opened(true), opened(false));
}

TEST_F(AnIndex, KeepsWaitingFoldersWhenASearchForAFileStops) {
  for (int i = 0; i < 100; ++i) Make("a/b" + std::to_string(i) + "/c/d");
  MakeFile("a/b50/x");
  const std::uint32_t file = ID("a/b50/x");
  LetChangesAge();
  for (int i = 0; i < 100; ++i) {
    mIndex.emplace(mVolume);
    ExpectFound("a/b" + std::to_string((i * 7) % 100) + "/c/d");
    EXPECT_EQ(FindAny(file), PathTo("a/b50/x"));
    ExpectFound("a/b" + std::to_string(i) + "/c/d");
    EXPECT_EQ(Find(kOfNoItem), "(none)");
    EXPECT_EQ(OpenedFor(ID("a/b" + std::to_string(99 - i) + "/c/d")), 0u);
  }
}

TEST_F(AnIndex, DoesNotGrowWithSearchesForFiles) {
  for (int i = 0; i < 300; ++i) Make("a/a folder of some length " + std::to_string(i) + "/c");
  for (int i = 0; i < 300; i += 10) {
    MakeFile("a/a folder of some length " + std::to_string(i) + "/x");
  }
  MakeFile("a/a folder of some length 7/c/x");
  LetChangesAge();
  FindAny(ID("a/a folder of some length 7/c/x"));
  Find(kOfNoItem);
  const std::size_t size = mIndex->Size();
  for (int round = 0; round < 10; ++round) {
    for (int i = 0; i < 300; i += 10) {
      FindAny(ID("a/a folder of some length " + std::to_string(i) + "/x"));
    }
  }
  EXPECT_LE(mIndex->Size(), 2 * size);
}

TEST_F(AnIndex, DoesNotGrowWithFoldersThatChangeBetweenStops) {
  for (int i = 0; i < 300; ++i) Make("a/a folder of some length " + std::to_string(i) + "/c");
  Find(kOfNoItem);
  const std::size_t size = mIndex->Size();
  for (int round = 0; round < 50; ++round) {
    const std::string name = "a/a folder of some length " + std::to_string(round) + "/new";
    Make(name);
    Make("a/" + std::to_string(round));
    EXPECT_EQ(Find(ID(name), "a"), PathTo(name));
  }
  EXPECT_LE(mIndex->Size(), 3 * size);
}

TEST_F(AnIndex, ReadsNothingForAnItemKnownToBeMissing) {
  for (const char* name : {"a/b/c", "a/d/e", "f/g/h"}) Make(name);
  LetChangesAge();
  EXPECT_EQ(OpenedForAny(kOfNoItem), 9u);
  EXPECT_EQ(OpenedForAny(kOfNoItem), 0u);
  EXPECT_EQ(OpenedFor(kOfNoItem), 0u);
  EXPECT_EQ(OpenedForAny(kOfNoItem, "a/b"), 0u);
}

TEST_F(AnIndex, ReadsNothingForAReferenceWithANumberKnownToBeMissing) {
  Make("a/b/c");
  const std::string path = MakeFile("a/x");
  const kernel::Item item = ItemAt("a/x");
  const std::uint32_t id = ID("a/x");
  Remove(path);
  LetChangesAge();
  EXPECT_EQ(Search({id, &item, false}, PathTo("a")), std::nullopt);
  const std::uint64_t before = mIndex->OpenedFolders();
  EXPECT_EQ(Search({id, &item, false}, PathTo("a")), std::nullopt);
  EXPECT_EQ(mIndex->OpenedFolders(), before);
}

TEST_F(AnIndex, FindsTheItemWithTheNumberOfALostReference) {
  Make("a/b/c");
  MakeFile("a/x");
  kernel::Item other = ItemAt("a/x");
  other.type = S_IFLNK;
  LetChangesAge();
  EXPECT_EQ(Search({ID("a/x"), &other, false}, PathTo("a")), std::nullopt);
  EXPECT_EQ(FindAny(ID("a/x")), PathTo("a/x"));
}

TEST_F(AnIndex, ReadsOnlyChangedFoldersForAnItemKnownToBeMissing) {
  for (int i = 0; i < 50; ++i) Make("a/b" + std::to_string(i) + "/c/d");
  const NamelessFile file(PathTo(""));
  const std::uint32_t id = mVolume->IDOf(file.Item());
  LetChangesAge();
  EXPECT_EQ(FindAny(id), "(none)");
  Make("a/b9/new");
  Make("a/b8/c/d/new");
  EXPECT_LE(OpenedForAny(id), 4u);
  file.Name(PathTo("a/b7/c/x"));
  EXPECT_LE(OpenedForAny(id), 5u);
  EXPECT_EQ(FindAny(id), PathTo("a/b7/c/x"));
}

TEST_F(AnIndex, LooksForAMissingItemInFoldersThatAnotherSearchHasRead) {
  for (const char* name : {"a/b/c", "a/d/e"}) Make(name);
  for (const char* name : {"a/d/x", "a/d/e/x"}) {
    const NamelessFile file(PathTo(""));
    const std::uint32_t id = mVolume->IDOf(file.Item());
    LetChangesAge();
    EXPECT_EQ(FindAny(id), "(none)");
    file.Name(PathTo(name));
    KnowEverything();
    EXPECT_LE(OpenedForAny(id), 1u);
    EXPECT_EQ(FindAny(id), PathTo(name));
  }
  const NamelessFile file(PathTo(""));
  const std::uint32_t id = mVolume->IDOf(file.Item());
  EXPECT_EQ(FindAny(id), "(none)");
  file.Name(PathTo("a/b/x"));
  LetChangesAge();
  EXPECT_EQ(FindAny(kOfNoItem), "(none)");
  EXPECT_EQ(FindAny(id), PathTo("a/b/x"));
}

TEST_F(AnIndex, FindsAnItemNamedWithinOneTickOfMissingIt) {
  Make("a/b");
  for (int i = 0; i < 50; ++i) {
    const NamelessFile file(PathTo(""));
    const std::uint32_t id = mVolume->IDOf(file.Item());
    EXPECT_EQ(FindAny(id), "(none)");
    file.Name(PathTo("a/b/" + std::to_string(i)));
    EXPECT_EQ(FindAny(id), PathTo("a/b/" + std::to_string(i)));
  }
}

TEST_F(AnIndex, RemembersSomeMissingItemsAndForgetsTheOldest) {
  Make("a");
  LetChangesAge();
  constexpr auto kMost = static_cast<std::uint32_t>(FolderIndex::kMostMissing);
  for (std::uint32_t i = 0; i <= kMost; ++i) FindAny(0x12340000 + i);
  const std::size_t size = mIndex->Size();
  EXPECT_EQ(OpenedForAny(0x12340000 + kMost), 0u);
  EXPECT_EQ(OpenedForAny(0x12340000 + 1), 0u);
  EXPECT_EQ(OpenedForAny(0x12340000), 2u);
  for (std::uint32_t i = 0; i <= kMost; ++i) FindAny(0x12350000 + i);
  EXPECT_EQ(mIndex->Size(), size);
}

TEST_F(AnIndex, DoesNotRereadBelowAFolderThatHasMoved) {
  for (int i = 0; i < 30; ++i) {
    Make("a/b/" + std::to_string(i) + "/x");
    Make("e/f/" + std::to_string(i) + "/x");
  }
  KnowEverything();
  Move("a/b", "e/b");
  Move("e/f", "a/f");
  EXPECT_LE(OpenedFor(kOfNoItem), 8u);
  ExpectFound("e/b/7/x");
  ExpectFound("a/f/7/x");
}

TEST_F(AnIndex, FindsUnreadFoldersBelowAFolderThatHasMoved) {
  for (int i = 0; i < 50; ++i) Make("r/g/p/" + std::to_string(i) + "/x");
  LetChangesAge();
  ExpectFound("r/g/p/25/x");
  Move("r/g", "r/h");
  for (int i = 0; i < 50; ++i) Make("r/g/p/" + std::to_string(i) + "/y");
  for (int i = 0; i < 50; ++i) {
    ExpectFound("r/h/p/" + std::to_string(i) + "/x");
    ExpectFound("r/g/p/" + std::to_string(i) + "/y");
  }
}

TEST_F(AnIndex, FindsAFolderThatWasCoveredDuringAnEarlierSearch) {
  Make("a/b/c/d");
  const std::uint32_t id = ID("a/b/c");
  LetChangesAge();
  {
    const ScopedMount cover("tmpfs", PathTo("a/b"), "tmpfs");
    ASSERT_TRUE(cover.IsMounted());
    EXPECT_EQ(Find(kOfNoItem), "(none)");
    EXPECT_EQ(FindAny(id), "(none)");
  }
  EXPECT_EQ(FindAny(id), PathTo("a/b/c"));
}

TEST_F(AnIndex, FindsItemsCoveredForAWhileInAKnownFolder) {
  Make("a/b/c/d");
  MakeFile("a/b/x");
  const std::uint32_t file = ID("a/b/x");
  KnowEverything();
  {
    const ScopedMount cover("tmpfs", PathTo("a/b"), "tmpfs");
    ASSERT_TRUE(cover.IsMounted());
    EXPECT_EQ(FindAny(file), "(none)");
    EXPECT_EQ(FindAny(file), "(none)");
  }
  EXPECT_EQ(FindAny(file), PathTo("a/b/x"));
  ExpectFound("a/b/c/d");
}

TEST_F(AnIndex, FindsAFileThatWasCoveredForAWhile) {
  Make("a/b");
  MakeFile("a/x");
  const std::uint32_t file = ID("a/x");
  LetChangesAge();
  {
    const ScopedMount cover("/dev/null", PathTo("a/x"), "", MS_BIND);
    ASSERT_TRUE(cover.IsMounted());
    EXPECT_EQ(FindAny(file), "(none)");
    EXPECT_EQ(FindAny(file), "(none)");
  }
  EXPECT_EQ(FindAny(file), PathTo("a/x"));
}

TEST_F(AnIndex, FindsAFileInAKnownFolderAtAnotherMount) {
  Make("a/b/c");
  MakeFile("a/x");
  MakeFile("a/b/y");
  const std::string again = mFolder.MakeFolder("again");
  const ScopedMount mount(PathTo("a"), again, "", MS_BIND);
  ASSERT_TRUE(mount.IsMounted());
  UseVolumeOf(PathTo(""));
  LetChangesAge();
  const auto find = [&](const std::string& name, const std::string& start) {
    return Search({ID(name), nullptr, false}, start);
  };
  Find(kOfNoItem);
  EXPECT_EQ(find("a/x", again), again + "/x");
  Find(kOfNoItem);
  EXPECT_EQ(find("a/b/y", again), again + "/b/y");
  EXPECT_EQ(find("a/b/y", PathTo("a")), PathTo("a/b/y"));
}

TEST_F(AnIndex, SearchesWhereverTheVolumeIsMounted) {
  Make("a/b");
  Make("c/d");
  const std::uint32_t inFirst = ID("a/b");
  const std::uint32_t inSecond = ID("c/d");
  const std::string first = mFolder.MakeFolder("first");
  const std::string second = mFolder.MakeFolder("second");
  const ScopedMount firstMount(PathTo("a"), first, "", MS_BIND);
  const ScopedMount secondMount(PathTo("c"), second, "", MS_BIND);
  mMount.reset();
  UseVolumeOf(first);
  ASSERT_EQ(mVolume->Listed().MountPoints().size(), 2u);
  EXPECT_EQ(Search({inSecond, nullptr, true}, first + "/b"), second + "/d");
  mIndex.emplace(mVolume);
  EXPECT_EQ(Search({inFirst, nullptr, true}, second + "/d"), first + "/b");
}

TEST_F(AnIndex, RetriesAFolderThatCouldNotBeOpenedForAWhile) {
  Make("a/b/c");
  KnowEverything();
  Make("a/b/new/x");
  const std::uint32_t id = ID("a/b/new/x");
  {
    const FewDescriptors none(0);
    EXPECT_EQ(Find(id), "(none)");
  }
  EXPECT_EQ(Find(id), PathTo("a/b/new/x"));
  ExpectFound("a/b");
  ExpectFound("a/b/c");
}

TEST_F(AnIndex, FindsFoldersDeeperThanItHasDescriptors) {
  Make("a/b/c/d/e/f");
  MakeFile("a/b/c/d/e/f/x");
  const std::uint32_t file = ID("a/b/c/d/e/f/x");
  Find(kOfNoItem);
  const FewDescriptors few(4);
  EXPECT_EQ(FindAny(file), PathTo("a/b/c/d/e/f/x"));
}

TEST_F(AnIndex, DoesNotTakeInvisibleItemsForMissing) {
  Make("a/b/c/d/e/f");
  MakeFile("a/b/c/d/e/f/x");
  const std::uint32_t id = ID("a/b/c/d/e/f/x");
  KnowEverything();
  {
    const FewDescriptors none(0);
    EXPECT_EQ(FindAny(id), "(none)");
  }
  EXPECT_EQ(FindAny(id), PathTo("a/b/c/d/e/f/x"));
}

TEST_F(AnIndex, FindsAFileInAnOverlayOfTwoFileSystemsByItsOwnNumber) {
  const std::string other = mFolder.MakeFolder("other");
  const ScopedMount lower("tmpfs", other, "tmpfs");
  mFolder.MakeFolder("other/a");
  mFolder.MakeFile("other/a/x");
  Make("a");
  MakeFile("a/y");
  const std::string place = mFolder.MakeFolder("overlay");
  const ScopedMount overlay("overlay", place, "overlay", 0, "lowerdir=" + mTop + ":" + other);
  if (!overlay.IsMounted()) GTEST_SKIP() << "no overlay here";
  mTop = place;
  UseVolumeOf(place);
  EXPECT_EQ(FindAny(ID("a/x")), PathTo("a/x"));
  EXPECT_EQ(FindAny(ID("a/y")), PathTo("a/y"));
}

// Searches for an id that two items could share, on a volume whose inode numbers identify items.
class AnIndexOfMixedIDs : public AnIndex {
 protected:
  void SetUp() override {
    if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    mNumbered.emplace(NumberedFileSystem::On::kBlockDevice);
    if (!mNumbered->IsMounted()) GTEST_SKIP() << "no FUSE or no loop device here";
    std::filesystem::permissions(mNumbered->Path().parent_path(), std::filesystem::perms(0755));
    mTop = mNumbered->Path();
    UseVolumeOf(mTop);
    ASSERT_EQ(mVolume->Kind().name, "fuseblk");
    mSmall = mNumbered->MakeFolder("small", 0x80000000);
    mID = mVolume->IDOf(ItemOf(mSmall));
    ASSERT_FALSE(mVolume->IsCertain(mID));
    Make("deep/1/2/3/4/5/6/7");
  }

  std::optional<NumberedFileSystem> mNumbered;
  std::string mSmall;
  std::uint32_t mID = 0;
};

TEST_F(AnIndexOfMixedIDs, FindsNoneUnlessEveryFolderCouldBeOpened) {
  {
    const FewDescriptors few(4);
    EXPECT_EQ(Find(mID), "(none)");
    EXPECT_EQ(FindAny(mID), "(none)");
    EXPECT_EQ(Find(mID), "(none)");
  }
  EXPECT_EQ(Find(mID), mSmall);
  EXPECT_EQ(FindAny(mID), mSmall);
  ExpectFound("deep/1/2/3/4/5/6/7");
}

TEST_F(AnIndexOfMixedIDs, FindsNoneWhenAKnownFolderCannotBeLookedAt) {
  LetChangesAge();
  EXPECT_EQ(Find(mID), mSmall);
  Make("deep/1/2/3/new");
  {
    const FewDescriptors none(0);
    EXPECT_EQ(Find(mID), "(none)");
  }
  EXPECT_EQ(Find(mID), mSmall);
  ExpectFound("deep/1/2/3/new");
}

TEST_F(AnIndexOfMixedIDs, FindsNoneWhenAFolderCannotBeReadToItsEnd) {
  const pid_t child = fork();
  if (child == 0) {
    if (!test::RefuseCall(SYS_getdents64, EIO)) _exit(2);
    const bool isCertainFound = Find(ID("deep"), "deep") == PathTo("deep");
    _exit(isCertainFound && Find(mID) == "(none)" ? 0 : 1);
  }
  int status = 0;
  waitpid(child, &status, 0);
  if (WIFEXITED(status) && WEXITSTATUS(status) == 2) GTEST_SKIP() << "no seccomp here";
  EXPECT_EQ(status, 0);
  EXPECT_EQ(Find(mID), mSmall);
}

TEST_F(AnIndexOfMixedIDs, SkipsFoldersWithoutPermission) {
  chmod(PathTo("deep/1/2").c_str(), 0700);
  EXPECT_TRUE(HoldsForNobody(
      [&] { return Find(mID) == mSmall && FindAny(mID) == mSmall && Find(mID) == mSmall; }));
}

TEST_F(AnIndexOfMixedIDs, SkipsFoldersWithoutAPath) {
  kernel::Descriptor folder(open(PathTo("deep").c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  const std::string name(250, 'd');
  for (int depth = 0; depth < 40; ++depth) {
    // Of the folders beside the way down, one is visited before it and one on the way back.
    ASSERT_EQ(mkdirat(folder.Get(), "one", 0700), 0);
    ASSERT_EQ(mkdirat(folder.Get(), name.c_str(), 0700), 0);
    ASSERT_EQ(mkdirat(folder.Get(), "other", 0700), 0);
    folder =
        kernel::Descriptor(openat(folder.Get(), name.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  }
  for (int round = 0; round < 3; ++round) {
    EXPECT_EQ(Find(mID), mSmall);
    EXPECT_EQ(FindAny(mID), mSmall);
  }
}

TEST_F(AnIndexOfMixedIDs, FindsAFileThatGetsAnIDWhichWasMissingWithoutAChangeOfItsFolder) {
  const std::string file = mNumbered->MakeFile("deep/1/file", 500);
  LetChangesAge();
  EXPECT_EQ(FindAny(500), file);
  EXPECT_EQ(FindAny(600), "(none)");
  ASSERT_TRUE(NumberedFileSystem::Renumber(file, 600));
  EXPECT_EQ(FindAny(600), file);
  EXPECT_EQ(FindAny(500), "(none)");
}

// An access to a dead mount never returns; the alarm would then end the test program.
class AnIndexBesideADeadMount : public AnIndex {
 protected:
  void SetUp() override {
    AnIndex::SetUp();
    if (IsSkipped()) return;
    Make("a/dead/below/deeper");
    Make("a/other");
    mCovered = ID("a/dead");
    mBelow = ID("a/dead/below/deeper");
  }
  void Kill() {
    mDead.emplace(PathTo("a/dead"));
    if (!mDead->IsMounted()) GTEST_SKIP() << "no FUSE here";
    alarm(20);
  }
  void TearDown() override {
    mDead.reset();
    alarm(0);
  }

  std::uint32_t mCovered = 0;
  std::uint32_t mBelow = 0;
  std::optional<DeadMount> mDead;
};

TEST_F(AnIndexBesideADeadMount, EndsWithoutWaiting) {
  Kill();
  if (IsSkipped()) return;
  EXPECT_EQ(Find(kOfNoItem), "(none)");
  ExpectFound("a/other");
}

TEST_F(AnIndexBesideADeadMount, DoesNotAccessTheMountForTheFolderThatItCovers) {
  Kill();
  if (IsSkipped()) return;
  EXPECT_EQ(Find(mCovered), "(none)");
  EXPECT_EQ(Search({mCovered, nullptr, false}, PathTo("a")), std::nullopt);
}

TEST_F(AnIndexBesideADeadMount, DoesNotSearchKnownFoldersBelowIt) {
  EXPECT_EQ(Find(mBelow), PathTo("a/dead/below/deeper"));
  EXPECT_EQ(Find(mCovered), PathTo("a/dead"));
  Kill();
  if (IsSkipped()) return;
  EXPECT_EQ(Find(mBelow), "(none)");
  EXPECT_EQ(Find(mCovered), "(none)");
}

TEST_F(AnIndexBesideADeadMount, DoesNotFollowALinkThereInAFoldersPlace) {
  for (const char* name : {"gone/below", "moved/below"}) Make(name);
  const std::uint32_t gone = ID("gone/below");
  const std::uint32_t moved = ID("moved/below");
  KnowEverything();
  Kill();
  if (IsSkipped()) return;
  Remove(PathTo("gone"));
  Move("moved", "elsewhere");
  for (const char* name : {"gone", "moved"}) {
    std::filesystem::create_directory_symlink(PathTo("a/dead"), PathTo(name));
  }
  EXPECT_EQ(Find(moved), PathTo("elsewhere/below"));
  EXPECT_EQ(Find(gone), "(none)");
}

// --- A volume that is elsewhere for a while -----------------------------------------------------

class AnIndexOfAMovingVolume : public AnIndex {
 protected:
  void SetUp() override {
    AnIndex::SetUp();
    if (IsSkipped()) return;
    for (const char* name : {"a/b", "c/d"}) Make(name);
    mElsewhere = mFolder.MakeFolder("elsewhere");
    KnowEverything();
    mID = ID("c/d");
  }
  void TearDown() override { MoveBack(); }
  void MoveAway() const {
    EXPECT_EQ(mount(mTop.c_str(), mElsewhere.c_str(), nullptr, MS_MOVE, nullptr), 0);
  }
  void MoveBack() const { mount(mElsewhere.c_str(), mTop.c_str(), nullptr, MS_MOVE, nullptr); }

  std::string mElsewhere;
  std::uint32_t mID = 0;
};

TEST_F(AnIndexOfAMovingVolume, RecognisesItAfterASearchWhileItWasAway) {
  const volumes::VolumesPointer before = mTable.Now();
  MoveAway();
  EXPECT_EQ(mIndex->Find({kOfNoItem, nullptr, true}, mTop, *before), std::nullopt);
  MoveBack();
  EXPECT_EQ(Find(mID), PathTo("c/d"));
}

TEST_F(AnIndexOfAMovingVolume, RecognisesItAfterItMovedDuringASearch) {
  Make("new");
  bool isAway = false;
  {
    const test::BeforeEntries entries([&](int) {
      if (!std::exchange(isAway, true)) MoveAway();
    });
    EXPECT_EQ(Find(kOfNoItem), "(none)");
  }
  ASSERT_TRUE(isAway);
  MoveBack();
  EXPECT_EQ(Find(mID), PathTo("c/d"));
}

}  // namespace
}  // namespace tallowmere::catalog
