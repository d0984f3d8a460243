// Moments as a process opens them: what has been looked up once is used until the moment ends.
#include <Tallowmere/Process.h>
#include <fcntl.h>
#include <gmock/gmock.h>
#include <sys/mount.h>
#include <sys/resource.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>
#include <optional>
#include <stdexcept>
#include <thread>

#include "kernel/Descriptor.h"
#include "platform/HostCalls.h"
#include "support/CountedCalls.h"
#include "support/OwnMountNamespace.h"
#include "support/Privileges.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

using process::MomentScope;
using testing::IsEmpty;
using testing::Not;

// Mounts the volumes "first" and "second" with the same items on each.
class AMoment : public testing::Test {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    for (auto [mount, name] : {std::pair(&mFirst, "first"), std::pair(&mSecond, "second")}) {
      mount->emplace("none", mFolder.MakeFolder(name), "tmpfs");
      ASSERT_TRUE((*mount)->IsMounted());
      // Uses up the inode numbers below 16, which differ from their ids.
      for (int i = 0; i < 20; ++i) mFolder.MakeFile(std::string(name) + "/" + std::to_string(i));
      mFolder.MakeFolder(std::string(name) + "/a/b");
      mFolder.MakeFile(std::string(name) + "/a/b/x");
    }
    // Child processes share the kernel's notice of changed mounts, so consume it here first.
    VolumeAt(1);
  }
  std::string PathTo(const std::string& name) const { return mFolder.Path() / name; }
  void Rename(const std::string& from, const std::string& to) const {
    std::filesystem::rename(PathTo(from), PathTo(to));
  }
  bool CanUnmount(const std::string& name) const { return umount2(PathTo(name).c_str(), 0) == 0; }

  // Returns the current name of a reference's item, or the result code in brackets.
  static std::string NameOfItem(const FSRef& item) {
    FSSpec spec{};
    const OSErr error = FSGetCatalogInfo(&item, kFSCatInfoNone, nullptr, nullptr, &spec, nullptr);
    return error == noErr ? NameOf(spec) : "(" + std::to_string(error) + ")";
  }
  // Returns the folders that a climb from the item's folder passes, each with a colon.
  std::string FoldersOf(const std::string& name) const {
    const FSSpec spec = SpecOf(PathTo(name));
    std::string folders;
    std::uint32_t id = ParentOf(spec);
    for (int steps = 0; id != 1 && steps < 10; ++steps) {
      Str255 folder = {};
      CInfoPBRec block{};
      block.dirInfo = {folder, spec.vRefNum, -1, static_cast<SInt32>(id), 0};
      if (PBGetCatInfoSync(&block) != noErr) return "(error):" + folders;
      folders = std::string(names::TextOfPascal(folder)) + ":" + folders;
      id = static_cast<std::uint32_t>(block.dirInfo.ioDrParID);
    }
    return folders;
  }
  // Returns the system calls of a second request about an item.
  std::optional<std::vector<long>> CallsOfTheSecondQuestion(bool inMoment) const {
    std::optional<MomentScope> moment;
    FSRef item{};
    const auto ask = [&] {
      FSSpec spec{};
      FSGetCatalogInfo(&item, kFSCatInfoNone, nullptr, nullptr, &spec, nullptr);
    };
    const auto prepare = [&] {
      if (inMoment) moment.emplace();
      item = ReferenceTo(PathTo("first/a/b/x"));
      ask();
    };
    return CallsOf(prepare, ask);
  }

  TemporaryFolder mFolder;
  std::optional<ScopedMount> mFirst;
  std::optional<ScopedMount> mSecond;
};

// --- What is reused -----------------------------------------------------------------------------

TEST_F(AMoment, LooksAtAnItemOnce) {
  const auto within = CallsOfTheSecondQuestion(true);
  const auto without = CallsOfTheSecondQuestion(false);
  if (!within || !without) GTEST_SKIP() << "nothing can be traced here";
  EXPECT_THAT(*within, IsEmpty());
  EXPECT_THAT(*without, Not(IsEmpty()));
}

