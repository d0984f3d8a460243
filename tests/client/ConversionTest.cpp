// What conversions answer, and what they refuse that the raw requests answer.
#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>

#include "client/ClientSupport.h"
#include "support/MountNamespace.h"
#include "support/Privileges.h"

namespace tallowmere {

template <class T>
void PrintTo(const Conversion<T>& answer, std::ostream* stream) {
  if (!answer) {
    *stream << Name(answer.Failure().outcome) << ": " << answer.Failure().message;
  } else {
    *stream << testing::PrintToString(answer->value) << ", " << Name(answer->outcome);
  }
}

namespace {

using test::ScopedMount;
using test::StartClient;
using test::TemporaryFolder;
using testing::HasSubstr;

constexpr const char* kPrecomposed = "\xC3\xA9";   // é
constexpr const char* kDecomposed = "e\xCC\x81";   // é
constexpr const char* kMacRoman = "\x8E";          // é
constexpr const char* kJapanese = "\xE6\x97\xA5";  // no letter of Mac Roman

// Matches a conversion with this value and outcome.
MATCHER_P2(Is, value, outcome, "") {
  return arg && arg->value == value && arg->outcome == outcome;
}
// Matches a conversion that fails with this outcome.
MATCHER_P(Fails, outcome, std::string(Name(outcome))) {
  return !arg && arg.Failure().outcome == outcome;
}

class Conversions : public testing::Test {
 protected:
  std::string In(const std::string& name) const { return (mFolder.Path() / name).string(); }

  FSSpec RawRecordOf(const std::string& path) { return **mClient.GetFSSpec(path); }
  std::optional<std::string> RawPathOf(const FSSpec& record) {
    return *mClient.SetFileRefFromFSSpec(record, false);
  }
  // The record of a new item in the folder.
  FSSpec NewRecord(const std::string& name) {
    FSSpec record = RawRecordOf(In("anything"));
    record.name = name;
    return record;
  }
  // The id of a folder that has been removed. It is held open, so that no other gets the id.
  std::int32_t LostFolder() {
    mLost = open(mFolder.MakeFolder("lost").c_str(), O_PATH | O_CLOEXEC);
    const auto id = RawRecordOf(In("lost/x")).parID;
    rmdir(In("lost").c_str());
    return id;
  }
  void TearDown() override {
    if (mLost >= 0) close(mLost);
  }

