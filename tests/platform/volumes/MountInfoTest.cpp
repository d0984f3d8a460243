// Parsing the text of the mount table.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/sysmacros.h>

#include "volumes/MountInfo.h"

namespace tallowmere::volumes {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

std::vector<std::string> MountPointsIn(std::string_view table) {
  std::vector<std::string> places;
  for (const Mount& mount : ParseMountInfo(table)) places.push_back(mount.mountPoint);
  return places;
}

TEST(MountInfo, ALineHasItsFields) {
  const auto mounts = ParseMountInfo(
      "36 35 98:7 /sub /mnt rw,noatime shared:1 master:2 propagate_from:3 - ext3 /dev/x rw,a=b\n");
  ASSERT_THAT(mounts, SizeIs(1));
  EXPECT_EQ(mounts[0].id, 36);
  EXPECT_EQ(mounts[0].parent, 35);
  EXPECT_EQ(mounts[0].device, makedev(98, 7));
  EXPECT_EQ(mounts[0].root, "/sub");
  EXPECT_EQ(mounts[0].mountPoint, "/mnt");
  EXPECT_EQ(mounts[0].type, "ext3");
}

TEST(MountInfo, OptionalFieldsMayBeMissing) {
  EXPECT_EQ(ParseMountInfo("1 0 8:1 / / rw - xfs /dev/x rw").at(0).type, "xfs");
}

TEST(MountInfo, EscapesAreUndone) {
  const auto mounts = ParseMountInfo(
      "2 1 0:5 /a\\134b /My\\040Disk\\011x\\012y\\043z\\134040 rw - tmpfs none rw\n");
  ASSERT_THAT(mounts, SizeIs(1));
  EXPECT_EQ(mounts[0].root, "/a\\b");
  EXPECT_EQ(mounts[0].mountPoint, "/My Disk\tx\ny#z\\040");
}

TEST(MountInfo, AnEscapeAtTheEndOfAFieldIsUndone) {
  const auto mounts = ParseMountInfo("2 1 0:5 /a\\134 /My\\040Disk\\040 rw - tmpfs none rw\n");
  ASSERT_THAT(mounts, SizeIs(1));
  EXPECT_EQ(mounts[0].root, "/a\\");
  EXPECT_EQ(mounts[0].mountPoint, "/My Disk ");
}

TEST(MountInfo, ABackslashThatBeginsNoEscapeStaysAsItIs) {
  EXPECT_EQ(ParseMountInfo("2 1 0:5 / /a\\04 rw - tmpfs none rw\n").at(0).mountPoint, "/a\\04");
  EXPECT_EQ(ParseMountInfo("2 1 0:5 / /a\\89z rw - tmpfs none rw\n").at(0).mountPoint, "/a\\89z");
  for (const std::string place : {"/a\\/040", "/a\\0/40", "/a\\04/0", "/a\\080", "/a\\048"}) {
    const auto mounts = ParseMountInfo("2 1 0:5 / " + place + " rw - tmpfs none rw\n");
    EXPECT_EQ(mounts.at(0).mountPoint, place);
  }
}

TEST(MountInfo, MalformedLinesAreSkippedAndTheRestIsKept) {
  EXPECT_THAT(MountPointsIn("1 0 8:1 / / rw - ext4 /dev/a rw\n"
                            "\n"
                            "x 1 8:2 / /no-id rw - ext4 /dev/b rw\n"
                            "3 1 8 / /no-minor rw - ext4 /dev/b rw\n"
                            "4 1 8:4 / relative rw - ext4 /dev/b rw\n"
                            "5 1 8:5 / /no-type rw -\n"
                            "6 1 8:6 / /no-separator rw shared:1 ext4\n"
                            "7 1 8:7\n"
                            "99999999999 1 8:8 / /overflow rw - ext4 /dev/b rw\n"
                            "9 1 8:9 / /good rw - ext4 /dev/c rw\n"),
              ElementsAre("/", "/good"));
}

TEST(MountInfo, NoTextHasNoMounts) {
  EXPECT_THAT(ParseMountInfo(""), IsEmpty());
}

}  // namespace
}  // namespace tallowmere::volumes
