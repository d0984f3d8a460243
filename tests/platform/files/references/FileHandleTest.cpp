#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <cstring>

#include "files/FileHandle.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::files {
namespace {

using test::TemporaryFolder;

// A handle of an inode number and a generation, as the kernel's commonest kind has them.
FileHandle MakeHandle(std::uint32_t inode, std::uint32_t generation) {
  FileHandle handle{1, 8, {}};
  std::memcpy(handle.bytes.data(), &inode, sizeof inode);
  std::memcpy(handle.bytes.data() + sizeof inode, &generation, sizeof generation);
  return handle;
}

ino_t InodeOf(const std::filesystem::path& path) {
  struct stat about = {};
  EXPECT_EQ(lstat(path.c_str(), &about), 0);
  return about.st_ino;
}

TEST(FileHandle, IsNoneForAMissingItem) {
  const TemporaryFolder folder;
  EXPECT_EQ(ReadHandle(AT_FDCWD, (folder.Path() / "x").c_str()), FileHandle{});
}

TEST(FileHandle, TellsAnItemFromTheOneThatTakesItsPlaceAndNumber) {
  const TemporaryFolder folder;
  const auto first = ReadHandle(AT_FDCWD, folder.MakeFile("x").c_str());
  if (first.size == 0) GTEST_SKIP() << "no file handles here";
  EXPECT_EQ(ReadHandle(AT_FDCWD, (folder.Path() / "x").c_str()), first);
  std::filesystem::remove(folder.Path() / "x");
  EXPECT_NE(ReadHandle(AT_FDCWD, folder.MakeFile("x").c_str()), first);
}

TEST(FileHandle, OfAnInodeTakesItsShapeFromASibling) {
  EXPECT_EQ(HandleOfInode(MakeHandle(2, 77), 2, 4711), MakeHandle(4711, 0));
}

TEST(FileHandle, OfAnInodeIsNotMadeFromAHandleOfAnotherShape) {
  FileHandle otherType = MakeHandle(2, 0);
  otherType.type = 2;
  FileHandle longer = MakeHandle(2, 0);
  longer.size = 12;
  EXPECT_EQ(HandleOfInode(otherType, 2, 4711), std::nullopt);
  EXPECT_EQ(HandleOfInode(longer, 2, 4711), std::nullopt);
  EXPECT_EQ(HandleOfInode(MakeHandle(3, 0), 2, 4711), std::nullopt);
  EXPECT_EQ(HandleOfInode(FileHandle{}, 0, 4711), std::nullopt);
}

TEST(FileHandle, OfAnInodeIsNotMadeForANumberAbove32Bits) {
  EXPECT_EQ(HandleOfInode(MakeHandle(2, 0), 2, std::uint64_t{1} << 32), std::nullopt);
}

TEST(FileHandle, OpensItsItemForAPrivilegedProcess) {
  const TemporaryFolder folder;
  const auto file = folder.MakeFile("x");
  const Descriptor volume(open(folder.Path().c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  const Descriptor opened = OpenByHandle(volume.Get(), ReadHandle(AT_FDCWD, file.c_str()));
  if (!opened.IsOpen()) GTEST_SKIP() << "not permitted here, or no file handles";
  struct stat about = {};
  ASSERT_EQ(fstat(opened.Get(), &about), 0);
  EXPECT_EQ(about.st_ino, InodeOf(file));
  EXPECT_FALSE(OpenByHandle(volume.Get(), MakeHandle(0, 0)).IsOpen());
}

}  // namespace
}  // namespace tallowmere::files
