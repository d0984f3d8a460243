// The mount table as a file, and the queries about the root folder that go with it.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <optional>
#include <string>

#include "kernel/MountTableFile.h"
#include "support/FileSystemImage.h"
#include "support/MountNamespace.h"
#include "support/Privileges.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::kernel {
namespace {

using test::HoldsInChild;
using test::ScopedMount;
using test::TemporaryFolder;

TEST(MountTableFile, IsReadWhole) {
  const TemporaryFolder folder;
  std::string text;
  while (text.size() < 100000) text += std::to_string(text.size()) + " a line of a long table\n";
  MountTableFile file(folder.MakeFile("table", text));
  EXPECT_EQ(*file.Read(), text);
  EXPECT_EQ(*file.Read(), text);
}

TEST(MountTableFile, ThatIsMissingIsAnError) {
  MountTableFile file("/nonexistent/mountinfo");
  EXPECT_EQ(file.Read().Error(), kNotThere);
  EXPECT_EQ(file.Read().Error(), kNotThere);
}

TEST(MountTableFile, ThatIsAFolderIsAnError) {
  const TemporaryFolder folder;
  MountTableFile file(folder.Path());
  EXPECT_EQ(file.Read().Error().number, EISDIR);
}

TEST(MountTableFile, SignalsEachChangeOnce) {
  if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  MountTableFile file;
  ASSERT_TRUE(file.Read());
  EXPECT_FALSE(file.HasChanged());
  {
    const ScopedMount mount("none", folder.MakeFolder("place"), "tmpfs");
    ASSERT_TRUE(mount.IsMounted());
    EXPECT_TRUE(file.HasChanged());
    EXPECT_FALSE(file.HasChanged());
    EXPECT_NE(file.Read()->find(folder.Path() / "place"), std::string::npos);
  }
  EXPECT_TRUE(file.HasChanged());
  EXPECT_EQ(file.Read()->find(folder.Path() / "place"), std::string::npos);
  EXPECT_FALSE(file.HasChanged());
}

TEST(TheRootsMount, IsInTheTable) {
  const RootMount root = ReadRootMount();
  EXPECT_GT(root.id, 0);
  struct stat about {};
  ASSERT_EQ(stat("/", &about), 0);
  EXPECT_EQ(root.device, about.st_dev);
  MountTableFile file;
  EXPECT_NE(("\n" + *file.Read()).find("\n" + std::to_string(root.id) + " "), std::string::npos);
}

TEST(AMountPoint, IsAFolderOrNot) {
  const TemporaryFolder folder;
  EXPECT_TRUE(IsFolderByMemory(folder.Path()));
  EXPECT_FALSE(IsFolderByMemory(folder.MakeFile("file")));
  EXPECT_FALSE(IsFolderByMemory(folder.Path() / "missing"));
}

// Returns whether a process with this root folder reads this label.
bool HasLabel(const std::string& root, const std::string& label) {
  return HoldsInChild([&] { return chroot(root.c_str()) == 0 && chdir("/") == 0; },
                      [&] {
                        const auto read = ReadRootLabel();
                        return read && *read == label;
                      });
}

TEST(TheRootsLabel, IsThatOfItsFileSystem) {
  if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  if (!test::KernelHas("ext4")) GTEST_SKIP() << "this kernel has no ext4";
  test::FileSystemImage image("ext4", {"mkfs.ext4", "-q", "-F", "-L", "My/Disk:1"}, 8 << 20);
  if (!image.IsMade() || !image.Mount()) GTEST_SKIP() << "an image cannot be mounted here";
  EXPECT_TRUE(HasLabel(image.Path(), "My/Disk:1"));
}

TEST(TheRootsLabel, IsEmptyWhereTheFileSystemHasNone) {
  if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  const ScopedMount root("none", folder.Path(), "tmpfs");
  ASSERT_TRUE(root.IsMounted());
  EXPECT_TRUE(HasLabel(folder.Path(), ""));
}

}  // namespace
}  // namespace tallowmere::kernel
