// What an index keeps from one search to the next, and what it does not touch.
#include <sys/mount.h>
#include <sys/resource.h>

#include <chrono>
#include <thread>

#include "CatalogFixture.h"
#include "files/FolderIndex.h"

namespace tallowmere::files {
namespace {

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

// A file system that nobody answers for.
class DeadMount {
 public:
  explicit DeadMount(const std::string& place) : mDevice(open("/dev/fuse", O_RDWR | O_CLOEXEC)) {
    const std::string options =
        "fd=" + std::to_string(mDevice) + ",rootmode=40000,user_id=0,group_id=0";
    mMount.emplace("dead", place, "fuse", 0, options);
  }
  DeadMount(const DeadMount&) = delete;
  DeadMount& operator=(const DeadMount&) = delete;
  ~DeadMount() {
    mMount.reset();
    if (mDevice >= 0) close(mDevice);
  }
  bool IsMounted() const { return mDevice >= 0 && mMount->IsMounted(); }

 private:
  int mDevice;
  std::optional<ScopedMount> mMount;
};

class AnIndex : public testing::Test {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    mMount.emplace("tmpfs", mFolder.MakeFolder("volume"), "tmpfs");
    ASSERT_TRUE(mMount->IsMounted());
    // The first items of a tmpfs have numbers that do not fit.
    for (int i = 0; i < 20; ++i) Remove(Make("first"));
    std::filesystem::permissions(mFolder.Path(), std::filesystem::perms(0755));
    const ItemReference root = ItemAt("");
    mVolume = MountTable::OfThisProcess().OfItem(root, PathTo(""));
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

}  // namespace
}  // namespace tallowmere::files
