// Codes 3 and 4: the number of a volume and the name of a volume.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/mount.h>

#include <optional>

#include "support/DeadMount.h"
#include "support/MountNamespace.h"
#include "support/TemporaryFolder.h"
#include "support/TracedService.h"
#include "support/Wire.h"

namespace tallowmere::test {
namespace {

using testing::SizeIs;

TEST(VolumeCommands, NameLengthOf256IsAccepted) {
  Service service;
  EXPECT_EQ(service.Ask(U16(3) + Counted(std::string(256, 'x')), 6), VolumeNumberResponse(32767));
}

TEST(VolumeCommands, NameLengthAbove256EndsTheServiceWithoutAResponse) {
  for (const unsigned length : {257u, 1024u, 65535u}) {
    Service service;
    const std::string name(length, 'x');
    service.Write(U16(3) + U16(length));
    EXPECT_EQ(service.Wait(), 0);
    EXPECT_EQ(service.ReadToEnd(), "");
  }
}

TEST(VolumeCommands, NothingIsReadAfterANameLengthAbove256) {
  Service service;
  service.Write(U16(3) + Counted(std::string(257, 'x')));
  EXPECT_EQ(service.Wait(), 0);
  EXPECT_EQ(service.UnreadInput(), 257u);
}

TEST(VolumeCommands, TheVolumeOfTheRootIsNumber0AsAnInput) {
  Service service;
  const std::string name = service.NameOf(0);
  ASSERT_NE(name, "");
  const int number = service.NumberOf(name);
  EXPECT_LT(number, 0);
  EXPECT_EQ(service.NameOf(number), name);
}

TEST(VolumeCommands, AMountedVolumeIsAnsweredWithItsNameAndItsNul) {
  Service service;
  const std::string name = service.NameOf(0);
  const int number = service.NumberOf(name);
  const std::string expected = VolumeNameResponse(name);
  EXPECT_EQ(service.Ask(VolumeNameRequest(number), expected.size()), expected);
}

TEST(VolumeCommands, ANameInOtherLetterCaseIsNoVolume) {
  Service service;
  std::string name = service.NameOf(0);
  bool changed = false;
  for (char& c : name) {
    if (isalpha(static_cast<unsigned char>(c)) != 0) {
      c = static_cast<char>(c ^ 0x20);
      changed = true;
    }
  }
  if (!changed) GTEST_SKIP() << "the volume's name has no letter";
  EXPECT_EQ(service.NumberOf(name), 32767);
}

TEST(VolumeCommands, AnUnknownNumberIsAnsweredWithFlag0AndAnEmptyName) {
  Service service;
  for (const int number : {32767, 1, 2}) {
    EXPECT_EQ(service.Ask(VolumeNameRequest(number), 8), kNoVolumeNameResponse) << number;
  }
}

TEST(VolumeCommands, EveryServiceGivesOneVolumeTheSameNumber) {
  Service first;
  Service second;
  const std::string name = first.NameOf(0);
  EXPECT_EQ(first.NumberOf(name), second.NumberOf(name));
}

class WithMounts : public testing::Test {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  }
  std::string Folder(const std::string& name) { return mFolder.MakeFolder(name).string(); }