TEST_F(AMoment, HoldsAFolderOnceForAllItsItems) {
  mFolder.MakeFile("first/a/b/y");
  const auto callsFor = [&](const std::string& before) {
    std::optional<MomentScope> moment;
    const auto prepare = [&] {
      moment.emplace();
      SpecOf(PathTo(before));
    };
    return CallsOf(prepare, [&] { SpecOf(PathTo("first/a/b/y")); });
  };
  const auto known = callsFor("first/a/b/x");
  const auto unknown = callsFor("second/a/b/x");
  if (!known || !unknown) GTEST_SKIP() << "nothing can be traced here";
  EXPECT_LT(known->size(), unknown->size());
}

TEST_F(AMoment, GivesThePathByWhichAnItemWithTwoNamesWasFound) {
  const std::string path = PathTo("first/a/b/" + std::string(80, 'x') + ".aif");
  std::filesystem::create_hard_link(PathTo("first/a/b/x"), path);
  const FSSpec spec = SpecOf(path);
  const MomentScope moment;
  ReferenceTo(PathTo("first/a/b/x"));
  EXPECT_EQ(ItemOf(spec), path);
}

TEST_F(AMoment, GivesThePathByWhichAnItemWasFoundAfterManyOthers) {
  const std::string path = PathTo("first/a/b/y");
  std::filesystem::create_hard_link(PathTo("first/a/b/x"), path);
  const FSSpec spec = SpecOf(path);
  const MomentScope moment;
  ReferenceTo(PathTo("first/a/b/x"));
  for (int i = 0; i < 20; ++i) ReferenceTo(PathTo("first/" + std::to_string(i)));
  EXPECT_EQ(ItemOf(spec), path);
}

TEST_F(AMoment, AnswersAsOutside) {
  const FSSpec outside = SpecOf(PathTo("first/a/b/x"));
  const MomentScope moment;
  const FSSpec spec = SpecOf(PathTo("first/a/b/x"));
  EXPECT_EQ(spec.vRefNum, outside.vRefNum);
  EXPECT_EQ(ParentOf(spec), ParentOf(outside));
  EXPECT_EQ(NameOf(spec), NameOf(outside));
  EXPECT_EQ(ItemOf(spec), PathTo("first/a/b/x"));
}

TEST_F(AMoment, ClimbsFromAFolderToTheRoot) {
  const MomentScope moment;
  EXPECT_EQ(FoldersOf("first/a/b/x"), "first:a:b:");
}

TEST_F(AMoment, ClimbsThroughTheFoldersThatHoldItNow) {
  mFolder.MakeFolder("first/a/b/c");
  mFolder.MakeFile("first/a/b/c/x");
  const auto climb = [this](const std::string& name) {
    const MomentScope moment;
    return FoldersOf(name);
  };
  ASSERT_EQ(climb("first/a/b/c/x"), "first:a:b:c:");
  ASSERT_EQ(climb("first/a/b/c/x"), "first:a:b:c:");
  // The folder that held "c" moves and is seen at its new place; "c" stays where it was.
  Rename("first/a/b", "first/elsewhere");
  mFolder.MakeFolder("first/a/b");
  Rename("first/elsewhere/c", "first/a/b/c");
  mFolder.MakeFile("first/elsewhere/y");
  ASSERT_EQ(climb("first/elsewhere/y"), "first:elsewhere:");
  EXPECT_EQ(climb("first/a/b/c/x"), "first:a:b:c:");
}

