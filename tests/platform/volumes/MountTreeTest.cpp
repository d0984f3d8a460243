// Which mounts make up a volume, and which can be reached.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <functional>

#include "volumes/MountTree.h"

namespace tallowmere::volumes {
namespace {

using testing::ElementsAre;
using testing::SizeIs;

// Returns the id of the lowest mount at "/".
int RootIDOf(const std::vector<Mount>& mounts) {
  for (const Mount& mount : mounts) {
    if (mount.mountPoint == "/") return mount.id;
  }
  return 0;
}

std::vector<std::vector<std::size_t>> GroupIntoVolumes(
    const std::vector<Mount>& mounts, int rootID,
    const std::function<bool(const Mount&)>& isFolder) {
  return MountTree(mounts, rootID).GroupIntoVolumes(isFolder);
}

// Returns the mount points of the volumes' places. Mounts at a path that ends in "file" are files,
// all others are folders.
std::vector<std::string> PlacesIn(std::string_view table) {
  const std::vector<Mount> mounts = ParseMountInfo(table);
  std::vector<std::string> places;
  for (const auto& volume : GroupIntoVolumes(mounts, RootIDOf(mounts), [](const Mount& mount) {
         return !mount.mountPoint.ends_with("file");
       })) {
    places.push_back(mounts[volume.front()].mountPoint);
  }
  return places;
}

TEST(MountTree, KernelInterfacesAreNoVolumes) {
  EXPECT_THAT(PlacesIn("1 0 8:1 / / rw - ext4 /dev/a rw\n"
                       "2 1 0:2 / /proc rw - proc proc rw\n"
                       "3 1 0:3 / /sys rw - sysfs sysfs rw\n"
                       "4 3 0:4 / /sys/fs/cgroup rw - cgroup2 cgroup2 rw\n"
                       "5 1 0:5 / /dev rw - devtmpfs devtmpfs rw\n"
                       "6 5 0:6 / /dev/pts rw - devpts devpts rw\n"
                       "7 5 0:7 / /dev/mqueue rw - mqueue mqueue rw\n"
                       "8 2 0:8 / /proc/sys/fs/binfmt_misc rw - autofs systemd-1 rw\n"
                       "9 1 0:9 net:[4026531992] /run/netns/x rw - nsfs nsfs rw\n"),
              ElementsAre("/"));
}

TEST(MountTree, NetworkOverlayMemoryAndFuseFileSystemsAreVolumes) {
  EXPECT_THAT(PlacesIn("1 0 0:30 / / rw - overlay overlay rw\n"
                       "2 1 0:31 / /net rw - nfs4 host:/x rw\n"
                       "3 1 0:32 / /smb rw - cifs //host/x rw\n"
                       "4 1 0:33 / /tmp rw - tmpfs tmpfs rw\n"
                       "5 1 0:34 / /fuse rw - fuse.sshfs host: rw\n"
                       "6 1 0:35 / /new rw - somethingfs none rw\n"),
              ElementsAre("/", "/net", "/smb", "/tmp", "/fuse", "/new"));
}

TEST(MountTree, TheRootComesFirstThenTheKernelsOrder) {
  EXPECT_THAT(PlacesIn("20 30 0:31 / /b rw - tmpfs none rw\n"
                       "21 30 0:32 / /a rw - tmpfs none rw\n"
                       "30 1 8:1 / / rw - ext4 /dev/a rw\n"
                       "31 30 0:33 / /c rw - tmpfs none rw\n"),
              ElementsAre("/", "/b", "/a", "/c"));
}

TEST(MountTree, TheRootIsAVolumeWhateverItsType) {
  EXPECT_THAT(PlacesIn("1 1 0:2 / / rw - devtmpfs none rw\n"), ElementsAre("/"));
}

TEST(MountTree, BtrfsSubvolumesOfOneFileSystemAreOneVolume) {
  EXPECT_THAT(PlacesIn("25 1 0:22 /@ / rw - btrfs /dev/sda2 rw,subvolid=256,subvol=/@\n"
                       "40 25 0:22 /@home /home rw - btrfs /dev/sda2 rw,subvolid=257\n"
                       "41 25 8:1 / /boot rw - ext4 /dev/sda1 rw\n"),
              ElementsAre("/", "/boot"));
}

TEST(MountTree, TheFileSystemsRootFolderIsThePlaceDespiteAnEarlierMountOfAFolder) {
  EXPECT_THAT(PlacesIn("25 1 8:1 / / rw - ext4 /dev/sda1 rw\n"
                       "40 25 0:22 /@home /home rw - btrfs /dev/sda2 rw\n"
                       "41 25 0:22 / /mnt/all rw - btrfs /dev/sda2 rw\n"),
              ElementsAre("/", "/mnt/all"));
}

TEST(MountTree, TheRootIsThePlaceOfItsVolumeDespiteTheFileSystemsRootFolder) {
  EXPECT_THAT(PlacesIn("20 25 0:30 / /early rw - tmpfs none rw\n"
                       "25 1 8:1 /@ / rw - btrfs /dev/sda1 rw\n"
                       "41 25 8:1 / /mnt/toplevel rw - btrfs /dev/sda1 rw\n"),
              ElementsAre("/", "/early"));
}

TEST(MountTree, BindMountsAddNoVolume) {
  EXPECT_THAT(PlacesIn("25 1 8:1 / / rw - ext4 /dev/sda1 rw\n"
                       "26 25 8:1 /srv/data /export rw - ext4 /dev/sda1 rw\n"
                       "27 25 8:1 / /again rw - ext4 /dev/sda1 rw\n"),
              ElementsAre("/"));
}

TEST(MountTree, AFileMountedAloneIsNoVolumeAndTheNextFolderIsThePlace) {
  EXPECT_THAT(PlacesIn("25 1 8:1 / / rw - ext4 /dev/sda1 rw\n"
                       "26 25 8:2 /hosts /etc/file rw - ext4 /dev/sda2 rw\n"
                       "27 25 8:3 /resolv /run/file rw - ext4 /dev/sda3 rw\n"
                       "28 25 8:3 /data /data rw - ext4 /dev/sda3 rw\n"),
              ElementsAre("/", "/data"));
}

TEST(MountTree, OnlyMountsOfInnerFoldersAreAskedWhetherTheyAreFolders) {
  std::vector<std::string> asked;
  GroupIntoVolumes(ParseMountInfo("25 1 8:1 /inner / rw - ext4 /dev/sda1 rw\n"
                                  "26 25 0:40 / /net rw - nfs host:/x rw\n"
                                  "27 25 0:40 /sub /sub rw - nfs host:/x rw\n"
                                  "28 25 0:41 /bound /bound rw - tmpfs none rw\n"),
                   25, [&](const Mount& mount) {
                     asked.push_back(mount.mountPoint);
                     return true;
                   });
  EXPECT_THAT(asked, ElementsAre("/bound"));
}

TEST(MountTree, OnlyTheTopmostOfStackedMountsIsAVolume) {
  const auto mounts = ParseMountInfo(
      "25 1 8:1 / / rw - ext4 /dev/sda1 rw\n"
      "26 25 0:40 / /mnt rw - tmpfs none rw\n"
      "27 26 0:41 / /mnt rw - tmpfs none rw\n"
      "28 27 0:42 / /mnt rw - ext4 /dev/sdb1 rw\n");
  EXPECT_THAT(GroupIntoVolumes(mounts, RootIDOf(mounts), [](const Mount&) { return true; }),
              ElementsAre(ElementsAre(0), ElementsAre(3)));
}

TEST(MountTree, MountsUnderACoveredFolderAreHiddenWithIt) {
  EXPECT_THAT(PlacesIn("25 1 8:1 / / rw - ext4 /dev/sda1 rw\n"
                       "26 25 0:40 / /mnt/a/deep rw - tmpfs none rw\n"
                       "27 26 0:41 / /mnt/a/deep/er rw - tmpfs none rw\n"
                       "28 25 0:42 / /mnt/a rw - tmpfs none rw\n"
                       "29 28 0:43 / /mnt/a/new rw - tmpfs none rw\n"
                       "30 25 0:44 / /mnt/ab rw - tmpfs none rw\n"),
              ElementsAre("/", "/mnt/a", "/mnt/a/new", "/mnt/ab"));
}

TEST(MountTree, MountsOnACoveredMountAreHidden) {
  EXPECT_THAT(PlacesIn("25 1 8:1 / / rw - ext4 /dev/sda1 rw\n"
                       "26 25 0:40 / /mnt rw - tmpfs none rw\n"
                       "27 26 0:41 / /mnt/inner rw - tmpfs none rw\n"
                       "28 26 0:42 / /mnt rw - tmpfs none rw\n"),
              ElementsAre("/", "/mnt"));
}

TEST(MountTree, AMountOverTheRootIsUnreachable) {
  EXPECT_THAT(PlacesIn("25 1 8:1 / / rw - ext4 /dev/sda1 rw\n"
                       "26 25 0:40 / /mnt rw - tmpfs none rw\n"
                       "27 25 0:41 / / rw - tmpfs none rw\n"
                       "28 27 0:42 / /over rw - tmpfs none rw\n"
                       "29 25 0:43 / /under rw - tmpfs none rw\n"),
              ElementsAre("/", "/mnt", "/under"));
}

TEST(MountTree, TheLaterOfTwoMountsAtOnePlaceIsReached) {
  const auto mounts = ParseMountInfo(
      "25 1 8:1 / / rw - ext4 /dev/sda1 rw\n"
      "26 25 0:40 / /mnt rw - tmpfs none rw\n"
      "27 25 0:41 / /mnt rw - tmpfs none rw\n");
  EXPECT_THAT(GroupIntoVolumes(mounts, 25, [](const Mount&) { return true; }),
              ElementsAre(ElementsAre(0), ElementsAre(2)));
}

TEST(MountTree, NoFolderIsExaminedOnAServer) {
  std::vector<std::string> asked;
  const auto mounts = ParseMountInfo(
      "25 1 8:1 / / rw - ext4 /dev/sda1 rw\n"
      "26 25 0:40 / /dead rw - fuse.sshfs host: rw\n"
      "27 26 0:41 /inner /dead/local rw - tmpfs none rw\n"
      "28 25 0:42 /inner /bound rw - nfs4 host:/x rw\n"
      "29 25 0:43 /inner /near rw - tmpfs none rw\n");
  const auto volumes = GroupIntoVolumes(mounts, 25, [&](const Mount& mount) {
    asked.push_back(mount.mountPoint);
    return true;
  });
  EXPECT_THAT(volumes, SizeIs(5));
  EXPECT_THAT(asked, ElementsAre("/near"));
}

TEST(MountTree, AThousandEntriesKeepTheirOrder) {
  std::string table = "1 0 8:1 / / rw - ext4 /dev/a rw\n";
  std::vector<std::string> expected = {"/"};
  for (int i = 0; i < 1000; ++i) {
    const std::string place = "/mnt/" + std::to_string((i * 7919) % 1000);
    table += std::to_string(100 + i) + " 1 0:" + std::to_string(100 + i) + " / " + place +
             " rw - tmpfs none rw\n";
    expected.push_back(place);
  }
  EXPECT_EQ(PlacesIn(table), expected);
}

TEST(MountTree, AChainOfAThousandMountsHasAnEnd) {
  std::string table = "1 1 8:1 / / rw - ext4 /dev/a rw\n";
  std::string place;
  for (int i = 2; i < 1002; ++i) {
    place += "/d";
    table += std::to_string(i) + " " + std::to_string(i - 1) + " 0:" + std::to_string(i) + " / " +
             place + " rw - tmpfs none rw\n";
  }
  EXPECT_THAT(PlacesIn(table), SizeIs(1001));
}

TEST(MountTree, MountsThatAreEachOthersParentsHaveAnEnd) {
  EXPECT_THAT(PlacesIn("5 6 8:1 / / rw - ext4 /dev/a rw\n"
                       "6 5 8:2 / /mnt rw - ext4 /dev/b rw\n"),
              SizeIs(2));
}

}  // namespace
}  // namespace tallowmere::volumes