  TemporaryFolder mFolder;
  Client mClient = StartClient();
  int mLost = -1;
};

// --- What is there ---

TEST_F(Conversions, ARecordOfAFileLeadsBack) {
  const std::string path = mFolder.MakeFile("a:b");
  const auto record = mClient.RecordOf(path);
  ASSERT_THAT(record, Is(RawRecordOf(path), Outcome::kFound));
  EXPECT_THAT(mClient.PathOf(record->value), Is(path, Outcome::kFound));
}

TEST_F(Conversions, AnHFSPathOfAFileIsItsOwnAndLeadsBack) {
  const std::string path = mFolder.MakeFile("a:b");
  const auto hfsPath = mClient.HFSPathOf(path);
  EXPECT_THAT(hfsPath, Is(*mClient.MakeFullPath(path) + "a/b", Outcome::kFound));
  EXPECT_THAT(mClient.PathOfHFSPath(hfsPath->value), Is(path, Outcome::kFound));
}

TEST_F(Conversions, AnHFSPathOfAFolderEndsWithAColonAndLeadsBack) {
  const std::string path = mFolder.MakeFolder("inner");
  const auto hfsPath = mClient.HFSPathOf(path);
  EXPECT_THAT(hfsPath, Is(*mClient.MakeFullPath(path), Outcome::kFound));
  EXPECT_TRUE(hfsPath->value.ends_with(":inner:"));
  EXPECT_THAT(mClient.PathOfHFSPath(hfsPath->value), Is(path, Outcome::kFound));
}

TEST_F(Conversions, AnHFSNameIsThatOfTheItem) {
  EXPECT_THAT(mClient.HFSNameOf(mFolder.MakeFile(kPrecomposed)),
              Is(std::string(kMacRoman), Outcome::kFound));
}

TEST_F(Conversions, APathInAFolderIsThatOfTheItem) {
  const std::string path = mFolder.MakeFile(kDecomposed);
  EXPECT_THAT(mClient.PathInFolder(mFolder.Path(), kMacRoman), Is(path, Outcome::kFound));
}

TEST_F(Conversions, AnItemThatHasButAShortFormComesBackByIt) {
  const std::string path = mFolder.MakeFile(kJapanese);
  const auto name = mClient.HFSNameOf(path);
  ASSERT_TRUE(name);
  EXPECT_THAT(name->value, HasSubstr("#"));
  EXPECT_THAT(mClient.PathInFolder(mFolder.Path(), name->value), Is(path, Outcome::kFound));
  EXPECT_THAT(mClient.PathOfHFSPath(mClient.HFSPathOf(path)->value), Is(path, Outcome::kFound));
  EXPECT_THAT(mClient.PathOf(mClient.RecordOf(path)->value), Is(path, Outcome::kFound));
}

TEST_F(Conversions, ALinkThatLeadsNowhereIsAnItem) {
  const std::string path = mFolder.MakeLink("link", "/nonexistent");
  EXPECT_THAT(mClient.RecordOf(path), Is(RawRecordOf(path), Outcome::kFound));
  EXPECT_THAT(mClient.HFSNameOf(path), Is(std::string("link"), Outcome::kFound));
  EXPECT_THAT(mClient.HFSPathOf(path), Is(*mClient.MakeFullPath(path) + "link", Outcome::kFound));
}

TEST_F(Conversions, TheRootFolderIsItsVolumesWhole) {
  const std::string volume = **mClient.GetHFSVolumeName(0);
  EXPECT_THAT(mClient.HFSNameOf("/"), Is(volume, Outcome::kFound));
  EXPECT_THAT(mClient.HFSPathOf("/"), Is(volume + ":", Outcome::kFound));
  EXPECT_THAT(mClient.PathOf(mClient.RecordOf("/")->value), Is(std::string("/"), Outcome::kFound));
}

// --- What is new ---

TEST_F(Conversions, ANewItemComesBackByItsRecord) {
  for (const char* const name : {"new", "a:b", kPrecomposed, "~root", "x#1F.aif", "..."}) {
    const auto record = mClient.RecordOf(In(name));
    ASSERT_TRUE(record) << name;
    EXPECT_EQ(record->outcome, Outcome::kNew);
    EXPECT_THAT(mClient.PathOf(record->value), Is(In(name), Outcome::kNew));
  }
}

TEST_F(Conversions, ANewItemComesBackByItsHFSPathAndItsName) {
  for (const char* const name : {"new", "a:b", kPrecomposed, "~root"}) {
    const auto hfsPath = mClient.HFSPathOf(In(name));
    ASSERT_TRUE(hfsPath) << name;
    EXPECT_EQ(hfsPath->outcome, Outcome::kNew);
    EXPECT_THAT(mClient.PathOfHFSPath(hfsPath->value), Is(In(name), Outcome::kNew));
    const auto hfsName = mClient.HFSNameOf(In(name));
    ASSERT_TRUE(hfsName) << name;
    EXPECT_THAT(mClient.PathInFolder(mFolder.Path(), hfsName->value), Is(In(name), Outcome::kNew));
  }
}

TEST_F(Conversions, ANewItemBelowTheRootFolderHasOneSlash) {
  const std::string name = "tallowmere." + std::to_string(getpid());
  EXPECT_EQ(*mClient.AddHFSName("/", name), "//" + name);
  EXPECT_THAT(mClient.PathInFolder("/", name), Is("/" + name, Outcome::kNew));
  const auto record = mClient.RecordOf("/" + name);
  ASSERT_TRUE(record);
  EXPECT_EQ(RawPathOf(record->value), "//" + name);
  EXPECT_THAT(mClient.PathOf(record->value), Is("/" + name, Outcome::kNew));
}

// --- The way to an item ---

TEST_F(Conversions, LinksInFrontOfTheLastNameAreFollowed) {
  mFolder.MakeFolder("real");
  mFolder.MakeLink("link", "real");
  const FSSpec raw = RawRecordOf(In("link/new"));
  EXPECT_EQ(RawPathOf(raw), std::nullopt);
  EXPECT_THAT(mClient.RecordOf(In("link/new")), Is(RawRecordOf(In("real/new")), Outcome::kNew));
  EXPECT_THAT(mClient.HFSPathOf(In("link/new")),
              Is(*mClient.MakeFullPath(In("real")) + "new", Outcome::kNew));
  EXPECT_THAT(mClient.PathInFolder(In("link"), "new"), Is(In("real/new"), Outcome::kNew));
}

// Works below the current folder, and returns to the one before.
class WorkingIn {
 public:
  explicit WorkingIn(const std::filesystem::path& folder) { current_path(folder); }
  ~WorkingIn() { current_path(mBefore); }

