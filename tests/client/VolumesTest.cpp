#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/mount.h>
#include <tallowmere/Volumes.h>

#include <algorithm>

#include "client/ClientSupport.h"
#include "client/Mounts.h"
#include "support/MountNamespace.h"

namespace tallowmere {
namespace {

using test::EnterOwnMountNamespace;
using test::ScopedMount;
using test::StartClient;
using test::TemporaryFolder;
using testing::ElementsAre;

TEST(MountPoints, AreTheRootFirstAndThenInTheOrderOfTheirLines) {
  EXPECT_THAT(MountPointsIn("22 21 0:20 / /proc rw,nosuid shared:5 master:1 - proc proc rw\n"
                            "21 1 8:1 / / rw - ext4 /dev/sda1 rw\n"
                            "23 21 8:2 /sub /home rw - ext4 /dev/sda2 rw\n"),
              ElementsAre("/", "/proc", "/home"));
}

TEST(MountPoints, HaveTheirEscapesUndone) {
  EXPECT_THAT(MountPointsIn("23 21 8:2 / /a\\040b\\011\\012\\134\\043 rw - ext4 x rw\n"
                            "24 21 8:3 / /tail\\04 rw - ext4 x rw\n"),
              ElementsAre("/", "/a b\t\n\\#", "/tail\\04"));
}

TEST(MountPoints, AtWhichSeveralAreMountedStandWhereTheLastOneDoes) {
  EXPECT_THAT(MountPointsIn("2 1 8:2 / /a rw - ext4 x rw\n3 1 8:3 / /b rw - ext4 x rw\n"
                            "4 2 8:4 / /a rw - ext4 x rw\n"),
              ElementsAre("/", "/b", "/a"));
}

TEST(MountPoints, OfLinesThatAreNoneAreNone) {
  EXPECT_THAT(MountPointsIn(""), ElementsAre("/"));
  EXPECT_THAT(MountPointsIn("\n1 2 3\n1 2 3 4 relative\n2 1 8:2 / /a"), ElementsAre("/", "/a"));
}

// The listed volume with that mount point.
std::optional<Volume> At(const std::vector<Volume>& volumes, const std::string& mountPoint) {
  const auto found = std::find_if(volumes.begin(), volumes.end(), [&](const Volume& volume) {
    return volume.mountPoint == mountPoint;
  });
  return found == volumes.end() ? std::nullopt : std::optional(*found);
}

TEST(ListVolumes, HasNumberNameAndMountPointOfEachWithTheRootFirst) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  const std::string place = folder.MakeFolder("V\xC3\xA9 1");
  const ScopedMount volume("none", place, "tmpfs");
  ASSERT_TRUE(volume.IsMounted());
  Client client = StartClient();
  const auto volumes = ListVolumes(client);
  ASSERT_TRUE(volumes);
  EXPECT_EQ(volumes->front().mountPoint, "/");
  const auto listed = At(*volumes, place);
  ASSERT_TRUE(listed);
  EXPECT_EQ(listed->name, "V\x8E 1");
  EXPECT_EQ(*client.GetVolRefnumByHFSName(listed->name), listed->number);
}

TEST(ListVolumes, HasEachVolumeOnceAndNoInterfaceOfTheKernelNorFolderMountedAlone) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  const std::string place = folder.MakeFolder("first");
  const ScopedMount volume("none", place, "tmpfs");
  ASSERT_TRUE(volume.IsMounted());
  folder.MakeFolder("first/inner");
  const ScopedMount again(place, folder.MakeFolder("second"), nullptr, MS_BIND);
  const ScopedMount inner(place + "/inner", folder.MakeFolder("inner"), nullptr, MS_BIND);
  const ScopedMount processes("none", folder.MakeFolder("processes"), "proc");
  ASSERT_TRUE(again.IsMounted() && inner.IsMounted() && processes.IsMounted());
  Client client = StartClient();
  const auto volumes = ListVolumes(client);
  ASSERT_TRUE(volumes);
  EXPECT_TRUE(At(*volumes, place));
  for (const char* const name : {"second", "inner", "processes"}) {
    EXPECT_FALSE(At(*volumes, folder.Path() / name)) << name;
  }
}

TEST(MountPoints, HaveTheKindsOfTheirFileSystems) {
  const auto mounts = MountsIn(
      "21 1 8:1 / / rw - ext4 /dev/sda1 rw\n"
      "23 21 0:9 / /a rw shared:1 master:2 - fuse.sshfs x rw\n"
      "24 21 0:9 / /b rw - nfs4 x rw\n25 21 0:9 / /c rw\n");
  ASSERT_EQ(mounts.size(), 4u);
  EXPECT_EQ(mounts[0].kind, "ext4");
  EXPECT_EQ(mounts[1].kind, "fuse.sshfs");
  EXPECT_EQ(mounts[3].kind, "");
  EXPECT_FALSE(HasServer(mounts[0]));
  EXPECT_TRUE(HasServer(mounts[1]));
  EXPECT_TRUE(HasServer(mounts[2]));
  EXPECT_FALSE(HasServer(mounts[3]));
}

