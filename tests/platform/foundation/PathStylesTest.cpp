// Conversion between Linux paths and HFS and Windows paths.
#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <filesystem>

#include "TestGenerators.h"
#include "TestVolumes.h"
#include "foundation/PathStyles.h"

namespace tallowmere::foundation {
namespace {

// --- HFS to Linux -----------------------------------------------------------------------------

TEST(HfsPath, BeginsWithTheNameOfAVolume) {
  EXPECT_EQ(LinuxPathOfHfsPath("Data:Dir:item"), "/mnt/data/Dir/item");
  EXPECT_EQ(LinuxPathOfHfsPath("Root:etc"), "/etc");
  EXPECT_EQ(LinuxPathOfHfsPath("Data:"), "/mnt/data");
  EXPECT_EQ(LinuxPathOfHfsPath("Data"), "/mnt/data");
  EXPECT_EQ(LinuxPathOfHfsPath("Root:"), "/");
}

TEST(HfsPath, NameOfTheVolumeIsInHfsForm) {
  EXPECT_EQ(LinuxPathOfHfsPath("Data/2:a"), "/mnt/Data:2/a");
}

TEST(HfsPath, OnAVolumeThatIsNotMountedIsNone) {
  EXPECT_EQ(LinuxPathOfHfsPath("data:a"), std::nullopt);
  EXPECT_EQ(LinuxPathOfHfsPath("a"), std::nullopt);
  EXPECT_EQ(LinuxPathOfHfsPath(""), std::nullopt);
}

TEST(HfsPath, ColonsAndSlashesAreExchangedInEachComponent) {
  EXPECT_EQ(LinuxPathOfHfsPath("Data:a/b:c/:/"), "/mnt/data/a:b/c:/:");
}

TEST(HfsPath, ColonAtTheEndNamesTheSameItem) {
  EXPECT_EQ(LinuxPathOfHfsPath("Data:a:"), "/mnt/data/a");
  EXPECT_EQ(LinuxPathOfHfsPath(":a:"), "a");
}

TEST(HfsPath, LeadingColonMakesItRelative) {
  EXPECT_EQ(LinuxPathOfHfsPath(":a:b"), "a/b");
  EXPECT_EQ(LinuxPathOfHfsPath(":"), ".");
}

TEST(HfsPath, EachFurtherColonClimbs) {
  EXPECT_EQ(LinuxPathOfHfsPath("Data:a::b"), "/mnt/data/a/../b");
  EXPECT_EQ(LinuxPathOfHfsPath("Data:a:b:::c"), "/mnt/data/a/b/../../c");
  EXPECT_EQ(LinuxPathOfHfsPath("::a"), "../a");
  EXPECT_EQ(LinuxPathOfHfsPath(":::"), "../..");
}

TEST(HfsPath, DoesNotClimbOutOfItsVolume) {
  EXPECT_EQ(LinuxPathOfHfsPath("Data::a"), std::nullopt);
  EXPECT_EQ(LinuxPathOfHfsPath("Data:a:::b"), std::nullopt);
  EXPECT_EQ(LinuxPathOfHfsPath("Data::"), std::nullopt);
}

TEST(HfsPath, DotsAreNoNames) {
  EXPECT_EQ(LinuxPathOfHfsPath("Data:..:a"), std::nullopt);
  EXPECT_EQ(LinuxPathOfHfsPath(":.:a"), std::nullopt);
}

// --- Linux to HFS -----------------------------------------------------------------------------

TEST(HfsPath, OfALinuxPathBeginsWithTheDeepestVolume) {
  EXPECT_EQ(HfsPathOfLinuxPath("/mnt/data/Dir/a:b", false), "Data:Dir:a/b");
  EXPECT_EQ(HfsPathOfLinuxPath("/mnt/data2", false), "Root:mnt:data2");
  EXPECT_EQ(HfsPathOfLinuxPath("/mnt/Data:2/a", false), "Data/2:a");
}

TEST(HfsPath, OfAFolderEndsInAColon) {
  EXPECT_EQ(HfsPathOfLinuxPath("/mnt/data/Dir", true), "Data:Dir:");
  EXPECT_EQ(HfsPathOfLinuxPath("a", true), ":a:");
}

TEST(HfsPath, OfAVolumesRootAlwaysEndsInAColon) {
  EXPECT_EQ(HfsPathOfLinuxPath("/mnt/data", false), "Data:");
  EXPECT_EQ(HfsPathOfLinuxPath("/", false), "Root:");
}

TEST(HfsPath, OfARelativePathBeginsWithAColon) {
  EXPECT_EQ(HfsPathOfLinuxPath("a/b", false), ":a:b");
  EXPECT_EQ(HfsPathOfLinuxPath("../a", false), "::a");
  EXPECT_EQ(HfsPathOfLinuxPath("..", true), "::");
  EXPECT_EQ(HfsPathOfLinuxPath(".", true), ":");
  EXPECT_EQ(HfsPathOfLinuxPath("./a", false), ":a");
}

TEST(HfsPath, ClimbsWithAFurtherColon) {
  EXPECT_EQ(HfsPathOfLinuxPath("/mnt/data/a/../b", false), "Data:a::b");
  EXPECT_EQ(HfsPathOfLinuxPath("/mnt/data/../b", false), std::nullopt);
}

TEST(HfsPath, IgnoresDoubledSlashesAndDots) {
  EXPECT_EQ(HfsPathOfLinuxPath("//mnt/./data//a/.", true), "Data:a:");
}

TEST(HfsPath, WithoutVolumesIsNone) {
  test::SetVolumesAreMounted(false);
  const auto hfs = HfsPathOfLinuxPath("/a", false);
  const auto relative = HfsPathOfLinuxPath("a", false);
  test::SetVolumesAreMounted(true);
  EXPECT_EQ(hfs, std::nullopt);
  EXPECT_EQ(relative, ":a");
}

// Returns the path without doubled slashes, dots and a trailing slash.
std::string Normal(const std::string& path) {
  std::string normal = std::filesystem::path(path).lexically_normal().native();
  while (normal.size() > 1 && normal.ends_with('/')) normal.pop_back();
  return normal;
}

RC_GTEST_PROP(HfsPath, LeadsBackToTheSamePlace, (bool folder)) {
  const std::string path =
      *rc::gen::element<std::string>("", "/", "/mnt/data", "/mnt/data/") + *test::AnyPath();
  RC_PRE(!path.empty());
  const auto hfs = HfsPathOfLinuxPath(path, folder);
  RC_PRE(hfs.has_value());
  const auto back = LinuxPathOfHfsPath(*hfs);
  RC_ASSERT(back.has_value());
  RC_ASSERT(Normal(*back) == Normal(path));
  RC_ASSERT(HfsPathOfLinuxPath(*back, folder) == hfs);
}

// --- Windows ----------------------------------------------------------------------------------

TEST(WindowsPath, HasBackslashesForSlashes) {
  EXPECT_EQ(LinuxPathOfWindowsPath("\\a\\b"), "/a/b");
  EXPECT_EQ(LinuxPathOfWindowsPath("a\\b"), "a/b");
  EXPECT_EQ(WindowsPathOfLinuxPath("/a/b"), "\\a\\b");
  EXPECT_EQ(WindowsPathOfLinuxPath("a/b"), "a\\b");
}

TEST(WindowsPath, BeginsWithADrive) {
  EXPECT_EQ(LinuxPathOfWindowsPath("C:\\a\\b"), "/C:/a/b");
  EXPECT_EQ(LinuxPathOfWindowsPath("c:"), "/c:");
  EXPECT_EQ(WindowsPathOfLinuxPath("/C:/a/b"), "C:\\a\\b");
  EXPECT_EQ(WindowsPathOfLinuxPath("/C:"), "C:");
}

TEST(WindowsPath, DriveIsOneLetterAndItsColon) {
  EXPECT_EQ(LinuxPathOfWindowsPath("1:\\a"), "1:/a");
  EXPECT_EQ(LinuxPathOfWindowsPath("CD:\\a"), "CD:/a");
  EXPECT_EQ(LinuxPathOfWindowsPath("C:a"), "C:a");
  EXPECT_EQ(WindowsPathOfLinuxPath("/C:a"), "\\C:a");
}

TEST(WindowsPath, ThatWouldReadAsAnotherPathIsNone) {
  EXPECT_EQ(WindowsPathOfLinuxPath("/a\\b"), std::nullopt);
  EXPECT_EQ(WindowsPathOfLinuxPath("C:/a"), std::nullopt);
}

RC_GTEST_PROP(WindowsPath, LeadsBackToTheSamePath, ()) {
  const std::string path = *test::AnyPath();
  const auto windows = WindowsPathOfLinuxPath(path);
  if (windows) RC_ASSERT(LinuxPathOfWindowsPath(*windows) == path);
  RC_ASSERT(windows.has_value() || path.find('\\') != path.npos || path.find(':') == 1);
}

}  // namespace
}  // namespace tallowmere::foundation