// Renames "t/m/z", which holds the mount point "m", to "t". "t/m/z/m", the mount point that the
// mount table last showed, is then a folder inside the volume.
class AMomentAfterARename : public AMoment {
 protected:
  void SetUp() override {
    AMoment::SetUp();
    if (IsSkipped()) return;
    mThird.emplace("none", mFolder.MakeFolder("t/m/z/m"), "tmpfs");
    ASSERT_TRUE(mThird->IsMounted());
    for (const char* name : {"z/m/x", "x"}) mFolder.MakeFolder("t/m/z/m/" + std::string(name));
    mFolder.MakeFile("t/m/z/m/z/m/x/y");
    VolumeAt(1);
  }
  void TearDown() override {
    if (mIsRenamed) {
      Rename("t", "former/m/z");
      Rename("former", "t");
    }
  }
  void RenameAboveTheMountPoint() {
    Rename("t", "former");
    Rename("former/m/z", "t");
    mIsRenamed = true;
  }
  std::string FoldersInAMoment(const std::string& name) const {
    const MomentScope moment;
    return FoldersOf(name);
  }

  std::optional<ScopedMount> mThird;
  bool mIsRenamed = false;
};

TEST_F(AMomentAfterARename, ClimbsToTheRootThatItKnew) {
  ASSERT_EQ(FoldersInAMoment("t/m/z/m/z/m/x/y"), "m:z:m:x:");
  RenameAboveTheMountPoint();
  EXPECT_EQ(FoldersInAMoment("t/m/z/m/x/y"), "m:z:m:x:");
  EXPECT_EQ(FoldersInAMoment("t/m/z/m/x/y"), "m:z:m:x:");
}

TEST_F(AMomentAfterARename, TakesNoFolderInAVolumeForItsRoot) {
  RenameAboveTheMountPoint();
  EXPECT_EQ(FoldersInAMoment("t/m/z/m/x/y"), "m:z:m:x:");
}

// --- What is not reused -------------------------------------------------------------------------

TEST_F(AMoment, KeepsNothingNegative) {
  const MomentScope moment;
  const FSSpec spec = SpecOf(PathTo("first/a/b/x"));
  const FSSpec later = MakeRecord(spec.vRefNum, ParentOf(spec), "later");
  EXPECT_EQ(ItemOf(later), "(-43)");
  const std::string path = mFolder.MakeFile("first/a/b/later");
  EXPECT_EQ(ItemOf(later), path);

  const auto url = foundation::test::MakeUrl(PathTo("first/a/b/latest"), false);
  FSRef item{};
  EXPECT_FALSE(CFURLGetFSRef(url.Get(), &item));
  mFolder.MakeFile("first/a/b/latest");
  EXPECT_TRUE(CFURLGetFSRef(url.Get(), &item));
}

TEST_F(AMoment, VerifiesAPathBeforeItGivesIt) {
  const MomentScope moment;
  const FSRef item = ReferenceTo(PathTo("first/a/b/x"));
  ASSERT_EQ(NameOfItem(item), "x");
  Rename("first/a/b/x", "first/a/y");
  EXPECT_EQ(PathOf(item), PathTo("first/a/y"));
}

TEST_F(AMoment, DoesNotMixANewMountWithWhatItHasSeen) {
  const MomentScope moment;
  const FSSpec before = SpecOf(PathTo("first/a/b/x"));
  const ScopedMount cover("none", PathTo("first/a/b"), "tmpfs");
  ASSERT_TRUE(cover.IsMounted());
  mFolder.MakeFile("first/a/b/y");
  const FSRef item = ReferenceTo(mFolder.MakeFile("first/a/b/x"));
  FSCatalogInfo info{};
  ASSERT_EQ(FSGetCatalogInfo(&item, kFSCatInfoVolume, &info, nullptr, nullptr, nullptr), noErr);
  // Both states occur within this moment, but one item must not mix them.
  FSSpec spec{};
  ASSERT_EQ(FSGetCatalogInfo(&item, kFSCatInfoNone, nullptr, nullptr, &spec, nullptr), noErr);
  EXPECT_EQ(info.volume, spec.vRefNum);
  EXPECT_EQ(ParentOf(spec) == 2U, spec.vRefNum != before.vRefNum);
}