  TemporaryFolder mFolder;
};

TEST_F(WithMounts, AVolumeAppearsAndVanishesBetweenTwoRequests) {
  Service service;
  EXPECT_EQ(service.NumberOf("Appearing"), 32767);
  ScopedMount volume("none", Folder("Appearing"), "tmpfs");
  ASSERT_TRUE(volume.IsMounted());
  const int number = service.NumberOf("Appearing");
  EXPECT_LT(number, 0);
  EXPECT_EQ(service.NameOf(number), "Appearing");
  volume.Unmount();
  EXPECT_EQ(service.NumberOf("Appearing"), 32767);
  EXPECT_EQ(service.NameOf(number), "");
}

TEST_F(WithMounts, AVolumeKeepsItsNumberWhileOthersComeAndGo) {
  Service service;
  const std::string root = service.NameOf(0);
  const int rootNumber = service.NumberOf(root);
  ScopedMount before("none", Folder("Before"), "tmpfs");
  ScopedMount staying("none", Folder("Staying"), "tmpfs");
  ASSERT_TRUE(staying.IsMounted());
  const int number = service.NumberOf("Staying");
  before.Unmount();
  EXPECT_EQ(service.NumberOf("Staying"), number);
  const ScopedMount after("none", Folder("After"), "tmpfs");
  EXPECT_EQ(service.NumberOf("Staying"), number);
  EXPECT_NE(service.NumberOf("After"), number);
  EXPECT_EQ(service.NumberOf(root), rootNumber);
  Service another;
  EXPECT_EQ(another.NumberOf("Staying"), number);
}

TEST_F(WithMounts, TwoVolumesWithOneNameAreAnsweredByTheFirst) {
  Service service;
  ScopedMount first("none", Folder("a/Twin"), "tmpfs");
  ASSERT_TRUE(first.IsMounted());
  const int firstNumber = service.NumberOf("Twin");
  const ScopedMount second("none", Folder("b/Twin"), "tmpfs");
  EXPECT_EQ(service.NumberOf("Twin"), firstNumber);
  first.Unmount();
  const int secondNumber = service.NumberOf("Twin");
  EXPECT_LT(secondNumber, 0);
  EXPECT_NE(secondNumber, firstNumber);
}

TEST_F(WithMounts, NamesAreInHFSForm) {
  Service service;
  const ScopedMount accented("none", Folder("Ve\xCC\x81lo: 2"), "tmpfs");
  const ScopedMount foreign("none", Folder("\xE6\x97\xA5\xE6\x9C\xAC.disk"), "tmpfs");
  const ScopedMount bytes("none", Folder("\xFF-x"), "tmpfs");
  const ScopedMount tooLong("none", Folder(std::string(70, 'n')), "tmpfs");
  ASSERT_TRUE(tooLong.IsMounted());
  EXPECT_LT(service.NumberOf("V\x8Elo/ 2"), 0);
  EXPECT_LT(service.NumberOf("??#2.disk"), 0);
  EXPECT_LT(service.NumberOf("?-x#2"), 0);
  EXPECT_LT(service.NumberOf(std::string(29, 'n') + "#2"), 0);
}

TEST_F(WithMounts, AVolumeUnderAnotherMountIsNone) {
  Service service;
  const std::string place = Folder("Covered");
  const ScopedMount below("none", place, "tmpfs");
  const int belowNumber = service.NumberOf("Covered");
  const ScopedMount above("none", place, "tmpfs");
  ASSERT_TRUE(above.IsMounted());
  EXPECT_NE(service.NumberOf("Covered"), belowNumber);
  EXPECT_EQ(service.NameOf(belowNumber), "");
}

TEST_F(WithMounts, AFileMountedAloneIsNoVolume) {
  Service service;
  const ScopedMount source("none", Folder("Source"), "tmpfs");
  ASSERT_TRUE(source.IsMounted());
  std::ofstream(mFolder.Path() / "Source" / "file") << "content";
  const std::string place = mFolder.MakeFile("Lonely").string();
  const ScopedMount file((mFolder.Path() / "Source" / "file").string(), place, nullptr, MS_BIND);
  ASSERT_TRUE(file.IsMounted());
  EXPECT_EQ(service.NumberOf("Lonely"), 32767);
  EXPECT_LT(service.NumberOf("Source"), 0);
  ASSERT_EQ(umount2((mFolder.Path() / "Source").c_str(), MNT_DETACH), 0);
  EXPECT_EQ(service.NumberOf("Lonely"), 32767);
}

TEST_F(WithMounts, AFolderMountedTwiceIsOneVolumeAtItsFirstPlace) {
  Service service;
  ScopedMount first("none", Folder("First"), "tmpfs");
  ASSERT_TRUE(first.IsMounted());
  const ScopedMount second(Folder("First"), Folder("Second"), nullptr, MS_BIND);
  ASSERT_TRUE(second.IsMounted());
  EXPECT_LT(service.NumberOf("First"), 0);
  EXPECT_EQ(service.NumberOf("Second"), 32767);
  first.Unmount();
  EXPECT_EQ(service.NumberOf("First"), 32767);
  EXPECT_LT(service.NumberOf("Second"), 0);
}

TEST_F(WithMounts, WithoutProcThereIsOneVolume) {
  const ScopedMount other("none", Folder("Other"), "tmpfs");
  Service before;
  const std::string name = before.NameOf(0);
  const int number = before.NumberOf(name);
  const ScopedMount noProc("none", "/proc", "tmpfs");
  ASSERT_TRUE(noProc.IsMounted());
  Service service;
  EXPECT_EQ(service.NameOf(0), name);
  EXPECT_EQ(service.NumberOf(name), number);
  EXPECT_EQ(service.NumberOf("Other"), 32767);
}

TEST_F(WithMounts, AVolumeThatNeverAnswersIsListedWithoutWaiting) {
  const DeadMount dead(Folder("Dead"));
  if (!dead.IsMounted()) GTEST_SKIP() << "no FUSE mounts here";
  const ScopedMount alive("none", Folder("Alive"), "tmpfs");
  Service service;
  EXPECT_LT(service.NumberOf("Dead"), 0);
  EXPECT_LT(service.NumberOf("Alive"), 0);
}

TEST(VolumeCommands, AThousandRequestsParseTheMountTableOnce) {
  std::string requests;
  for (int i = 0; i < 500; ++i) requests += VolumeNumberRequest("none") + VolumeNameRequest(32767);
  const auto run = RunTraced("openat,pread64", requests + kQuit);
  if (!run) GTEST_SKIP() << "strace cannot trace here";
  EXPECT_EQ(run->status, 0);
  EXPECT_THAT(run->responses, SizeIs(500 * (6 + 8)));

  int opened = 0;
  int readToTheEnd = 0;
  std::optional<std::string> table;
  for (const std::string& call : run->calls) {
    if (call.find("/proc/self/mountinfo") != std::string::npos) {
      ++opened;
      table = call.substr(call.rfind(' ') + 1);
    }
    if (table && call.starts_with("pread64(" + *table) && call.ends_with("= 0")) ++readToTheEnd;
  }
  EXPECT_EQ(opened, 1);
  EXPECT_EQ(readToTheEnd, 1);
}

}  // namespace
}  // namespace tallowmere::test
