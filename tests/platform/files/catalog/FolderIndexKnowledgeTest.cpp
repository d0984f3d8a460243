// What an index keeps from one search to the next, and what it does not touch.
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sys/mount.h>
#include <sys/prctl.h>
#include <sys/resource.h>
#include <sys/syscall.h>

#include <array>
#include <cerrno>
#include <chrono>
#include <cstddef>
#include <thread>

#include "CatalogFixture.h"
#include "files/FolderIndex.h"
#include "support/DeadMount.h"

namespace tallowmere::files {
namespace {

using test::DeadMount;
using test::EnterOwnMountNamespace;
using test::ScopedMount;
using test::TemporaryFolder;

// Longer than a change can be followed by another with the same time.
void LetChangesAge() {
  std::this_thread::sleep_for(std::chrono::milliseconds(2100));
}

std::size_t OpenDescriptors() {
  std::size_t count = 0;
  for ([[maybe_unused]] const auto& entry : std::filesystem::directory_iterator("/proc/self/fd")) {
    ++count;
  }
  return count;
}

// While it lives, at most so many more descriptors can be opened.
class FewDescriptors {
 public:
  explicit FewDescriptors(std::size_t more) {
    getrlimit(RLIMIT_NOFILE, &mBefore);
    const Descriptor lowest(dup(STDIN_FILENO));
    const rlimit tight{static_cast<rlim_t>(lowest.Get()) + more, mBefore.rlim_max};
    EXPECT_EQ(setrlimit(RLIMIT_NOFILE, &tight), 0);
  }
  FewDescriptors(const FewDescriptors&) = delete;
  FewDescriptors& operator=(const FewDescriptors&) = delete;
  ~FewDescriptors() { setrlimit(RLIMIT_NOFILE, &mBefore); }

 private:
  rlimit mBefore{};
};

// From now on no folder can be read in this process. False where that cannot be arranged.
bool BreakReadingOfFolders() {
  std::array filter{
      sock_filter BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr)),
      sock_filter BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_getdents64, 0, 1),
      sock_filter BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | EIO),
      sock_filter BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW),
  };
  const sock_fprog program{filter.size(), filter.data()};
  return prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) == 0 &&
         prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program) == 0;
}

// A file without a name until it is given one.
class NamelessFile {
 public:
  explicit NamelessFile(const std::string& volume)
      : mFile(open(volume.c_str(), O_TMPFILE | O_RDWR | O_CLOEXEC, 0644)) {}
  ItemReference Item() const {
    const auto item = ReadItem(mFile.Get(), "");
    EXPECT_TRUE(item);
    return item.value_or(ItemReference{});
  }
  void Name(const std::string& path) const {
    const std::string link = "/proc/self/fd/" + std::to_string(mFile.Get());
    EXPECT_EQ(linkat(AT_FDCWD, link.c_str(), AT_FDCWD, path.c_str(), AT_SYMLINK_FOLLOW), 0);
  }

 private:
  Descriptor mFile;
};