TEST_F(AMoment, SeesAVolumeMountedMeanwhile) {
  const MomentScope moment;
  const FSSpec before = SpecOf(PathTo("first/a/b/x"));
  const ScopedMount third("none", mFolder.MakeFolder("third"), "tmpfs");
  ASSERT_TRUE(third.IsMounted());
  const FSSpec spec = SpecOf(mFolder.MakeFile("third/x"));
  EXPECT_EQ(ParentOf(spec), 2U);
  EXPECT_NE(spec.vRefNum, before.vRefNum);
  EXPECT_EQ(spec.vRefNum, VolumeNamed("third"));
}

TEST(WithoutAMoment, EachCallLooksAfresh) {
  const TemporaryFolder folder;
  const std::string path = folder.MakeFile("x");
  const FSRef item = ReferenceTo(path);
  FSSpec spec = SpecOf(path);
  EXPECT_EQ(NameOf(spec), "x");
  std::filesystem::rename(path, folder.Path() / "y");
  ASSERT_EQ(FSGetCatalogInfo(&item, kFSCatInfoNone, nullptr, nullptr, &spec, nullptr), noErr);
  EXPECT_EQ(NameOf(spec), "y");
}

// --- Its end ------------------------------------------------------------------------------------

TEST_F(AMoment, KeepsAVolumeMountedUntilItsScopeEnds) {
  {
    const MomentScope moment;
    SpecOf(PathTo("first/a/b/x"));
    EXPECT_FALSE(CanUnmount("first"));
  }
  EXPECT_TRUE(CanUnmount("first"));
}

TEST_F(AMoment, ReleasesEverythingWhenItIsEnded) {
  MomentScope moment;
  SpecOf(PathTo("first/a/b/x"));
  moment.End();
  EXPECT_TRUE(CanUnmount("first"));
  moment.End();
}

TEST_F(AMoment, EndsOnAnException) {
  try {
    const MomentScope moment;
    SpecOf(PathTo("first/a/b/x"));
    throw std::runtime_error("thrown");
  } catch (const std::runtime_error&) {
  }
  EXPECT_TRUE(CanUnmount("first"));
}

TEST_F(AMoment, CarriesNothingOverToTheNext) {
  FSRef item{};
  {
    const MomentScope moment;
    item = ReferenceTo(PathTo("first/a/b/x"));
    ASSERT_EQ(NameOfItem(item), "x");
  }
  Rename("first/a/b/x", "first/a/b/y");
  const MomentScope next;
  EXPECT_EQ(NameOfItem(item), "y");
}

TEST_F(AMoment, IsNotUsedInItsScopeOnceEnded) {
  MomentScope moment;
  const FSRef item = ReferenceTo(PathTo("first/a/b/x"));
  ASSERT_EQ(NameOfItem(item), "x");
  moment.End();
  Rename("first/a/b/x", "first/a/b/y");
  EXPECT_EQ(NameOfItem(item), "y");
}

TEST_F(AMoment, NestedInAnotherIsTheSame) {
  MomentScope outer;
  SpecOf(PathTo("first/a/b/x"));
  {
    MomentScope inner;
    SpecOf(PathTo("second/a/b/x"));
    inner.End();
    EXPECT_FALSE(CanUnmount("first"));
    EXPECT_FALSE(CanUnmount("second"));
  }
  EXPECT_FALSE(CanUnmount("first"));
  EXPECT_FALSE(CanUnmount("second"));
  outer.End();
  EXPECT_TRUE(CanUnmount("first"));
  EXPECT_TRUE(CanUnmount("second"));
}

// --- Whose it is --------------------------------------------------------------------------------

TEST_F(AMoment, IsNotSharedWithAnotherThread) {
  const MomentScope moment;
  const FSRef item = ReferenceTo(PathTo("first/a/b/x"));
  ASSERT_EQ(NameOfItem(item), "x");
  Rename("first/a/b/x", "first/a/b/y");
  std::string seen;
  std::thread([&] { seen = NameOfItem(item); }).join();
  EXPECT_EQ(seen, "y");
}

