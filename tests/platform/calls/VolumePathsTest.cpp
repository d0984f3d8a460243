// The volumes that HFS paths name, on this machine and with mounts made by the test.
#include <gtest/gtest.h>

#include "foundation/VolumePaths.h"
#include "support/MountNamespace.h"
#include "support/TemporaryFolder.h"
#include "text/MacRoman.h"

namespace tallowmere::foundation {
namespace {

using test::ScopedMount;
using test::TemporaryFolder;

TEST(VolumePaths, APathIsOnTheVolumeWhoseMountPointItBeginsWith) {
  if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  const std::string place = folder.MakeFolder("caf\u00E9 of tallowmere").string();
  const ScopedMount mount("none", place, "tmpfs");
  ASSERT_TRUE(mount.IsMounted());
  const auto volume = FindVolumeOfPath(place + "/file");
  ASSERT_TRUE(volume);
  EXPECT_EQ(volume->name, u"caf\u00E9 of tallowmere");
  EXPECT_EQ(volume->mountPointLength, place.size());
  EXPECT_EQ(MountPointOfVolume(volume->name), place);
  EXPECT_EQ(MountPointOfVolume(u"cafe\u0301 of tallowmere"), std::nullopt);
}

TEST(VolumePaths, AnAmbiguousVolumeNameIsTheFirstVolumes) {
  if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  const std::string first = folder.MakeFolder("1/tallowmere twin").string();
  const std::string second = folder.MakeFolder("2/tallowmere twin").string();
  const ScopedMount firstMount("none", first, "tmpfs");
  const ScopedMount secondMount("none", second, "tmpfs");
  ASSERT_TRUE(firstMount.IsMounted() && secondMount.IsMounted());
  EXPECT_TRUE(FindVolumeOfPath(first + "/file"));
  EXPECT_FALSE(FindVolumeOfPath(second + "/file"));
  EXPECT_EQ(MountPointOfVolume(u"tallowmere twin"), first);
}

TEST(VolumePaths, NoVolumeHasANameOutsideMacRoman) {
  EXPECT_EQ(MountPointOfVolume(u"\u6F22"), std::nullopt);
}

TEST(VolumePaths, AnUnknownNameIsNoVolume) {
  EXPECT_EQ(MountPointOfVolume(u"tallowmere has no such volume"), std::nullopt);
}

}  // namespace
}  // namespace tallowmere::foundation