class AnIndex : public testing::Test {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    mMount.emplace("tmpfs", mFolder.MakeFolder("volume"), "tmpfs");
    ASSERT_TRUE(mMount->IsMounted());
    MakeFirstItems();
    std::filesystem::permissions(mFolder.Path(), std::filesystem::perms(0755));
    UseVolumeOf(PathTo(""));
  }
  // They have numbers that do not fit.
  virtual void MakeFirstItems() {
    for (int i = 0; i < 20; ++i) Remove(Make("first"));
  }
  void UseVolumeOf(const std::string& path) {
    const auto item = ReadItem(AT_FDCWD, path.c_str());
    ASSERT_TRUE(item);
    mVolume = MountTable::OfThisProcess().OfItem(*item, path);
    ASSERT_TRUE(mVolume);
    mIndex.emplace(mVolume);
  }

  std::string PathTo(const std::string& name) const {
    const std::string path = mFolder.Path() / "volume";
    return name.empty() ? path : path + "/" + name;
  }
  ItemReference ItemAt(const std::string& name) const {
    const auto item = ReadItem(AT_FDCWD, PathTo(name).c_str());
    EXPECT_TRUE(item) << name;
    return item.value_or(ItemReference{});
  }
  std::uint32_t ID(const std::string& name) const {
    return NodeIDOf(ItemAt(name), *mVolume->Root());
  }
  std::string Make(const std::string& name) const {
    return mFolder.MakeFolder("volume/" + name).string();
  }
  void Move(const std::string& from, const std::string& to) const {
    std::filesystem::rename(PathTo(from), PathTo(to));
  }
  static void Remove(const std::string& path) { std::filesystem::remove_all(path); }

  // Where the index finds a folder, "(none)" where it does not.
  std::string Find(std::uint32_t id, const std::string& start = "") {
    return mIndex->Find({id, nullptr, true}, PathTo(start)).value_or("(none)");
  }
  // How many folders a search opens.
  std::uint64_t OpenedFor(std::uint32_t id) {
    const std::uint64_t before = mIndex->OpenedFolders();
    Find(id);
    return mIndex->OpenedFolders() - before;
  }
  // Where the index finds an item of any kind, "(none)" where it does not.
  std::string FindAny(std::uint32_t id, const std::string& start = "") {
    return mIndex->Find({id, nullptr, false}, PathTo(start)).value_or("(none)");
  }
  std::uint64_t OpenedForAny(std::uint32_t id, const std::string& start = "") {
    const std::uint64_t before = mIndex->OpenedFolders();
    FindAny(id, start);
    return mIndex->OpenedFolders() - before;
  }
  std::string MakeFile(const std::string& name) const {
    return mFolder.MakeFile("volume/" + name).string();
  }
  void ExpectFound(const std::string& name) { EXPECT_EQ(Find(ID(name)), PathTo(name)); }

  std::uint32_t IDOfWhatIsGone() const {
    const std::string path = Make("gone");
    const std::uint32_t id = ID("gone");
    Remove(path);
    return id;
  }

  TemporaryFolder mFolder;
  std::optional<ScopedMount> mMount;
  VolumePointer mVolume;
  std::optional<FolderIndex> mIndex;
};

TEST_F(AnIndex, AnswersTheNextQuestionFromWhatItLearned) {
  for (const char* name : {"a/b/c", "a/d/e", "f/g/h"}) Make(name);
  EXPECT_EQ(Find(IDOfWhatIsGone()), "(none)");
  for (const char* name : {"a", "a/b", "a/b/c", "a/d/e", "f", "f/g/h"}) {
    EXPECT_EQ(OpenedFor(ID(name)), 0u) << name;
    ExpectFound(name);
  }
}

TEST_F(AnIndex, TellsTheNewPlaceOfAFolderAtWhichItStarts) {
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
  LetChangesAge();
  Find(IDOfWhatIsGone());
  LetChangesAge();
  Find(IDOfWhatIsGone());
  Make("a/b7/c/new");
  EXPECT_LE(OpenedFor(ID("a/b7/c/new")), 2u);
  ExpectFound("a/b7/c/new");
}

TEST_F(AnIndex, FindsWhatIsMadeWithinOneTickOfTheLastLook) {
  Make("a/b");
  for (int i = 0; i < 50; ++i) {
    const std::string name = "a/b/" + std::to_string(i);
    Make(name);
    ExpectFound(name);
  }
}

// Where times are counted in twos of seconds, another change could have the same one.
TEST_F(AnIndex, ReadsAgainWhatHadChangedHalfASecondBeforeTheLastLook) {
  Make("a/b");
  const std::uint32_t gone = IDOfWhatIsGone();
  std::this_thread::sleep_for(std::chrono::milliseconds(500));
  EXPECT_GT(OpenedFor(gone), 0u);
  EXPECT_GT(OpenedFor(gone), 0u);
}

