#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <optional>
#include <set>

#include "files/MountTable.h"
#include "support/FileSystemImage.h"
#include "support/MountNamespace.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::files {
namespace {

using test::TemporaryFolder;

// A file system of its own, mounted at the top or somewhere below.
std::string Line(int id, const std::string& place) {
  const std::string number = std::to_string(id);
  const std::string parent = place == "/" ? " 1 " : " 27 ";
  return number + parent + "0:" + number + " / " + place + " rw - tmpfs none rw\n";
}

// A table of a recorded text, which changes when it is told to.
class RecordedTable {
 public:
  explicit RecordedTable(const std::string& text)
      : mTable(mFolder.MakeFile("mountinfo", text).string(),
               [] { return Mount{27, 1, 27, "/", "/", "tmpfs"}; }) {}

  MountTable* operator->() { return &mTable; }
  VolumeNumber NumberAt(std::size_t index) { return mTable.AtIndex(index)->Number(); }
  void Become(const std::string& text) {
    mFolder.MakeFile("mountinfo", text);
    mTable.Distrust();
  }

 private:
  TemporaryFolder mFolder;
  MountTable mTable;
};

TEST(MountTable, AVolumesNumberIsMinusTheMountIDOfItsPlace) {
  RecordedTable table(Line(27, "/") + Line(31, "/mnt/a") + Line(32768, "/mnt/b"));
  EXPECT_EQ(table.NumberAt(0), -27);
  EXPECT_EQ(table.NumberAt(1), -31);
  EXPECT_EQ(table.NumberAt(2), -32768);
}

TEST(MountTable, AMountIDBeyond16BitsGetsAFreeNegativeNumber) {
  RecordedTable table(Line(27, "/") + Line(70000, "/mnt/a") + Line(32768, "/mnt/b") +
                      Line(2147483647, "/mnt/c") + Line(32767, "/mnt/d"));
  std::set<VolumeNumber> numbers;
  for (std::size_t i = 0; i < 5; ++i) {
    EXPECT_LT(table.NumberAt(i), 0);
    numbers.insert(table.NumberAt(i));
    EXPECT_EQ(table->WithNumber(table.NumberAt(i))->MountPoint(), table->AtIndex(i)->MountPoint());
  }
  EXPECT_EQ(numbers.size(), 5u);
  EXPECT_EQ(table.NumberAt(2), -32768);
  EXPECT_EQ(table.NumberAt(4), -32767);
  const auto before = numbers;
  table->Distrust();
  for (std::size_t i = 0; i < 5; ++i) numbers.insert(table.NumberAt(i));
  EXPECT_EQ(numbers, before);
}

TEST(MountTable, ANumberThatIsTakenIsNotThatOfALaterMountWithThatID) {
  const std::string before = Line(27, "/") + Line(70000, "/mnt/a");
  RecordedTable table(before);
  const VolumeNumber taken = table.NumberAt(1);
  table.Become(before + Line(-taken, "/mnt/b"));
  EXPECT_EQ(table.NumberAt(1), taken);
  EXPECT_NE(table.NumberAt(2), taken);
  EXPECT_EQ(table->WithNumber(taken)->MountPoint(), "/mnt/a");
}

TEST(MountTable, Number0IsTheVolumeOfTheRoot) {
  RecordedTable table(Line(31, "/mnt/a") + Line(27, "/"));
  EXPECT_EQ(table->WithNumber(0)->MountPoint(), "/");
}

TEST(MountTable, UnknownNumbersAndIndexesPastTheLastHaveNoVolume) {
  RecordedTable table(Line(27, "/") + Line(31, "/mnt/a"));
  EXPECT_EQ(table->WithNumber(-28), nullptr);
  EXPECT_EQ(table->WithNumber(27), nullptr);
  EXPECT_EQ(table->WithNumber(32767), nullptr);
  EXPECT_NE(table->AtIndex(1), nullptr);
  EXPECT_EQ(table->AtIndex(2), nullptr);
  EXPECT_EQ(table->AtIndex(1000), nullptr);
}

TEST(MountTable, AVolumeIsCalledAsTheLastComponentOfItsMountPoint) {
  RecordedTable table(Line(27, "/") + Line(31, "/media/user/My\\040Disk") + Line(32, "/mnt/a:b"));
  EXPECT_EQ(table->AtIndex(1)->Name(), "My Disk");
  EXPECT_EQ(table->AtIndex(2)->Name(), "a/b");
}

TEST(MountTable, NamesOf63BytesStayWholeAndLongerOnesBecomeShort) {
  const std::string longest(63, 'n');
  RecordedTable table(Line(27, "/") + Line(31, "/mnt/" + longest) + Line(32, "/mnt/n" + longest));
  EXPECT_EQ(table->AtIndex(1)->Name(), longest);
  EXPECT_EQ(table->AtIndex(2)->Name(), std::string(29, 'n') + "#2");
}

TEST(MountTable, TheRootVolumeHasAName) {
  MountTable table;
  const std::string& name = table.AtIndex(0)->Name();
  EXPECT_FALSE(name.empty());
  EXPECT_LE(name.size(), 63u);
  EXPECT_EQ(name.find(':'), std::string::npos);
}

// In a process whose "/" is that of an image.
TEST(MountTable, TheRootVolumeIsCalledAsItsFileSystemIsLabelled) {
  if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  if (!test::KernelHas("ext4")) GTEST_SKIP() << "this kernel has no ext4";
  test::FileSystemImage image("ext4", {"mkfs.ext4", "-q", "-F", "-L", "My/Disk:1"}, 8 << 20);
  if (!image.IsMade() || !image.Mount()) GTEST_SKIP() << "an image cannot be mounted here";
  const pid_t child = fork();
  if (child == 0) {
    if (chroot(image.Path().c_str()) != 0 || chdir("/") != 0) _exit(2);
    MountTable table;
    _exit(table.AtIndex(0)->Name() == "My/Disk/1" ? 0 : 1);
  }
  int status = 0;
  ASSERT_EQ(waitpid(child, &status, 0), child);
  EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << status;
}

// The same with memory for a root.
TEST(MountTable, TheRootVolumeOfAFileSystemWithoutLabelsIsCalledRoot) {
  if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  const test::ScopedMount root("none", folder.Path().string(), "tmpfs");
  ASSERT_TRUE(root.IsMounted());
  const pid_t child = fork();
  if (child == 0) {
    if (chroot(folder.Path().c_str()) != 0 || chdir("/") != 0) _exit(2);
    MountTable table;
    _exit(table.AtIndex(0)->Name() == "Root" ? 0 : 1);
  }
  int status = 0;
  ASSERT_EQ(waitpid(child, &status, 0), child);
  EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << status;
}

TEST(MountTable, ARootThatIsNoMountPointIsStillTheFirstVolume) {
  RecordedTable table(Line(31, "/mnt/a"));
  EXPECT_EQ(table->AtIndex(0)->MountPoint(), "/");
  EXPECT_EQ(table.NumberAt(0), -27);
  EXPECT_EQ(table->AtIndex(1)->MountPoint(), "/mnt/a");
}

TEST(MountTable, WhereTheKernelTellsNoMountIDsTheLowestMountAtTheRootIsTheRoot) {
  const TemporaryFolder folder;
  const std::string text = Line(27, "/") + "40 27 0:40 / / rw - tmpfs none rw\n" + Line(41, "/mnt");
  MountTable table(folder.MakeFile("mountinfo", text).string(),
                   [] { return Mount{0, 0, 27, "", "/", ""}; });
  EXPECT_EQ(table.AtIndex(0)->Number(), -27);
  EXPECT_EQ(table.AtIndex(1)->Number(), -41);
  EXPECT_EQ(table.AtIndex(2), nullptr);
}

TEST(MountTable, WhereTheKernelTellsNoMountIDsAMountCanBeItsOwnParent) {
  const TemporaryFolder folder;
  const std::string text = Line(41, "/mnt") + "27 27 0:27 / / rw - rootfs none rw\n";
  MountTable table(folder.MakeFile("mountinfo", text).string(),
                   [] { return Mount{0, 0, 27, "", "/", ""}; });
  EXPECT_EQ(table.AtIndex(0)->Number(), -27);
}

TEST(MountTable, WhereTheKernelTellsNoMountIDsAndTheTableHasNoRootThereIsOneStill) {
  const TemporaryFolder folder;
  MountTable table(folder.MakeFile("mountinfo", Line(41, "/mnt")).string(),
                   [] { return Mount{0, 0, 27, "", "/", ""}; });
  EXPECT_EQ(table.AtIndex(0)->MountPoint(), "/");
  EXPECT_EQ(table.AtIndex(1)->MountPoint(), "/mnt");
}

TEST(MountTable, AnInnerFolderMountedWhereNothingCanBeSeenIsNoVolume) {
  RecordedTable table(Line(27, "/") + "31 27 0:31 /inner /nonexistent/place rw - tmpfs none rw\n");
  EXPECT_EQ(table->AtIndex(1), nullptr);
}

TEST(MountTable, WithoutATableThereIsTheVolumeThatTheRootIsOn) {
  MountTable table("/nonexistent/mountinfo", [] { return Mount{27, 0, 27, "", "/", ""}; });
  ASSERT_NE(table.AtIndex(0), nullptr);
  EXPECT_EQ(table.AtIndex(0)->MountPoint(), "/");
  EXPECT_EQ(table.AtIndex(0)->Number(), -27);
  EXPECT_EQ(table.AtIndex(1), nullptr);
}

TEST(MountTable, WithNeitherTableNorMountIDTheRootStillHasANumber) {
  MountTable table("/nonexistent/mountinfo", [] { return Mount{0, 0, 0, "", "/", ""}; });
  const VolumeNumber number = table.AtIndex(0)->Number();
  EXPECT_LT(number, 0);
  EXPECT_EQ(table.AtIndex(0)->Number(), number);
}

TEST(MountTable, ATableThatCannotBeReadIsAsGoodAsNone) {
  const TemporaryFolder folder;
  MountTable table(folder.Path().string());  // a folder opens, but has no text
  EXPECT_EQ(table.AtIndex(0)->MountPoint(), "/");
  EXPECT_EQ(table.AtIndex(1), nullptr);
}

TEST(MountTable, AnItemWhoseMountIsNotToldIsOnTheVolumeOfItsDevice) {
  MountTable table;
  auto root = ReadItem(AT_FDCWD, "/");
  ASSERT_TRUE(root);
  root->mount = kNoMount;
  EXPECT_EQ(table.OfItem(*root, "/nonexistent"), table.WithNumber(0));
}

TEST(MountTable, AnItemWithNeitherMountNorDeviceOfTheTableIsOnTheVolumeThatItsPathIsWithin) {
  RecordedTable table(Line(27, "/") + Line(31, "/mnt/a") +
                      "32 31 0:32 / /mnt/a/b rw - tmpfs none rw\n");
  ItemReference item{};
  item.mount = kNoMount;
  EXPECT_EQ(table->OfItem(item, "/mnt/a/b/file"), table->AtIndex(2));
  EXPECT_EQ(table->OfItem(item, "/mnt/a/bc"), table->AtIndex(1));
  EXPECT_EQ(table->OfItem(item, "/mnt"), table->AtIndex(0));
}

TEST(MountTable, AMountForWhichNoNumberIsLeftIsNoVolume) {
  constexpr int kNumbers = 32768;
  std::string text = Line(27, "/");
  for (int id = 1; id <= kNumbers; ++id) {
    if (id != 27) text += Line(id, "/mnt/" + std::to_string(id));
  }
  RecordedTable table(text + Line(kNumbers + 1, "/mnt/late"));
  EXPECT_EQ(table->OfPath("/mnt/32768")->Number(), -32768);
  EXPECT_EQ(table->OfPath("/mnt/late"), table->WithNumber(0));
}

TEST(MountTable, AWalkSeesOneStateWhileVolumesComeAndGo) {
  if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  MountTable table;
  std::vector<std::string> before;
  for (std::size_t i = 0; const VolumePointer volume = table.AtIndex(i); ++i) {
    before.push_back(volume->MountPoint());
  }

  std::optional<test::ScopedMount> appearing;
  std::vector<std::string> during;
  for (std::size_t i = 0; const VolumePointer volume = table.AtIndex(i); ++i) {
    during.push_back(volume->MountPoint());
    if (!appearing) appearing.emplace("none", folder.MakeFolder("new").string(), "tmpfs");
  }
  ASSERT_TRUE(appearing->IsMounted());
  EXPECT_EQ(during, before);

  std::vector<std::string> after;
  for (std::size_t i = 0; const VolumePointer volume = table.AtIndex(i); ++i) {
    after.push_back(volume->MountPoint());
  }
  before.push_back((folder.Path() / "new").string());
  EXPECT_EQ(after, before);
}

TEST(MountTable, AnIndexThatContinuesNoWalkSeesTheVolumesOfNow) {
  if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  MountTable table;
  std::size_t count = 0;
  while (table.AtIndex(count) != nullptr) ++count;
  const test::ScopedMount appearing("none", folder.MakeFolder("new").string(), "tmpfs");
  ASSERT_TRUE(appearing.IsMounted());
  EXPECT_NE(table.AtIndex(count), nullptr);
}

}  // namespace
}  // namespace tallowmere::files