 private:
  std::filesystem::path mBefore = std::filesystem::current_path();
};

TEST_F(Conversions, RelativePathsBeginAtTheCurrentFolder) {
  const std::string file = mFolder.MakeFile("file");
  mFolder.MakeFolder("inner");
  const WorkingIn inner(In("inner"));
  for (const char* const path : {"../file", "./../file", "../inner/../file", "..//file"}) {
    EXPECT_THAT(mClient.RecordOf(path), Is(RawRecordOf(file), Outcome::kFound)) << path;
  }
}

TEST_F(Conversions, OneClientsRelativePathsFollowTheCurrentFolder) {
  mFolder.MakeFolder("inner");
  const WorkingIn inner(In("inner"));
  EXPECT_THAT(mClient.RecordOf("new"), Is(RawRecordOf(In("inner/new")), Outcome::kNew));
  std::filesystem::current_path(mFolder.Path());
  EXPECT_THAT(mClient.RecordOf("new"), Is(RawRecordOf(In("new")), Outcome::kNew));
}

TEST_F(Conversions, DotsAndSlashesAtTheEndNameTheFolder) {
  const FSSpec record = RawRecordOf(mFolder.MakeFolder("inner"));
  mFolder.MakeFolder("inner/x");
  for (const char* const path : {"inner/", "inner//", "inner/.", "inner/x/..", "inner/x/../."}) {
    EXPECT_THAT(mClient.RecordOf(In(path)), Is(record, Outcome::kFound)) << path;
  }
}

TEST_F(Conversions, ALinkAtTheEndIsTheItemAlsoWithASlash) {
  mFolder.MakeFolder("real");
  const FSSpec record = RawRecordOf(mFolder.MakeLink("link", "real"));
  EXPECT_THAT(mClient.RecordOf(In("link/")), Is(record, Outcome::kFound));
}

TEST_F(Conversions, ATildeIsAPlainCharacter) {
  const WorkingIn folder(mFolder.Path());
  EXPECT_THAT(mClient.RecordOf("~root"), Is(NewRecord("~root"), Outcome::kNew));
}

TEST_F(Conversions, ACurrentFolderThatIsGoneHasNothing) {
  mFolder.MakeFolder("gone");
  const WorkingIn gone(In("gone"));
  rmdir(In("gone").c_str());
  EXPECT_THAT(mClient.RecordOf("new"), Fails(Outcome::kNothing));
  mFolder.MakeFolder("gone");
  EXPECT_THAT(mClient.RecordOf("new"), Fails(Outcome::kNothing));
}

TEST_F(Conversions, WithoutResolvingAPathIsTakenAsItIs) {
  const std::string file = mFolder.MakeFile("file");
  mFolder.MakeLink("link", ".");
  const WorkingIn folder(mFolder.Path());
  const ConvertOptions asItIs{.resolve = false};
  EXPECT_THAT(mClient.RecordOf(file, asItIs), Is(RawRecordOf(file), Outcome::kFound));
  EXPECT_THAT(mClient.RecordOf("file", asItIs), Fails(Outcome::kInvalid));
  EXPECT_THAT(mClient.RecordOf(In("link/new"), asItIs), Fails(Outcome::kNothing));
  EXPECT_THAT(mClient.RecordOf(In("."), asItIs), Fails(Outcome::kInvalid));
  EXPECT_THAT(mClient.PathInFolder(In("link"), "new", asItIs), Fails(Outcome::kNothing));
}

TEST_F(Conversions, AnAnswerIsTheSameForEachTypeOfPath) {
  const std::filesystem::path path = mFolder.MakeFile("file");
  const std::string text = path;
  const std::string_view view = text;
  const FSSpec record = RawRecordOf(path);
  EXPECT_THAT(mClient.RecordOf(path), Is(record, Outcome::kFound));
  EXPECT_THAT(mClient.RecordOf(text), Is(record, Outcome::kFound));
  EXPECT_THAT(mClient.RecordOf(view), Is(record, Outcome::kFound));
  EXPECT_THAT(mClient.RecordOf(text.c_str()), Is(record, Outcome::kFound));
  EXPECT_THAT(mClient.HFSNameOf("/"), Is(**mClient.GetHFSName("/"), Outcome::kFound));
  EXPECT_EQ(*mClient.GetHFSName(path), "file");
}

// --- What leads elsewhere, raw ---

TEST_F(Conversions, ANewNameOutsideMacRomanIsRefused) {
  const std::string other = mFolder.MakeFile("?.aif");
  const std::string path = In(std::string(kJapanese) + ".aif");
  EXPECT_EQ(RawPathOf(RawRecordOf(path)), other);
  EXPECT_THAT(mClient.RecordOf(path), Fails(Outcome::kInvalid));
  EXPECT_THAT(mClient.HFSPathOf(path), Fails(Outcome::kInvalid));
  EXPECT_THAT(mClient.HFSNameOf(path), Fails(Outcome::kInvalid));
}

TEST_F(Conversions, ANewNameThatIsNoTextIsRefused) {
  EXPECT_EQ(RawRecordOf(In("\xFF")).name, "?");
  EXPECT_THAT(mClient.RecordOf(In("\xFF")), Fails(Outcome::kInvalid));
}

TEST_F(Conversions, ANewNameThatWouldBeCutIsRefused) {
  const std::string other = mFolder.MakeFile(std::string(63, 'x'));
  const std::string path = other + "y";
  EXPECT_EQ(RawPathOf(RawRecordOf(path)), other);
  EXPECT_THAT(mClient.RecordOf(path), Fails(Outcome::kInvalid));
  EXPECT_THAT(mClient.PathInFolder(mFolder.Path(), std::string(64, 'y')), Fails(Outcome::kInvalid));
}

TEST_F(Conversions, ANewNameWithOtherAccentsThanItsRecordIsRefused) {
  EXPECT_EQ(RawPathOf(RawRecordOf(In(kDecomposed))), In(kPrecomposed));
  EXPECT_THAT(mClient.RecordOf(In(kDecomposed)), Fails(Outcome::kInvalid));
  mFolder.MakeFile(kPrecomposed);
  EXPECT_THAT(mClient.RecordOf(In(kDecomposed)), Fails(Outcome::kAmbiguous));
}

TEST_F(Conversions, ANewNameWhoseRecordLeadsToOtherAccentsIsAmbiguous) {
  const std::string other = mFolder.MakeFile(kDecomposed);
  EXPECT_EQ(RawPathOf(RawRecordOf(In(kPrecomposed))), other);
  EXPECT_THAT(mClient.RecordOf(In(kPrecomposed)), Fails(Outcome::kAmbiguous));
  EXPECT_THAT(mClient.HFSPathOf(In(kPrecomposed)), Fails(Outcome::kAmbiguous));
}

TEST_F(Conversions, ANewNameThatIsTheShortFormOfAnotherIsAmbiguous) {
  const std::string other = mFolder.MakeFile(kJapanese);
  const std::string path = In(**mClient.GetHFSName(other));
  EXPECT_EQ(RawPathOf(RawRecordOf(path)), other);
  EXPECT_THAT(mClient.RecordOf(path), Fails(Outcome::kAmbiguous));
}

TEST_F(Conversions, BelowAFileOrALinkThatLeadsNowhereThereIsNothing) {
  mFolder.MakeFile("file");
  mFolder.MakeLink("link", "/nonexistent");
  for (const char* const name : {"file/x", "link/x"}) {
    EXPECT_EQ(RawPathOf(RawRecordOf(In(name))), std::nullopt);
    EXPECT_THAT(mClient.RecordOf(In(name)), Fails(Outcome::kNothing));
    EXPECT_THAT(mClient.HFSPathOf(In(name)), Fails(Outcome::kNothing));
    EXPECT_THAT(mClient.HFSNameOf(In(name)), Fails(Outcome::kNothing));
  }
}

TEST_F(Conversions, WithoutAFolderThereIsNothing) {
  EXPECT_THAT(mClient.RecordOf(In("missing/x")), Fails(Outcome::kNothing));
  EXPECT_THAT(mClient.PathInFolder(In("missing"), "x"), Fails(Outcome::kNothing));
  EXPECT_THAT(mClient.PathOfHFSPath(*mClient.MakeFullPath(mFolder.Path()) + "missing:x"),
              Fails(Outcome::kNothing));
}

TEST_F(Conversions, BehindNoFolderOfAVolumeANameWithASlashLeadsNowhereElse) {
  EXPECT_EQ(*mClient.AddHFSName(In("missing"), "../x"), In("missing") + "/../x");
  EXPECT_THAT(mClient.PathInFolder(In("missing"), "../x"), Fails(Outcome::kNothing));
  EXPECT_EQ(*mClient.AddHFSName("/proc/self", "../../etc"), "/proc/self/../../etc");
  EXPECT_THAT(mClient.PathInFolder("/proc/self", "../../etc"), Fails(Outcome::kNotAVolume));
}

TEST_F(Conversions, ANameOfDotsIsRefused) {
  EXPECT_EQ(*mClient.AddHFSName(mFolder.Path(), ".."), In(".."));
  EXPECT_EQ(RawPathOf(NewRecord("..")), In(".."));
  for (const char* const name : {".", ".."}) {
    EXPECT_THAT(mClient.PathInFolder(mFolder.Path(), name), Fails(Outcome::kInvalid));
    EXPECT_THAT(mClient.PathOf(NewRecord(name)), Fails(Outcome::kInvalid));
  }
}

TEST_F(Conversions, AnEmptyNameIsRefused) {
  EXPECT_EQ(RawPathOf(NewRecord("")), mFolder.Path());
  EXPECT_THAT(mClient.PathOf(NewRecord("")), Fails(Outcome::kInvalid));
  EXPECT_THAT(mClient.PathInFolder(mFolder.Path(), ""), Fails(Outcome::kInvalid));
  EXPECT_THAT(mClient.RecordOf(""), Fails(Outcome::kInvalid));
  EXPECT_THAT(mClient.PathOfHFSPath(""), Fails(Outcome::kInvalid));
}

TEST_F(Conversions, ANameWithAColonIsRefused) {
  EXPECT_EQ(*mClient.AddHFSName(mFolder.Path(), "a:b"), In("a:b"));
  EXPECT_EQ(RawPathOf(NewRecord("a:b")), In("a:b"));
  EXPECT_THAT(mClient.PathInFolder(mFolder.Path(), "a:b"), Fails(Outcome::kInvalid));
  EXPECT_THAT(mClient.PathOf(NewRecord("a:b")), Fails(Outcome::kInvalid));
}

TEST_F(Conversions, AHomeFolderIsNoItemOfAFolderThatIsGone) {
  const FSSpec record{RawRecordOf(In("x")).vRefNum, LostFolder(), "~root"};
  EXPECT_EQ(RawPathOf(record), "/root");
  EXPECT_THAT(mClient.PathOf(record), Fails(Outcome::kNothing));
}

TEST_F(Conversions, ARecordOfAFolderThatIsGoneHasNothing) {
  const FSSpec record{RawRecordOf(In("x")).vRefNum, LostFolder(), "x"};
  EXPECT_EQ(RawPathOf(record), std::nullopt);
  EXPECT_THAT(mClient.PathOf(record), Fails(Outcome::kNothing));
}

TEST_F(Conversions, AVolumeThatIsNotMountedIsSaid) {
  EXPECT_THAT(mClient.PathOf({-32000, 2, "x"}), Fails(Outcome::kNotAVolume));
  EXPECT_THAT(mClient.PathOfHFSPath("no such volume:x"), Fails(Outcome::kNotAVolume));
}

TEST_F(Conversions, AHomeFolderIsNoItemOfAVolumeThatIsNotMounted) {
  const auto id = RawRecordOf("/root").parID;
  for (const char* const name : {"~", "~root"}) {
    for (const std::int16_t number : {std::int16_t{5}, std::int16_t{-999}}) {
      ASSERT_TRUE(RawPathOf({number, id, name})) << name;
      EXPECT_THAT(mClient.PathOf({number, id, name}), Fails(Outcome::kNotAVolume)) << name;
      EXPECT_THAT(mClient.PathOf({number, 999999999, name}), Fails(Outcome::kNotAVolume)) << name;
    }
  }
}

TEST_F(Conversions, AnItemWithTheNameOfAHomeFolderComesBackByItsRecord) {
  for (const char* const name : {"~", "~root", "~Root", "~\xC3\xA9", "~\xE6\x97\xA5"}) {
    const std::string path = mFolder.MakeFile(name);
    FSSpec record = RawRecordOf(path);
    EXPECT_THAT(mClient.PathOf(record), Is(path, Outcome::kFound));
    EXPECT_THAT(mClient.PathOf(record, true), Is(path, Outcome::kFound));
    if (record.vRefNum != RawRecordOf("/etc").vRefNum) continue;
    record.vRefNum = 0;
    EXPECT_THAT(mClient.PathOf(record), Is(path, Outcome::kFound));
  }
}

TEST_F(Conversions, AnHFSPathThatNamesNoVolumeIsRefused) {
  mFolder.MakeFile("file");
  const WorkingIn folder(mFolder.Path());
  Client here = StartClient();
  EXPECT_EQ(*here.MakeFileRefFromPath(":file"), In("file"));
  EXPECT_THAT(here.PathOfHFSPath(":file"), Fails(Outcome::kInvalid));
  EXPECT_THAT(here.PathOfHFSPath("file"), Fails(Outcome::kInvalid));
}

TEST_F(Conversions, AKernelInterfaceHasItsOwnHFSPathAndWhatIsInItNone) {
  const std::string root = *mClient.MakeFullPath("/");
  ASSERT_EQ(*mClient.MakeFullPath("/proc"), root);
  EXPECT_THAT(mClient.HFSPathOf("/proc"), Is(root + "proc:", Outcome::kFound));
  EXPECT_THAT(mClient.HFSPathOf("/proc/version"), Fails(Outcome::kNotAVolume));
  EXPECT_THAT(mClient.RecordOf("/proc/version"), Fails(Outcome::kNotAVolume));
  EXPECT_THAT(mClient.PathOfHFSPath(root + "proc:version"), Fails(Outcome::kNotAVolume));
  EXPECT_THAT(mClient.PathInFolder("/proc", "version"), Fails(Outcome::kNotAVolume));
}

TEST_F(Conversions, TheHFSPathOfAKernelInterfaceLeadsBackWithAndWithoutItsColon) {
  const std::string root = *mClient.MakeFullPath("/");
  for (const char* const path : {"/proc", "/sys"}) {
    const auto hfsPath = mClient.HFSPathOf(path);
    ASSERT_THAT(hfsPath, Is(root + (path + 1) + ":", Outcome::kFound));
    EXPECT_THAT(mClient.PathOfHFSPath(hfsPath->value), Is(std::string(path), Outcome::kFound));
    EXPECT_THAT(mClient.PathOfHFSPath(root + (path + 1)), Is(std::string(path), Outcome::kFound));
  }
  EXPECT_THAT(mClient.PathOfHFSPath(root + "proc:self:"), Fails(Outcome::kNotAVolume));
  EXPECT_THAT(mClient.PathOfHFSPath(root + "proc::"), testing::Not(Is("/proc", Outcome::kFound)));
  EXPECT_THAT(mClient.PathOfHFSPath(root + "proc:fs::"), Fails(Outcome::kNotAVolume));
}

TEST_F(Conversions, TheNameOfNoVolumeIsNotLookedForInTheCurrentFolder) {
  mFolder.MakeFolder("no volume");
  const WorkingIn folder(mFolder.Path());
  Client here = StartClient();
  EXPECT_THAT(here.PathOfHFSPath("no volume:"), Fails(Outcome::kNotAVolume));
}

TEST_F(Conversions, ANewItemInAKernelInterfaceIsOnNoVolume) {
  EXPECT_EQ(RawPathOf(RawRecordOf("/proc/new")), std::nullopt);
  EXPECT_THAT(mClient.RecordOf("/proc/new"), Fails(Outcome::kNotAVolume));
  EXPECT_THAT(mClient.HFSPathOf("/proc/new"), Fails(Outcome::kNotAVolume));
  EXPECT_THAT(mClient.PathInFolder("/proc", "new"), Fails(Outcome::kNotAVolume));
}

TEST_F(Conversions, ATextWithANULIsRefused) {
  const std::string text("a\0b", 3);
  EXPECT_THAT(mClient.RecordOf(In(text)), Fails(Outcome::kInvalid));
  EXPECT_THAT(mClient.PathOf(NewRecord(text)), Fails(Outcome::kInvalid));
  EXPECT_THAT(mClient.PathInFolder(mFolder.Path(), text), Fails(Outcome::kInvalid));
  EXPECT_THAT(mClient.PathOfHFSPath(text), Fails(Outcome::kInvalid));
}

TEST_F(Conversions, WhatIsTooLongIsRefused) {
  EXPECT_THAT(mClient.RecordOf(In(std::string(256, 'x'))), Fails(Outcome::kInvalid));
  EXPECT_THAT(mClient.RecordOf("/" + std::string(70000, 'x')), Fails(Outcome::kInvalid));
  EXPECT_THAT(mClient.PathOf(NewRecord(std::string(64, 'x'))), Fails(Outcome::kInvalid));
  EXPECT_THAT(mClient.PathOfHFSPath(std::string(256, 'x')), Fails(Outcome::kInvalid));
  EXPECT_THAT(mClient.PathInFolder(mFolder.Path(), std::string(256, 'x')),
              Fails(Outcome::kInvalid));
}

TEST_F(Conversions, WhatMayNotBeLookedAtIsRefused) {
  if (geteuid() != 0) GTEST_SKIP() << "becoming another user is not permitted here";
  chmod(mFolder.Path().c_str(), 0755);
  chmod(mFolder.MakeFolder("closed").c_str(), 0700);
  EXPECT_TRUE(test::HoldsForNobody([&] {
    Client client = StartClient();
    return testing::Matches(Fails(Outcome::kRefused))(client.RecordOf(In("closed/x"))) &&
           testing::Matches(Fails(Outcome::kRefused))(client.PathInFolder(In("closed/x"), "y"));
  }));
}

TEST_F(Conversions, AFailedServiceIsSaid) {
  Client client({.service = "/bin/true"});
  EXPECT_THAT(client.RecordOf("/"), Fails(Outcome::kServiceFailed));
  EXPECT_THAT(client.PathOf({0, 2, "x"}), Fails(Outcome::kServiceFailed));
  EXPECT_THAT(client.HFSPathOf("/"), Fails(Outcome::kServiceFailed));
  EXPECT_THAT(client.PathOfHFSPath("x:"), Fails(Outcome::kServiceFailed));
  EXPECT_THAT(client.HFSNameOf("/"), Fails(Outcome::kServiceFailed));
  EXPECT_THAT(client.PathInFolder("/", "x"), Fails(Outcome::kServiceFailed));
}

// --- Long HFS paths ---

// Makes nested folders whose names have these numbers of letters. Returns the innermost path.
std::string Deep(const TemporaryFolder& folder, std::size_t letters, std::size_t folders) {
  std::string path;
  for (std::size_t i = 0; i < folders; ++i) path += std::string(letters, 'x') + '/';
  return folder.MakeFolder(path).parent_path();
}

TEST_F(Conversions, AnHFSPathOfWhichTheServiceLeavesFoldersOutIsRefused) {
  const std::string path = Deep(mFolder, 62, 8);
  const std::string raw = *mClient.MakeFullPath(path + "/x");
  ASSERT_LE(raw.size(), 511);
  ASSERT_EQ(raw.find(mFolder.Path().filename()), std::string::npos);
  EXPECT_THAT(mClient.HFSPathOf(path + "/x"), Fails(Outcome::kInvalid));
  EXPECT_THAT(mClient.HFSPathOf(path), Fails(Outcome::kInvalid));
}

TEST_F(Conversions, AnHFSPathOfWhichNothingIsLeftOutIsAnswered) {
  const std::string outer = Deep(mFolder, 62, 6);
  const std::string start = *mClient.MakeFullPath(outer);
  const std::string inner = outer + "/" + std::string(490 - start.size() - 1, 'y');
  std::filesystem::create_directory(inner);
  const std::string whole = start + inner.substr(outer.size() + 1) + ":";
  EXPECT_THAT(mClient.HFSPathOf(inner), Is(whole, Outcome::kFound));
  EXPECT_THAT(mClient.HFSPathOf(inner + "/x"), Is(whole + "x", Outcome::kNew));
  EXPECT_THAT(mClient.HFSPathOf(inner + "/" + std::string(21, 'x')),
              Is(whole + std::string(21, 'x'), Outcome::kNew));
  EXPECT_THAT(mClient.HFSPathOf(inner + "/" + std::string(22, 'x')), Fails(Outcome::kInvalid));
}

// --- Volumes ---

class VolumeConversions : public Conversions {
 protected:
  void SetUp() override {
    if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  }
};

TEST_F(VolumeConversions, AVolumeMountedInItsNamesakeIsItself) {
  const ScopedMount outer("none", mFolder.MakeFolder("vol"), "tmpfs");
  const ScopedMount inner("none", mFolder.MakeFolder("vol/vol"), "tmpfs");
  ASSERT_TRUE(outer.IsMounted() && inner.IsMounted());
  EXPECT_THAT(mClient.HFSPathOf(In("vol")), Is(std::string("vol:"), Outcome::kFound));
  EXPECT_THAT(mClient.HFSPathOf(In("vol/vol")), Fails(Outcome::kAmbiguous));
}

TEST_F(VolumeConversions, AVolumeMountedInAKernelInterfaceHasItsNameForAnHFSPath) {
  const ScopedMount interface("none", mFolder.MakeFolder("interface"), "sysfs");
  const ScopedMount volume("none", In("interface/fs"), "tmpfs");
  const ScopedMount inner("none", mFolder.MakeFolder("interface/fs/a/deep vol"), "tmpfs");
  const ScopedMount below("none", In("interface/kernel/debug"), "tmpfs");
  ASSERT_TRUE(interface.IsMounted() && volume.IsMounted() && inner.IsMounted());
  ASSERT_TRUE(below.IsMounted());
  EXPECT_THAT(mClient.HFSPathOf(In("interface/fs")), Is(std::string("fs:"), Outcome::kFound));
  EXPECT_THAT(mClient.HFSPathOf(In("interface/kernel/debug")),
              Is(std::string("debug:"), Outcome::kFound));
  EXPECT_THAT(mClient.HFSPathOf(In("interface/kernel/debug/")),
              Is(std::string("debug:"), Outcome::kFound));
  EXPECT_THAT(mClient.HFSPathOf(In("interface/fs/a/deep vol")),
              Is(std::string("deep vol:"), Outcome::kFound));
  EXPECT_THAT(mClient.PathOfHFSPath("debug:"), Is(In("interface/kernel/debug"), Outcome::kFound));
}

TEST_F(VolumeConversions, AnHFSPathOnTheSecondOfTwoVolumesWithOneNameIsAmbiguous) {
  const ScopedMount first("none", mFolder.MakeFolder("a/vol"), "tmpfs");
  const ScopedMount second("none", mFolder.MakeFolder("b/vol"), "tmpfs");
  ASSERT_TRUE(first.IsMounted() && second.IsMounted());
  mFolder.MakeFile("a/vol/file");
  mFolder.MakeFile("b/vol/file");
  EXPECT_EQ(*mClient.MakeFileRefFromPath(*mClient.MakeFullPath(In("b/vol")) + "file"),
            In("a/vol/file"));
  EXPECT_THAT(mClient.HFSPathOf(In("a/vol/file")), Is(std::string("vol:file"), Outcome::kFound));
  EXPECT_THAT(mClient.HFSPathOf(In("b/vol/file")), Fails(Outcome::kAmbiguous));
}

TEST_F(VolumeConversions, AnHFSPathInAFolderThatOnlyTheSecondNamesakeHasIsAmbiguous) {
  const ScopedMount first("none", mFolder.MakeFolder("a/v\xC3\xA9"), "tmpfs");
  const ScopedMount second("none", mFolder.MakeFolder("b/v\xC3\xA9"), "tmpfs");
  ASSERT_TRUE(first.IsMounted() && second.IsMounted());
  mFolder.MakeFolder("b/v\xC3\xA9/only/inner");
  for (const char* const item : {"only", "only/new", "only/inner", "only/inner/new"}) {
    const auto hfsPath = mClient.HFSPathOf(In("b/v\xC3\xA9/") + item);
    EXPECT_THAT(hfsPath, Fails(Outcome::kAmbiguous)) << item;
    EXPECT_THAT(test::MessageOf(hfsPath), HasSubstr("v\xC3\xA9\"")) << item;
  }
}

TEST_F(VolumeConversions, AKernelInterfaceThatIsMountedTwiceHasAnHFSPathAtEachPlace) {
  const ScopedMount first("none", mFolder.MakeFolder("first"), "proc");
  const ScopedMount second("none", mFolder.MakeFolder("folder/second"), "proc");
  ASSERT_TRUE(first.IsMounted() && second.IsMounted());
  const std::string folder = mClient.HFSPathOf(mFolder.Path())->value;
  for (const std::string place : {"first", "folder:second"}) {
    const std::string path = In(place == "first" ? place : "folder/second");
    EXPECT_THAT(mClient.HFSPathOf(path), Is(folder + place + ":", Outcome::kFound));
    EXPECT_THAT(mClient.PathOfHFSPath(folder + place + ":"), Is(path, Outcome::kFound));
  }
}

// Its path on its own volume would lead to the first volume of that name.
TEST_F(VolumeConversions, AFolderOfTheSecondNamesakeHasTheHFSPathOfWhereItIsShown) {
  const ScopedMount first("none", mFolder.MakeFolder("a/vol"), "tmpfs");
  const ScopedMount second("none", mFolder.MakeFolder("b/vol"), "tmpfs");
  mFolder.MakeFolder("b/vol/only");
  const ScopedMount shown(In("b/vol/only"), mFolder.MakeFolder("shown"), nullptr, MS_BIND);
  const ScopedMount inFirst(In("b/vol/only"), mFolder.MakeFolder("a/vol/shown"), nullptr, MS_BIND);
  ASSERT_TRUE(first.IsMounted() && second.IsMounted() && shown.IsMounted() && inFirst.IsMounted());
  const std::string folder = mClient.HFSPathOf(mFolder.Path())->value;
  EXPECT_THAT(mClient.HFSPathOf(In("shown")), Is(folder + "shown:", Outcome::kFound));
  EXPECT_THAT(mClient.HFSPathOf(In("a/vol/shown")), Is(std::string("vol:shown:"), Outcome::kFound));
  EXPECT_THAT(mClient.HFSPathOf(In("shown/new")), Fails(Outcome::kAmbiguous));
}

TEST_F(VolumeConversions, AFolderOfTheFirstNamesakeIsFoundThereWhereverItIsShown) {
  const ScopedMount first("none", mFolder.MakeFolder("a/vol"), "tmpfs");
  const ScopedMount second("none", mFolder.MakeFolder("b/vol"), "tmpfs");
  mFolder.MakeFolder("a/vol/only");
  const ScopedMount shown(In("a/vol/only"), mFolder.MakeFolder("b/vol/shown"), nullptr, MS_BIND);
  ASSERT_TRUE(first.IsMounted() && second.IsMounted() && shown.IsMounted());
  EXPECT_THAT(mClient.HFSPathOf(In("b/vol/shown")), Is(std::string("vol:only:"), Outcome::kFound));
}

TEST_F(VolumeConversions, WhatIsMountedOnTheSecondNamesakeIsAmbiguous) {
  const ScopedMount first("none", mFolder.MakeFolder("a/vol"), "tmpfs");
  const ScopedMount second("none", mFolder.MakeFolder("b/vol"), "tmpfs");
  mFolder.MakeFolder("b/vol/only");
  const ScopedMount interface("none", mFolder.MakeFolder("b/vol/interface"), "proc");
  const ScopedMount shown(In("b/vol/only"), mFolder.MakeFolder("b/vol/shown"), nullptr, MS_BIND);
  const ScopedMount file(mFolder.MakeFile("a/vol/file"), mFolder.MakeFile("b/vol/other"), nullptr,
                         MS_BIND);
  ASSERT_TRUE(interface.IsMounted() && shown.IsMounted() && file.IsMounted());
  for (const char* const item : {"interface", "shown", "other"}) {
    EXPECT_THAT(mClient.HFSPathOf(In("b/vol/") + item), Fails(Outcome::kAmbiguous)) << item;
  }
}

TEST_F(VolumeConversions, AnHFSPathWhoseOuterFoldersMayNotBeLookedAtIsRefused) {
  if (geteuid() != 0) GTEST_SKIP() << "becoming another user is not permitted here";
  const ScopedMount volume("none", mFolder.MakeFolder("vol"), "tmpfs");
  mFolder.MakeFolder("vol/private/inner");
  const ScopedMount view(In("vol/private/inner"), mFolder.MakeFolder("view"), nullptr, MS_BIND);
  ASSERT_TRUE(volume.IsMounted() && view.IsMounted());
  chmod(mFolder.Path().c_str(), 0755);
  mFolder.MakeFile("view/file");
  EXPECT_THAT(mClient.HFSPathOf(In("view/file")),
              Is(std::string("vol:private:inner:file"), Outcome::kFound));
  chmod(In("vol/private").c_str(), 0700);
  EXPECT_TRUE(test::HoldsForNobody([&] {
    Client client = StartClient();
    const bool isLeftOut = *client.MakeFullPath(In("view")) != "vol:private:inner:";
    // The folder itself has its path as an item of its holder.
    const auto itself = client.HFSPathOf(In("view"));
    return isLeftOut && itself && itself->value.ends_with(":view:") &&
           testing::Matches(Fails(Outcome::kRefused))(client.HFSPathOf(In("view/file")));
  }));
}

TEST_F(VolumeConversions, OtherVolumesAreSearchedOnlyOnRequest) {
  const ScopedMount first("none", mFolder.MakeFolder("first"), "tmpfs");
  const ScopedMount second("none", mFolder.MakeFolder("second"), "tmpfs");
  ASSERT_TRUE(first.IsMounted() && second.IsMounted());
  const std::string file = mFolder.MakeFile("second/file");
  FSSpec record = RawRecordOf(file);
  record.vRefNum = RawRecordOf(In("first/x")).vRefNum;
  EXPECT_THAT(mClient.PathOf(record), Is(In("first/file"), Outcome::kNew));
  EXPECT_THAT(mClient.PathOf(record, true), Is(file, Outcome::kFound));
}

// --- Values ---

TEST(Outcomes, HaveTheNamesOfTheCommandLine) {
  const std::array all{Outcome::kFound,     Outcome::kNew,          Outcome::kNothing,
                       Outcome::kAmbiguous, Outcome::kRefused,      Outcome::kNotAVolume,
                       Outcome::kInvalid,   Outcome::kServiceFailed};
  std::vector<std::string_view> names;
  for (const Outcome outcome : all) names.push_back(Name(outcome));
  EXPECT_THAT(names, testing::ElementsAre("found", "new", "nothing", "ambiguous", "refused",
                                          "not-a-volume", "invalid", "service-failed"));
}

TEST(Results, HaveAValueOrAnother) {
  Result<std::string> value(std::string("value"));
  const Result<std::string> error(Error{Outcome::kNothing, "none"});
  EXPECT_EQ(value.ValueOr("other"), "value");
  EXPECT_EQ(error.ValueOr("other"), "other");
  EXPECT_EQ(std::move(value).ValueOr("other"), "value");
}

}  // namespace
}  // namespace tallowmere
