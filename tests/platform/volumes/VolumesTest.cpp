// Volumes as mount tables list them: recorded tables, and this machine's.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <linux/fs.h>
#include <sys/mount.h>
#include <sys/resource.h>
#include <unistd.h>

#include <cerrno>
#include <functional>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include "support/FileSystemImage.h"
#include "support/MountNamespace.h"
#include "support/Privileges.h"
#include "support/RefusedCalls.h"
#include "support/TemporaryFolder.h"
#include "volumes/Volumes.h"

namespace tallowmere::volumes {
namespace {

using test::TemporaryFolder;

// Returns the line of a file system of its own, mounted at "/" or below.
std::string Line(int id, const std::string& place) {
  const std::string number = std::to_string(id);
  const std::string parent = place == "/" ? " 1 " : " 27 ";
  return number + parent + "0:" + number + " / " + place + " rw - tmpfs none rw\n";
}

// A mount table with recorded text, which a test can replace.
class RecordedTable {
 public:
  explicit RecordedTable(const std::string& text, kernel::RootMount (*readRoot)() = RootInMount27)
      : mTable(kernel::MountTableFile(mFolder.MakeFile("mountinfo", text)), readRoot) {}

  const Volumes* operator->() { return mTable.Now().get(); }
  std::size_t Count() { return mTable.Now()->InOrder().size(); }
  const ListedVolume& At(std::size_t index) { return *mTable.Now()->InOrder().at(index); }
  VolumeNumber NumberAt(std::size_t index) { return At(index).Number(); }
  const std::string& PlaceAt(std::size_t index) { return At(index).MountPoint(); }
  std::string NameAt(std::size_t index) { return std::string(*At(index).Name()); }
  void Invalidate() { mTable.Invalidate(); }
  void Become(const std::string& text) {
    mFolder.MakeFile("mountinfo", text);
    mTable.Invalidate();
  }

 private:
  static kernel::RootMount RootInMount27() { return {27, 27}; }