TEST_F(AnIndex, FindsAFolderDeepInASubtreeThatHasMoved) {
  Make("a/b/c/d");
  Make("e");
  Find(IDOfWhatIsGone());
  LetChangesAge();
  Find(IDOfWhatIsGone());
  Move("a/b", "e/z");
  ExpectFound("e/z/c/d");
  ExpectFound("e/z/c");
  ExpectFound("e/z");
}

TEST_F(AnIndex, FindsEverythingInFoldersThatChangedPlaces) {
  Make("a/x/below");
  Make("b/x/below");
  ExpectFound("a/x/below");
  ExpectFound("b/x/below");
  LetChangesAge();
  Find(IDOfWhatIsGone());
  Move("a", "c");
  Move("b", "a");
  Move("c", "b");
  for (const char* name : {"a", "b", "a/x", "b/x", "a/x/below", "b/x/below"}) ExpectFound(name);
}

TEST_F(AnIndex, FindsFoldersThatHaveTakenEachOthersPlaceInTheWay) {
  Make("a/b");
  ExpectFound("a/b");
  const std::uint32_t outer = ID("a");
  Move("a/b", "b");
  Move("a", "b/a");
  EXPECT_EQ(Find(outer), PathTo("b/a"));
  ExpectFound("b");
}

TEST_F(AnIndex, DoesNotFindADeletedFolderNorTakeItsSuccessorForIt) {
  const std::string path = Make("a/b/c");
  const std::uint32_t id = ID("a/b/c");
  ExpectFound("a/b/c");
  Remove(path);
  Make("a/b/c");
  EXPECT_EQ(Find(id), "(none)");
  ExpectFound("a/b/c");
}

TEST_F(AnIndex, FindsAFolderAgainThatWasAwayForAWhile) {
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
  EXPECT_EQ(mIndex->Find({ID("near/x/y"), nullptr, true}, PathTo("near")), PathTo("near/x/y"));
  EXPECT_LT(mIndex->OpenedFolders(), 10u);
}

TEST_F(AnIndex, GoesOnWhereItStopped) {
  for (int i = 0; i < 200; ++i) Make("a/b" + std::to_string(i) + "/c/d");
  LetChangesAge();
  for (int i = 0; i < 200; ++i) ExpectFound("a/b" + std::to_string(i) + "/c/d");
  // Each of the folders that hold folders about once, and where it had stopped once more.
  EXPECT_LE(mIndex->OpenedFolders(), 2u * (200 * 2 + 2));
}

TEST_F(AnIndex, HasNothingOpenBetweenTwoSearches) {
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
  const std::string none = Find(0x12345678);
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
    Find(0x12345678);
    const std::size_t folders = i + 12;
    const std::size_t names = (kNameSize + 1) * folders * 5 / 4;
    EXPECT_LE(mIndex->Size(), 64 * folders + names + 8192) << i;
  }
}