TEST_F(AMoment, IsNotEndedByAnotherThread) {
  MomentScope moment;
  SpecOf(PathTo("first/a/b/x"));
  std::thread([&] {
    const MomentScope other;
    SpecOf(PathTo("second/a/b/x"));
  }).join();
  EXPECT_FALSE(CanUnmount("first"));
  EXPECT_TRUE(CanUnmount("second"));
  moment.End();
  EXPECT_TRUE(CanUnmount("first"));
}

// --- What it holds ------------------------------------------------------------------------------

TEST_F(AMoment, ReleasesItsFoldersWhenAVolumeIsSearched) {
  const std::string path = mFolder.MakeFolder("second/gone");
  const FSCatalogInfo info = InfoOf(path);
  std::filesystem::remove(path);
  const MomentScope moment;
  SpecOf(PathTo("first/a/b/x"));
  ASSERT_FALSE(CanUnmount("first"));
  EXPECT_EQ(ItemWithID(info.volume, info.nodeID), "(-43)");
  EXPECT_TRUE(CanUnmount("first"));
}

// Limits how many more descriptors can be opened. Returns whether that worked.
bool LeaveDescriptors(int count) {
  const kernel::Descriptor lowest(dup(STDIN_FILENO));
  const auto end = static_cast<rlim_t>(lowest.Get() + count);
  const rlimit tight{end, end};
  return setrlimit(RLIMIT_NOFILE, &tight) == 0;
}

TEST_F(AMoment, GoesOnWhenNoMoreDescriptorsCanBeOpened) {
  constexpr int kFolders = 6;
  for (int i = 0; i <= kFolders; ++i) {
    mFolder.MakeFolder("first/" + std::to_string(i) + " folder");
    mFolder.MakeFile("first/" + std::to_string(i) + " folder/x");
  }
  const auto pathIn = [this](int i) { return PathTo("first/" + std::to_string(i) + " folder/x"); };
  const FSSpec wanted = SpecOf(pathIn(kFolders));
  EXPECT_TRUE(HoldsInChild([] { return true; },
                           [&] {
                             const MomentScope moment;
                             for (int i = 0; i < kFolders; ++i) SpecOf(pathIn(i));
                             if (!LeaveDescriptors(0) || dup(STDIN_FILENO) != -1) return false;
                             const FSSpec spec = SpecOf(pathIn(kFolders));
                             return ParentOf(spec) == ParentOf(wanted) && NameOf(spec) == "x" &&
                                    ItemOf(spec) == pathIn(kFolders);
                           }));
}

TEST_F(AMoment, FollowsAPathOfMoreStepsThanItHasDescriptors) {
  mFolder.MakeFolder("first/a/1/2/3/4/5/6");
  mFolder.MakeFile("first/a/1/2/3/4/5/6/x");
  std::filesystem::create_symlink("a", PathTo("first/link"));
  const auto find = [](FSSpec& spec) {
    const MomentScope moment;
    return FSMakeFSSpec(0, 0, Str255Of("first:link:1:2:3:4:5:6:x").bytes, &spec);
  };
  FSSpec wanted{};
  ASSERT_EQ(find(wanted), noErr);
  EXPECT_TRUE(HoldsInChild([] { return LeaveDescriptors(3); },
                           [&] {
                             FSSpec spec{};
                             return find(spec) == noErr && ParentOf(spec) == ParentOf(wanted);
                           }));
}

// With more folders than a moment holds.
TEST_F(AMoment, AnswersForManyFolders) {
  const MomentScope moment;
  std::vector<FSSpec> specs;
  for (int i = 0; i < 50; ++i) {
    mFolder.MakeFolder("first/many/" + std::to_string(i));
    specs.push_back(SpecOf(mFolder.MakeFile("first/many/" + std::to_string(i) + "/x")));
  }
  for (int i = 0; i < 50; ++i) {
    EXPECT_EQ(ItemOf(specs[static_cast<std::size_t>(i)]),
              PathTo("first/many/" + std::to_string(i) + "/x"));
  }
}

}  // namespace
}  // namespace tallowmere::test