  TemporaryFolder mFolder;
  VolumeTable mTable;
};

kernel::RootMount RootWithoutID() {
  return {0, 27};
}

TEST(TheTableOfVolumes, AVolumesNumberIsMinusTheMountIDOfItsPlace) {
  RecordedTable table(Line(27, "/") + Line(31, "/mnt/a") + Line(32768, "/mnt/b"));
  EXPECT_EQ(table.NumberAt(0), -27);
  EXPECT_EQ(table.NumberAt(1), -31);
  EXPECT_EQ(table.NumberAt(2), -32768);
}

TEST(TheTableOfVolumes, AMountIDBeyond16BitsGetsAFreeNegativeNumber) {
  RecordedTable table(Line(27, "/") + Line(70000, "/mnt/a") + Line(32768, "/mnt/b") +
                      Line(2147483647, "/mnt/c") + Line(32767, "/mnt/d"));
  std::set<VolumeNumber> numbers;
  for (std::size_t i = 0; i < 5; ++i) {
    EXPECT_LT(table.NumberAt(i), 0);
    numbers.insert(table.NumberAt(i));
    EXPECT_EQ(table->WithNumber(table.NumberAt(i))->MountPoint(), table.PlaceAt(i));
  }
  EXPECT_EQ(numbers.size(), 5u);
  EXPECT_EQ(table.NumberAt(2), -32768);
  EXPECT_EQ(table.NumberAt(4), -32767);
  const auto before = numbers;
  table.Invalidate();
  for (std::size_t i = 0; i < 5; ++i) numbers.insert(table.NumberAt(i));
  EXPECT_EQ(numbers, before);
}

TEST(TheTableOfVolumes, ANumberInUseIsNotGivenToALaterMountWithThatID) {
  const std::string before = Line(27, "/") + Line(70000, "/mnt/a");
  RecordedTable table(before);
  const VolumeNumber taken = table.NumberAt(1);
  table.Become(before + Line(-taken, "/mnt/b"));
  EXPECT_EQ(table.NumberAt(1), taken);
  EXPECT_NE(table.NumberAt(2), taken);
  EXPECT_EQ(table->WithNumber(taken)->MountPoint(), "/mnt/a");
}

TEST(TheTableOfVolumes, Number0IsTheVolumeOfTheRoot) {
  RecordedTable table(Line(31, "/mnt/a") + Line(27, "/"));
  EXPECT_EQ(table->WithNumber(0)->MountPoint(), "/");
}

TEST(TheTableOfVolumes, UnknownNumbersHaveNoVolume) {
  RecordedTable table(Line(27, "/") + Line(31, "/mnt/a"));
  EXPECT_EQ(table->WithNumber(-28), nullptr);
  EXPECT_EQ(table->WithNumber(27), nullptr);
  EXPECT_EQ(table->WithNumber(32767), nullptr);
  EXPECT_EQ(table.Count(), 2u);
}

TEST(TheTableOfVolumes, AVolumeIsNamedAfterTheLastComponentOfItsMountPoint) {
  RecordedTable table(Line(27, "/") + Line(31, "/media/user/My\\040Disk") + Line(32, "/mnt/a:b"));
  EXPECT_EQ(table.NameAt(1), "My Disk");
  EXPECT_EQ(table.NameAt(2), "a/b");
}

TEST(TheTableOfVolumes, NamesOf63BytesStayWholeAndLongerOnesBecomeShort) {
  const std::string longest(63, 'n');
  RecordedTable table(Line(27, "/") + Line(31, "/mnt/" + longest) + Line(32, "/mnt/n" + longest));
  EXPECT_EQ(table.NameAt(1), longest);
  EXPECT_EQ(table.NameAt(2), std::string(29, 'n') + "#2");
}

TEST(TheTableOfVolumes, AVolumeNameFindsTheFirstOfTwo) {
  RecordedTable table(Line(27, "/") + Line(31, "/mnt/x:y") + Line(32, "/media/x:y"));
  const auto named = table->WithName("x/y");
  ASSERT_TRUE(named);
  EXPECT_EQ((*named)->MountPoint(), "/mnt/x:y");
  EXPECT_EQ(table->WithName("x:y").Error(), kernel::kNoVolume);
}

TEST(TheTableOfVolumes, ARootThatIsNoMountPointIsStillTheFirstVolume) {
  RecordedTable table(Line(31, "/mnt/a"));
  EXPECT_EQ(table.PlaceAt(0), "/");
  EXPECT_EQ(table.NumberAt(0), -27);
  EXPECT_EQ(table.PlaceAt(1), "/mnt/a");
}

TEST(TheTableOfVolumes, WithoutMountIDsTheLowestMountAtTheRootIsTheRoot) {
  const std::string text = Line(27, "/") + "40 27 0:40 / / rw - tmpfs none rw\n" + Line(41, "/mnt");
  RecordedTable table(text, RootWithoutID);
  ASSERT_EQ(table.Count(), 2u);
  EXPECT_EQ(table.NumberAt(0), -27);
  EXPECT_EQ(table.NumberAt(1), -41);
}

TEST(TheTableOfVolumes, WithoutMountIDsAMountCanBeItsOwnParent) {
  RecordedTable table(Line(41, "/mnt") + "27 27 0:27 / / rw - rootfs none rw\n", RootWithoutID);
  EXPECT_EQ(table.NumberAt(0), -27);
}

TEST(TheTableOfVolumes, WithoutMountIDsAndARootInTheTableThereIsARoot) {
  RecordedTable table(Line(41, "/mnt"), RootWithoutID);
  EXPECT_EQ(table.PlaceAt(0), "/");
  EXPECT_EQ(table.PlaceAt(1), "/mnt");
}

TEST(TheTableOfVolumes, AnInnerFolderMountedOutOfSightIsNoVolume) {
  RecordedTable table(Line(27, "/") + "31 27 0:31 /inner /nonexistent/place rw - tmpfs none rw\n");
  EXPECT_EQ(table.Count(), 1u);
}

TEST(TheTableOfVolumes, WithoutATableThereIsTheVolumeThatTheRootIsOn) {
  VolumeTable table(kernel::MountTableFile("/nonexistent/mountinfo"), [] {
    return kernel::RootMount{27, 27};
  });
  ASSERT_EQ(table.Now()->InOrder().size(), 1u);
  EXPECT_EQ(table.Now()->InOrder()[0]->MountPoint(), "/");
  EXPECT_EQ(table.Now()->InOrder()[0]->Number(), -27);
}

TEST(TheTableOfVolumes, WithNeitherTableNorMountIDTheRootStillHasANumber) {
  VolumeTable table(kernel::MountTableFile("/nonexistent/mountinfo"),
                    [] { return kernel::RootMount{}; });
  const VolumeNumber number = table.Now()->InOrder().at(0)->Number();
  EXPECT_LT(number, 0);
  EXPECT_EQ(table.Now()->InOrder().at(0)->Number(), number);
}

TEST(TheTableOfVolumes, AnUnreadableTableCountsAsNone) {
  const TemporaryFolder folder;
  VolumeTable table(
      kernel::MountTableFile(folder.Path()));  // opening a folder works, reading fails
  ASSERT_EQ(table.Now()->InOrder().size(), 1u);
  EXPECT_EQ(table.Now()->InOrder()[0]->MountPoint(), "/");
}

TEST(TheTableOfVolumes, AnItemWithAnUnknownMountIsOnTheVolumeOfItsDevice) {
  VolumeTable table;
  auto root = kernel::ReadItem(kernel::AtPath("/"));
  ASSERT_TRUE(root);
  root->mount = kernel::kNoMount;
  EXPECT_EQ(table.Now()->OfItem(*root, "/nonexistent"), table.Now()->WithNumber(0));
}

TEST(TheTableOfVolumes, AnItemWithAnUnknownMountAndDeviceIsOnTheVolumeOfItsPath) {
  RecordedTable table(Line(27, "/") + Line(31, "/mnt/a") +
                      "32 31 0:32 / /mnt/a/b rw - tmpfs none rw\n");
  kernel::Item item{};
  item.mount = kernel::kNoMount;
  EXPECT_EQ(table->OfItem(item, "/mnt/a/b/file")->MountPoint(), "/mnt/a/b");
  EXPECT_EQ(table->OfItem(item, "/mnt/a/bc")->MountPoint(), "/mnt/a");
  EXPECT_EQ(table->OfItem(item, "/mnt")->MountPoint(), "/");
}

TEST(TheTableOfVolumes, AMountWithoutAFreeNumberIsNoVolume) {
  constexpr int kNumbers = 32768;
  std::string text = Line(27, "/");
  for (int id = 1; id <= kNumbers; ++id) {
    if (id != 27) text += Line(id, "/mnt/" + std::to_string(id));
  }
  RecordedTable table(text + Line(kNumbers + 1, "/mnt/late"));
  EXPECT_EQ(table->OfPath("/mnt/32768")->Number(), -32768);
  EXPECT_EQ(table->OfPath("/mnt/late"), table->WithNumber(0));
}

TEST(TheTableOfVolumes, AMountBelongsToItsVolumeAndAKernelInterfaceToNone) {
  RecordedTable table(Line(27, "/") + Line(31, "/mnt/a") +
                      "32 27 0:31 /inner /mnt/b rw - tmpfs none rw\n"
                      "33 27 0:33 / /proc rw - proc none rw\n");
  EXPECT_EQ(table->WithMount(31)->MountPoint(), "/mnt/a");
  EXPECT_EQ(table->WithMount(32), table->WithMount(31));
  EXPECT_EQ(table->WithMount(33), nullptr);
  EXPECT_EQ(table->WithMount(34), nullptr);
  EXPECT_TRUE(table->IsMountPoint("/proc"));
  EXPECT_TRUE(table->HoldsMountPoint("/mnt"));
  EXPECT_FALSE(table->HoldsMountPoint("/mnt/a"));
}

TEST(TheTableOfVolumes, AVolumeKnowsEveryPlaceOfAnItem) {
  RecordedTable table(Line(27, "/") + Line(31, "/mnt/a") +
                      "32 27 0:31 /inner /mnt/b rw - nfs none rw\n");
  const auto volume = table->WithMount(31);
  using testing::ElementsAre;
  EXPECT_THAT(volume->PathsOf("/mnt/a/inner/x", 31), ElementsAre("/mnt/a/inner/x", "/mnt/b/x"));
  EXPECT_THAT(volume->PathsOf("/mnt/b/x", 32), ElementsAre("/mnt/a/inner/x", "/mnt/b/x"));
  EXPECT_THAT(volume->PathsOf("/mnt/b", 32), ElementsAre("/mnt/a/inner", "/mnt/b"));
  EXPECT_THAT(volume->PathsOf("/mnt/a/outer", 31), ElementsAre("/mnt/a/outer"));
  EXPECT_THAT(volume->PathsOf("/mnt/b/x", 27), ElementsAre("/mnt/b/x"));
}

TEST(TheTableOfVolumes, IsRereadOnlyWhenSomethingWasMounted) {
  if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  VolumeTable table;
  EXPECT_EQ(table.AsLastRead(), nullptr);
  const VolumesPointer before = table.Now();
  EXPECT_EQ(table.Now(), before);
  const std::string place = folder.MakeFolder("new");
  const test::ScopedMount appearing("none", place, "tmpfs");
  ASSERT_TRUE(appearing.IsMounted());
  EXPECT_EQ(table.AsLastRead(), before);
  const VolumesPointer after = table.Now();
  ASSERT_EQ(after->InOrder().size(), before->InOrder().size() + 1);
  EXPECT_EQ(after->InOrder().back()->MountPoint(), place);
  // Holders of the former state still have it whole.
  EXPECT_EQ(before->OfPath(place)->MountPoint(),
            after->OfPath(folder.Path().string())->MountPoint());
}

TEST(AVolume, IsShownWhereAFolderOfItIsMountedAndNotWhereAFileIs) {
  if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  const std::string place = folder.MakeFolder("place");
  const test::ScopedMount mount("none", place, "tmpfs");
  ASSERT_TRUE(mount.IsMounted());
  const test::ScopedMount ofFile(folder.MakeFile("place/file"), folder.MakeFile("file"), "",
                                 MS_BIND);
  ASSERT_TRUE(ofFile.IsMounted());
  VolumeTable table;
  const auto volume = table.Now()->OfPath(place);
  EXPECT_THAT(volume->MountPoints(), testing::ElementsAre(place));
  const std::string again = folder.MakeFolder("again");
  const test::ScopedMount ofFolder(folder.MakeFolder("place/folder"), again, "", MS_BIND);
  ASSERT_TRUE(ofFolder.IsMounted());
  EXPECT_THAT(table.Now()->OfPath(place)->MountPoints(), testing::ElementsAre(place, again));
}

// --- The name of the volume of "/" --------------------------------------------------------------

// Checks the volume's name in a child process whose root folder is `folder`.
bool RootIsCalled(
    const std::string& name, const std::string& folder,
    const std::function<bool()>& prepare = [] { return true; }) {
  const auto enter = [&] { return chroot(folder.c_str()) == 0 && chdir("/") == 0 && prepare(); };
  return test::HoldsInChild(enter, [&] {
    VolumeTable table;
    const auto own = table.Now()->InOrder().at(0)->Name();
    return own && *own == name;
  });
}

class TheLabelOfTheRoot : public testing::Test {
 protected:
  void SetUp() override {
    if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    if (!test::KernelHas("ext4")) GTEST_SKIP() << "this kernel has no ext4";
    mImage.emplace("ext4", std::vector<std::string>{"mkfs.ext4", "-q", "-F", "-L", "My/Disk:1"},
                   8 << 20);
    if (!mImage->IsMade() || !mImage->Mount()) GTEST_SKIP() << "an image cannot be mounted here";
  }
  std::string Root() const { return mImage->Path(); }