TEST_F(AnIndex, DoesNotGrowWithFoldersThatComeAndGo) {
  for (int i = 0; i < 100; ++i) Make("a/" + std::to_string(i) + "/x");
  Find(0x12345678);
  const std::size_t size = mIndex->Size();
  for (int round = 0; round < 100; ++round) {
    const std::string path = Make("b/c");
    for (int i = 0; i < 20; ++i) Make("b/c/a folder of some length " + std::to_string(i));
    Find(0x12345678);
    Remove(path);
    Find(0x12345678);
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
      return index.Find({wanted, nullptr, true}, PathTo(""));
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

TEST_F(AnIndex, DoesNotEnterWhatIsMountedInTheVolume) {
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
  const VolumePointer volume = MountTable::OfThisProcess().OfItem(ItemAt("a"), PathTo("a"));
  ASSERT_EQ(volume->MountPoints().size(), 2u);
  mIndex.emplace(volume);
  ExpectFound("a/b/c");
  EXPECT_EQ(mIndex->Find({ID("a/b"), nullptr, true}, mFolder.Path() / "again/b"), PathTo("a/b"));
}

TEST_F(AnIndex, ReadsTheFoldersThatItKnowsForAFile) {
  Make("a/b/c");
  MakeFile("a/b/c/x");
  MakeFile("a/y");
  LetChangesAge();
  Find(0x12345678);
  EXPECT_EQ(FindAny(ID("a/b/c/x")), PathTo("a/b/c/x"));
  EXPECT_EQ(FindAny(ID("a/y")), PathTo("a/y"));
}

TEST_F(AnIndex, ReadsEachFolderOnceForAFileHoweverRecentItIs) {
  constexpr std::uint64_t kFolders = 1 + 3 + 10;
  Make("a/b/c");
  for (int i = 0; i < 10; ++i) Make("a/b/" + std::to_string(i));
  EXPECT_EQ(OpenedForAny(0x12345678, "a/b/c"), kFolders);
  EXPECT_EQ(OpenedForAny(0x12345679, "a/b"), kFolders);
  LetChangesAge();
  EXPECT_EQ(OpenedForAny(0x1234567A, "a/b/c"), kFolders);
  EXPECT_EQ(OpenedForAny(0x1234567B, "a/b/c"), kFolders);
}

TEST_F(AnIndex, KeepsTheFoldersThatItKnowsWhileItLooksForAFile) {
  for (int i = 0; i < 20; ++i) Make("a/b" + std::to_string(i) + "/c/d");
  MakeFile("a/x");
  LetChangesAge();
  Find(0x12345678);
  EXPECT_EQ(FindAny(ID("a/x"), "a"), PathTo("a/x"));
  EXPECT_EQ(OpenedFor(0x12345678), 0u);
  EXPECT_EQ(FindAny(0x12345678), "(none)");
  EXPECT_EQ(OpenedFor(0x12345678), 0u);
  EXPECT_EQ(OpenedFor(ID("a/b7/c/d")), 0u);
}

TEST_F(AnIndex, LooksForAFileNearItsStartFirst) {
  for (int i = 0; i < 200; ++i) Make("a/b" + std::to_string(i) + "/c/d");
  Make("near/y");
  MakeFile("near/y/x");
  LetChangesAge();
  Find(0x12345678);
  EXPECT_LE(OpenedForAny(ID("near/y/x"), "near"), 2u);
}

TEST_F(AnIndex, GoesOnWhereItStoppedAfterALookForAFile) {
  for (int i = 0; i < 200; ++i) Make("a/b" + std::to_string(i) + "/c/d");
  MakeFile("a/b99/x");
  const std::uint32_t file = ID("a/b99/x");
  LetChangesAge();
  // The folders that are opened for folders.
  const auto opened = [&](bool looksForAFile) {
    mIndex.emplace(mVolume);
    std::uint64_t ofFile = 0;
    for (int i = 0; i < 200; ++i) {
      ExpectFound("a/b" + std::to_string(i) + "/c/d");
      if (looksForAFile && i == 100) ofFile = OpenedForAny(file, "a/b99");
    }
    Find(0x12345678);
    return mIndex->OpenedFolders() - ofFile;
  };
  EXPECT_LE(opened(true), opened(false));
}

TEST_F(AnIndex, KeepsWhatWaitedWhenALookForAFileStops) {
  for (int i = 0; i < 100; ++i) Make("a/b" + std::to_string(i) + "/c/d");
  MakeFile("a/b50/x");
  const std::uint32_t file = ID("a/b50/x");
  LetChangesAge();
  for (int i = 0; i < 100; ++i) {
    mIndex.emplace(mVolume);
    ExpectFound("a/b" + std::to_string((i * 7) % 100) + "/c/d");
    EXPECT_EQ(FindAny(file), PathTo("a/b50/x"));
    ExpectFound("a/b" + std::to_string(i) + "/c/d");
    EXPECT_EQ(Find(0x12345678), "(none)");
    EXPECT_EQ(OpenedFor(ID("a/b" + std::to_string(99 - i) + "/c/d")), 0u);
  }
}

TEST_F(AnIndex, DoesNotGrowWithLooksForFiles) {
  for (int i = 0; i < 300; ++i) Make("a/a folder of some length " + std::to_string(i) + "/c");
  for (int i = 0; i < 300; i += 10) {
    MakeFile("a/a folder of some length " + std::to_string(i) + "/x");
  }
  MakeFile("a/a folder of some length 7/c/x");
  LetChangesAge();
  FindAny(ID("a/a folder of some length 7/c/x"));
  Find(0x12345678);
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
  Find(0x12345678);
  const std::size_t size = mIndex->Size();
  for (int round = 0; round < 50; ++round) {
    const std::string name = "a/a folder of some length " + std::to_string(round) + "/new";
    Make(name);
    Make("a/" + std::to_string(round));
    EXPECT_EQ(Find(ID(name), "a"), PathTo(name));
  }
  EXPECT_LE(mIndex->Size(), 3 * size);
}

TEST_F(AnIndex, ReadsNothingForAnItemThatItHasMissed) {
  for (const char* name : {"a/b/c", "a/d/e", "f/g/h"}) Make(name);
  LetChangesAge();
  EXPECT_EQ(OpenedForAny(0x12345678), 9u);
  EXPECT_EQ(OpenedForAny(0x12345678), 0u);
  EXPECT_EQ(OpenedFor(0x12345678), 0u);
  EXPECT_EQ(OpenedForAny(0x12345678, "a/b"), 0u);
}

TEST_F(AnIndex, ReadsNothingForAReferenceWhoseNumberItHasMissed) {
  Make("a/b/c");
  const std::string path = MakeFile("a/x");
  const ItemReference item = ItemAt("a/x");
  const std::uint32_t id = ID("a/x");
  Remove(path);
  LetChangesAge();
  EXPECT_EQ(mIndex->Find({id, &item, false}, PathTo("a")), std::nullopt);
  const std::uint64_t before = mIndex->OpenedFolders();
  EXPECT_EQ(mIndex->Find({id, &item, false}, PathTo("a")), std::nullopt);
  EXPECT_EQ(mIndex->OpenedFolders(), before);
}

TEST_F(AnIndex, DoesNotMissTheItemThatHasTheNumberOfALostReference) {
  Make("a/b/c");
  MakeFile("a/x");
  ItemReference other = ItemAt("a/x");
  other.type = S_IFLNK;
  LetChangesAge();
  EXPECT_EQ(mIndex->Find({ID("a/x"), &other, false}, PathTo("a")), std::nullopt);
  EXPECT_EQ(FindAny(ID("a/x")), PathTo("a/x"));
}

TEST_F(AnIndex, ReadsOnlyWhatHasChangedForAnItemThatItHasMissed) {
  for (int i = 0; i < 50; ++i) Make("a/b" + std::to_string(i) + "/c/d");
  const NamelessFile file(PathTo(""));
  const std::uint32_t id = NodeIDOf(file.Item(), *mVolume->Root());
  LetChangesAge();
  EXPECT_EQ(FindAny(id), "(none)");
  Make("a/b9/new");
  Make("a/b8/c/d/new");
  EXPECT_LE(OpenedForAny(id), 4u);
  file.Name(PathTo("a/b7/c/x"));
  EXPECT_LE(OpenedForAny(id), 5u);
  EXPECT_EQ(FindAny(id), PathTo("a/b7/c/x"));
}

TEST_F(AnIndex, ReadsForAMissedItemWhatWasReadForAnotherQuestion) {
  for (const char* name : {"a/b/c", "a/d/e"}) Make(name);
  for (const char* name : {"a/d/x", "a/d/e/x"}) {
    const NamelessFile file(PathTo(""));
    const std::uint32_t id = NodeIDOf(file.Item(), *mVolume->Root());
    LetChangesAge();
    EXPECT_EQ(FindAny(id), "(none)");
    file.Name(PathTo(name));
    LetChangesAge();
    Find(0x12345678);
    EXPECT_LE(OpenedForAny(id), 1u);
    EXPECT_EQ(FindAny(id), PathTo(name));
  }
  const NamelessFile file(PathTo(""));
  const std::uint32_t id = NodeIDOf(file.Item(), *mVolume->Root());
  EXPECT_EQ(FindAny(id), "(none)");
  file.Name(PathTo("a/b/x"));
  LetChangesAge();
  EXPECT_EQ(FindAny(0x12345678), "(none)");
  EXPECT_EQ(FindAny(id), PathTo("a/b/x"));
}

TEST_F(AnIndex, FindsWhatIsNamedWithinOneTickOfMissingIt) {
  Make("a/b");
  for (int i = 0; i < 50; ++i) {
    const NamelessFile file(PathTo(""));
    const std::uint32_t id = NodeIDOf(file.Item(), *mVolume->Root());
    EXPECT_EQ(FindAny(id), "(none)");
    file.Name(PathTo("a/b/" + std::to_string(i)));
    EXPECT_EQ(FindAny(id), PathTo("a/b/" + std::to_string(i)));
  }
}

TEST_F(AnIndex, NotesSoManyMissedItemsAndForgetsTheOldest) {
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

TEST_F(AnIndex, DoesNotReadAgainWhatIsBelowAFolderThatHasMoved) {
  for (int i = 0; i < 30; ++i) {
    Make("a/b/" + std::to_string(i) + "/x");
    Make("e/f/" + std::to_string(i) + "/x");
  }
  LetChangesAge();
  Find(0x12345678);
  Move("a/b", "e/b");
  Move("e/f", "a/f");
  EXPECT_LE(OpenedFor(0x12345678), 8u);
  ExpectFound("e/b/7/x");
  ExpectFound("a/f/7/x");
}

TEST_F(AnIndex, FindsWhatWaitedInAFolderBelowOneThatHasMoved) {
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

TEST_F(AnIndex, FindsWhatWasCoveredWhenItsFolderWasRead) {
  Make("a/b/c/d");
  const std::uint32_t id = ID("a/b/c");
  LetChangesAge();
  {
    const ScopedMount cover("tmpfs", PathTo("a/b"), "tmpfs");
    ASSERT_TRUE(cover.IsMounted());
    EXPECT_EQ(Find(0x12345678), "(none)");
    EXPECT_EQ(FindAny(id), "(none)");
  }
  EXPECT_EQ(FindAny(id), PathTo("a/b/c"));
}

TEST_F(AnIndex, FindsInAFolderThatItKnowsWhatWasCoveredForAWhile) {
  Make("a/b/c/d");
  MakeFile("a/b/x");
  const std::uint32_t file = ID("a/b/x");
  LetChangesAge();
  Find(0x12345678);
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

TEST_F(AnIndex, FindsAFileInAFolderThatItKnowsUnderAnotherMount) {
  Make("a/b/c");
  MakeFile("a/x");
  MakeFile("a/b/y");
  const std::string again = mFolder.MakeFolder("again");
  const ScopedMount mount(PathTo("a"), again, "", MS_BIND);
  ASSERT_TRUE(mount.IsMounted());
  UseVolumeOf(PathTo(""));
  LetChangesAge();
  const auto find = [&](const std::string& name, const std::string& start) {
    return mIndex->Find({ID(name), nullptr, false}, start);
  };
  Find(0x12345678);
  EXPECT_EQ(find("a/x", again), again + "/x");
  Find(0x12345678);
  EXPECT_EQ(find("a/b/y", again), again + "/b/y");
  EXPECT_EQ(find("a/b/y", PathTo("a")), PathTo("a/b/y"));
}

TEST_F(AnIndex, LooksWhereverTheVolumeIsMounted) {
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
  ASSERT_EQ(mVolume->MountPoints().size(), 2u);
  EXPECT_EQ(mIndex->Find({inSecond, nullptr, true}, first + "/b"), second + "/d");
  mIndex.emplace(mVolume);
  EXPECT_EQ(mIndex->Find({inFirst, nullptr, true}, second + "/d"), first + "/b");
}

TEST_F(AnIndex, RemembersAFolderThatCouldNotBeOpenedForAWhile) {
  Make("a/b/c");
  LetChangesAge();
  Find(0x12345678);
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

TEST_F(AnIndex, FindsWhatIsDeeperThanItHasDescriptors) {
  Make("a/b/c/d/e/f");
  MakeFile("a/b/c/d/e/f/x");
  const std::uint32_t file = ID("a/b/c/d/e/f/x");
  Find(0x12345678);
  const FewDescriptors few(4);
  EXPECT_EQ(FindAny(file), PathTo("a/b/c/d/e/f/x"));
}

TEST_F(AnIndex, DoesNotNoteAsMissedWhatItCouldNotSee) {
  Make("a/b/c/d/e/f");
  MakeFile("a/b/c/d/e/f/x");
  const std::uint32_t id = ID("a/b/c/d/e/f/x");
  LetChangesAge();
  Find(0x12345678);
  {
    const FewDescriptors none(0);
    EXPECT_EQ(FindAny(id), "(none)");
  }
  EXPECT_EQ(FindAny(id), PathTo("a/b/c/d/e/f/x"));
}

// An id that two items could have.
class AnIndexOfMixedIDs : public AnIndex {
 protected:
  void SetUp() override {
    AnIndex::SetUp();
    if (IsSkipped()) return;
    mID = ID("small");
    ASSERT_FALSE(IsInodeNumber(mID));
    Make("deep/1/2/3/4/5/6/7");
  }
  void MakeFirstItems() override {
    Make("small");
    AnIndex::MakeFirstItems();
  }

  std::uint32_t mID = 0;
};

TEST_F(AnIndexOfMixedIDs, FindsNoneUnlessEveryFolderCouldBeOpened) {
  {
    const FewDescriptors few(4);
    EXPECT_EQ(Find(mID), "(none)");
    EXPECT_EQ(FindAny(mID), "(none)");
    EXPECT_EQ(Find(mID), "(none)");
  }
  EXPECT_EQ(Find(mID), PathTo("small"));
  EXPECT_EQ(FindAny(mID), PathTo("small"));
  ExpectFound("deep/1/2/3/4/5/6/7");
}

TEST_F(AnIndexOfMixedIDs, FindsNoneWhenTheLookAtWhatItKnowsFails) {
  LetChangesAge();
  EXPECT_EQ(Find(mID), PathTo("small"));
  Make("deep/1/2/3/new");
  {
    const FewDescriptors none(0);
    EXPECT_EQ(Find(mID), "(none)");
  }
  EXPECT_EQ(Find(mID), PathTo("small"));
  ExpectFound("deep/1/2/3/new");
}

TEST_F(AnIndexOfMixedIDs, FindsNoneWhenAFolderCannotBeReadToItsEnd) {
  const pid_t child = fork();
  if (child == 0) {
    if (!BreakReadingOfFolders()) _exit(2);
    const bool isCertainFound = Find(ID("deep"), "deep") == PathTo("deep");
    _exit(isCertainFound && Find(mID, "small") == "(none)" ? 0 : 1);
  }
  int status = 0;
  waitpid(child, &status, 0);
  if (WIFEXITED(status) && WEXITSTATUS(status) == 2) GTEST_SKIP() << "no seccomp here";
  EXPECT_EQ(status, 0);
  EXPECT_EQ(Find(mID, "small"), PathTo("small"));
}

TEST_F(AnIndexOfMixedIDs, PassesOverFoldersWithoutPermission) {
  chmod(PathTo("deep/1/2").c_str(), 0700);
  EXPECT_TRUE(HoldsForNobody([&] {
    return Find(mID) == PathTo("small") && FindAny(mID) == PathTo("small") &&
           Find(mID) == PathTo("small");
  }));
}

TEST_F(AnIndexOfMixedIDs, PassesOverFoldersThatHaveNoPath) {
  Descriptor folder(open(PathTo("deep").c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  const std::string name(250, 'd');
  for (int depth = 0; depth < 40; ++depth) {
    ASSERT_EQ(mkdirat(folder.Get(), name.c_str(), 0700), 0);
    ASSERT_EQ(mkdirat(folder.Get(), "side", 0700), 0);
    folder = Descriptor(openat(folder.Get(), name.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  }
  for (int round = 0; round < 3; ++round) {
    EXPECT_EQ(Find(mID), PathTo("small"));
    EXPECT_EQ(FindAny(mID), PathTo("small"));
  }
}

// Whoever waits for a dead mount waits for ever; the alarm ends the test program.
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
  EXPECT_EQ(Find(0x12345678), "(none)");
  ExpectFound("a/other");
}

TEST_F(AnIndexBesideADeadMount, DoesNotLookAtTheMountForTheFolderThatItCovers) {
  Kill();
  if (IsSkipped()) return;
  EXPECT_EQ(Find(mCovered), "(none)");
  EXPECT_EQ(mIndex->Find({mCovered, nullptr, false}, PathTo("a")), std::nullopt);
}

TEST_F(AnIndexBesideADeadMount, DoesNotLookForWhatItKnewBelowIt) {
  EXPECT_EQ(Find(mBelow), PathTo("a/dead/below/deeper"));
  EXPECT_EQ(Find(mCovered), PathTo("a/dead"));
  Kill();
  if (IsSkipped()) return;
  EXPECT_EQ(Find(mBelow), "(none)");
  EXPECT_EQ(Find(mCovered), "(none)");
}

TEST_F(AnIndexBesideADeadMount, IsNotAskedThereWhenTheLastItemWasThere) {
  RememberPlace({PathTo("a/dead/below"), ItemAt("a/dead/below")});
  Kill();
  if (IsSkipped()) return;
  EXPECT_EQ(FindItem(mVolume, 0x12345678, true), std::nullopt);
}

TEST_F(AnIndexBesideADeadMount, IsNotAskedThereWhenALinkOnTheLastItemsWayLeadsThere) {
  std::filesystem::create_directory_symlink(PathTo("a/dead"), PathTo("a/link"));
  RememberPlace({PathTo("a/link/below/deeper"), ItemAt("a/dead/below/deeper")});
  Kill();
  if (IsSkipped()) return;
  EXPECT_EQ(FindItem(mVolume, 0x12345678, true), std::nullopt);
}

TEST_F(AnIndexBesideADeadMount, IsNotAskedThereWhenTheLastItemWasAtItsSecondPlace) {
  RememberPlace({PathTo("a/dead/below/deeper"), ItemAt("a/dead/below/deeper")});
  const DeadMount dead(mFolder.MakeFolder("first"));
  if (!dead.IsMounted()) GTEST_SKIP() << "no FUSE here";
  alarm(20);
  const ScopedMount second(mFolder.Path() / "first", PathTo("a/dead"), "", MS_BIND);
  ASSERT_TRUE(second.IsMounted());
  EXPECT_EQ(FindItem(mVolume, 0x12345678, true), std::nullopt);
}

}  // namespace
}  // namespace tallowmere::files