TEST(FindVolume, TakesANameOrAMountPoint) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  const std::string place = folder.MakeFolder("V\xC3\xA9 1");
  const ScopedMount volume("none", place, "tmpfs");
  const ScopedMount again(place, folder.MakeFolder("again"), nullptr, MS_BIND);
  ASSERT_TRUE(volume.IsMounted() && again.IsMounted());
  folder.MakeFolder("again/inner");
  Client client = StartClient();
  const auto byName = FindVolume(client, "V\xC3\xA9 1");
  ASSERT_TRUE(byName);
  EXPECT_EQ(byName->mountPoint, place);
  for (const std::string& path : {place, place + "/", (folder.Path() / "again").string()}) {
    const auto byPath = FindVolume(client, path);
    ASSERT_TRUE(byPath) << path;
    EXPECT_EQ(byPath->number, byName->number);
    EXPECT_EQ(byPath->name, byName->name);
  }
}

class FindVolumeByPath : public testing::Test {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    mFirst.emplace("none", mFolder.MakeFolder("a/first").string(), "tmpfs");
    mSecond.emplace("none", mFolder.MakeFolder("b/second").string(), "tmpfs");
    ASSERT_TRUE(mFirst->IsMounted() && mSecond->IsMounted());
    std::filesystem::current_path(mFolder.Path());
  }
  void TearDown() override { std::filesystem::current_path("/"); }

  std::string PlaceOf(std::string_view text) {
    const auto volume = FindVolume(mClient, text);
    return volume ? volume->mountPoint : test::MessageOf(volume);
  }

  TemporaryFolder mFolder;
  std::optional<ScopedMount> mFirst;
  std::optional<ScopedMount> mSecond;
  Client mClient = StartClient();
};

TEST_F(FindVolumeByPath, FollowsALink) {
  const std::string link = mFolder.MakeLink("link", "a/first");
  EXPECT_EQ(PlaceOf(link), (mFolder.Path() / "a/first").string());
  EXPECT_EQ(PlaceOf("link"), (mFolder.Path() / "a/first").string());
}

TEST_F(FindVolumeByPath, TakesARelativePath) {
  for (const char* const path : {"a/first", "./a/first", "a/../a/first/"}) {
    EXPECT_EQ(PlaceOf(path), (mFolder.Path() / "a/first").string()) << path;
  }
  std::filesystem::current_path(mFolder.Path() / "a/first");
  EXPECT_EQ(PlaceOf("."), (mFolder.Path() / "a/first").string());
  EXPECT_EQ(PlaceOf("first"), (mFolder.Path() / "a/first").string());
  EXPECT_EQ(PlaceOf("a"), "no volume is called \"a\"");
  std::filesystem::current_path("/");
}

TEST_F(FindVolumeByPath, RefusesTheNameOfOneVolumeThatIsThePathOfAnother) {
  mFolder.MakeLink("first", "b/second");
  const std::string root = mFolder.Path();
  EXPECT_EQ(PlaceOf("first"), "the volume at " + root +
                                  "/a/first is called \"first\", and that is "
                                  "the path of " +
                                  root + "/b/second");
  EXPECT_EQ(PlaceOf("./first"), root + "/b/second");
  mFolder.MakeLink("second", "b/second");
  EXPECT_EQ(PlaceOf("second"), root + "/b/second");
}

Outcome OutcomeOf(const Result<Volume>& volume) {
  return volume ? Outcome::kFound : volume.Failure().outcome;
}

TEST(FindVolume, RefusesWhatIsNone) {
  Client client = StartClient();
  for (const char* const text : {"no such volume", "", "\xFF", "/etc", "/proc", "/proc/self"}) {
    EXPECT_EQ(OutcomeOf(FindVolume(client, text)), Outcome::kNotAVolume) << text;
  }
  EXPECT_EQ(OutcomeOf(FindVolume(client, "/missing")), Outcome::kNotAVolume);
  EXPECT_EQ(OutcomeOf(FindVolume(client, "/missing/x")), Outcome::kNothing);
}

TEST(FindVolume, RefusesANameThatTwoHave) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  const ScopedMount first("none", folder.MakeFolder("a/vol"), "tmpfs");
  const ScopedMount second("none", folder.MakeFolder("b/vol"), "tmpfs");
  ASSERT_TRUE(first.IsMounted() && second.IsMounted());
  Client client = StartClient();
  const auto volume = FindVolume(client, "vol");
  EXPECT_EQ(OutcomeOf(volume), Outcome::kAmbiguous);
  EXPECT_THAT(test::MessageOf(volume), testing::HasSubstr(folder.Path() / "b/vol"));
  EXPECT_EQ(OutcomeOf(FindVolume(client, (folder.Path() / "b/vol").string())), Outcome::kFound);
}

TEST(ListVolumes, GivesTheErrorOfAServiceThatEnds) {
  Client client({.service = "/bin/true"});
  EXPECT_EQ(test::MessageOf(ListVolumes(client)), test::kEnded);
}

}  // namespace
}  // namespace tallowmere