  std::optional<test::FileSystemImage> mImage;
};

TEST_F(TheLabelOfTheRoot, IsTheNameOfItsVolume) {
  EXPECT_TRUE(RootIsCalled("My/Disk/1", Root()));
}

TEST_F(TheLabelOfTheRoot, ThatCannotBeReadLeavesTheNameRoot) {
  for (const int error : {EPERM, EACCES, EIO}) {
    EXPECT_TRUE(RootIsCalled("Root", Root(), [error] {
      return test::RefuseIoctl(FS_IOC_GETFSLABEL, error);
    })) << error;
  }
}

TEST_F(TheLabelOfTheRoot, UnsupportedByTheKernelLeavesTheNameRoot) {
  for (const int error : {ENOTTY, EOPNOTSUPP, EINVAL, ENOSYS}) {
    EXPECT_TRUE(RootIsCalled("Root", Root(), [error] {
      return test::RefuseIoctl(FS_IOC_GETFSLABEL, error);
    })) << error;
  }
}

TEST_F(TheLabelOfTheRoot, UnreadableWithoutDescriptorsIsNoName) {
  EXPECT_TRUE(test::HoldsInChild([&] { return chroot(Root().c_str()) == 0 && chdir("/") == 0; },
                                 [] {
                                   VolumeTable table;
                                   const auto volume = table.Now()->InOrder().at(0);
                                   rlimit before{};
                                   getrlimit(RLIMIT_NOFILE, &before);
                                   const rlimit none{0, before.rlim_max};
                                   setrlimit(RLIMIT_NOFILE, &none);
                                   const bool isNone = volume->Name().Error().number == EMFILE;
                                   setrlimit(RLIMIT_NOFILE, &before);
                                   return isNone && *volume->Name() == "My/Disk/1";
                                 }));
}

// On a tmpfs as the root folder.
TEST(AFileSystemWithoutLabels, IsCalledRootAtTheRoot) {
  if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  const test::ScopedMount root("none", folder.Path().string(), "tmpfs");
  ASSERT_TRUE(root.IsMounted());
  EXPECT_TRUE(RootIsCalled("Root", folder.Path()));
}

}  // namespace
}  // namespace tallowmere::volumes
