// Checks the table of file system kinds against the kernel's own file systems.
#include <dirent.h>
#include <sys/vfs.h>

#include <map>
#include <memory>
#include <set>
#include <utility>

#include "KernelFixture.h"
#include "kernel/FileSystemKinds.h"
#include "kernel/Xfs.h"

namespace tallowmere::kernel {
namespace {

struct Disk {
  std::string type;
  std::vector<std::string> makeCommand;
  std::uintmax_t size;
};

using Path = std::filesystem::path;

// Returns the folder and all items below it.
std::vector<Path> ItemsBelow(const Path& folder) {
  std::vector<Path> items{folder};
  for (const auto& entry : std::filesystem::recursive_directory_iterator(folder)) {
    items.push_back(entry.path());
  }
  return items;
}

// A volume with a folder that holds three folders, two files (one with two names) and a link.
class AKindOfFileSystems : public AMountedImage, public testing::WithParamInterface<Disk> {
 protected:
  void SetUp() override {
    MakeImage(GetParam().type, GetParam().makeCommand, GetParam().size);
    if (IsSkipped()) return;
    if (GetParam().type == "btrfs") MakeSubvolume();
    for (const std::string name : {"a/b", "a/c", "a/d/e"}) MakeFolder(name);
    for (const std::string name : {"a/f", "a/d/g"}) MakeFile(name);
    std::filesystem::create_hard_link(PathOf("a/f"), PathOf("a/b/h"));
    std::filesystem::create_symlink("f", PathOf("a/l"));
  }

  // Makes a subvolume whose inode numbers also occur in the rest of the volume.
  void MakeSubvolume() {
    ASSERT_TRUE(test::RunTool({"btrfs", "subvolume", "create", PathOf("s").string()}));
    for (const std::string name : {"s/b", "s/c"}) MakeFolder(name);
  }

  const FileSystemKind& Kind() const {
    struct statfs fileSystem {};
    EXPECT_EQ(fstatfs(Root(), &fileSystem), 0);
    return KindOf(static_cast<std::uint32_t>(fileSystem.f_type), fileSystem.f_files,
                  StatusOf(PathOf("")).st_dev);
  }

  std::vector<Path> AllItems() const { return ItemsBelow(mImage->Path()); }

  std::map<Path, std::uint64_t> AllNumbers() const {
    std::map<Path, std::uint64_t> numbers;
    for (const Path& item : AllItems()) numbers[item] = InodeOf(item);
    return numbers;
  }

  // Returns what its kind needs to open an item by number.
  HandleNumbers NumbersOf(const Path& item) const {
    HandleNumbers numbers{InodeOf(item)};
    if (Kind().byNumber == ByNumber::kInodeAndSubvolume) {
      const auto handle = ReadHandle(AT_FDCWD, item.c_str());
      if (handle) numbers.subvolume = SubvolumeOf(*handle).value_or(0);
    }
    if (Kind().byNumber == ByNumber::kInodeAndGeneration) {
      const auto generation = ReadXfsGeneration(Root(), numbers.inode);
      if (generation) numbers.generation = *generation;
    }
    return numbers;
  }

  void ExpectFoldersToldApart() {
    std::set<std::pair<dev_t, ino_t>> seen;
    for (const Path& item : AllItems()) {
      if (!std::filesystem::is_directory(std::filesystem::symlink_status(item))) continue;
      const struct stat status = StatusOf(item);
      EXPECT_TRUE(seen.emplace(status.st_dev, status.st_ino).second) << item;
    }
  }

  void ExpectNumbersInEntries() {
    int seen = 0;
    for (const std::string folder : {"a", "a/b", "a/d"}) {
      const std::unique_ptr<DIR, int (*)(DIR*)> entries(opendir(PathOf(folder).c_str()), closedir);
      ASSERT_TRUE(entries);
      while (const dirent* const entry = readdir(entries.get())) {
        if (entry->d_type == DT_DIR) continue;
        EXPECT_EQ(entry->d_ino, InodeOf(PathOf(folder) / entry->d_name)) << entry->d_name;
        ++seen;
      }
    }
    EXPECT_EQ(seen, 4);
  }

  void ExpectNumbersKept() {
    const auto before = AllNumbers();
    MountAgain();
    EXPECT_EQ(AllNumbers(), before);
  }

  void ExpectSubfoldersCounted() {
    EXPECT_EQ(StatusOf(PathOf("a")).st_nlink, 5u);
    EXPECT_EQ(StatusOf(PathOf("a/d")).st_nlink, 3u);
    EXPECT_EQ(StatusOf(PathOf("a/b")).st_nlink, 2u);
  }

  void ExpectAllFoundByHandle() {
    std::map<Path, FileHandle> handles;
    for (const Path& item : AllItems()) {
      const auto handle = ReadHandle(AT_FDCWD, item.c_str());
      ASSERT_TRUE(handle) << item;
      handles[item] = *handle;
    }
    MountAgain();
    for (const auto& [item, handle] : handles) EXPECT_TRUE(OpenByHandle(Root(), handle)) << item;
  }

  void ExpectAllFoundByNumber() {
    MountAgain();
    for (const Path& item : AllItems()) EXPECT_EQ(ErrorOfOpening(NumbersOf(item), item), 0) << item;
  }
};

TEST_P(AKindOfFileSystems, KeepsThePromisesOfTheTable) {
  const FileSystemKind& kind = Kind();
  ASSERT_NE(kind.name, "unknown");
  if (kind.numbersTellItemsApart) ExpectFoldersToldApart();
  if (kind.entriesTellNumbers) ExpectNumbersInEntries();
  if (kind.countsSubfolders) ExpectSubfoldersCounted();
  if (kind.keepsNumbers) ExpectNumbersKept();
  if (kind.findsAllByHandle) ExpectAllFoundByHandle();
  if (kind.byNumber != ByNumber::kNone) ExpectAllFoundByNumber();
}

INSTANTIATE_TEST_SUITE_P(Mounted, AKindOfFileSystems,
                         testing::Values(Disk{"ext2", {"mkfs.ext2", "-q", "-F"}, 16 * kMebibyte},
                                         Disk{"ext4", {"mkfs.ext4", "-q", "-F"}, 16 * kMebibyte},
                                         Disk{"xfs", {"mkfs.xfs", "-q"}, 320 * kMebibyte},
                                         Disk{"btrfs", {"mkfs.btrfs", "-q"}, 128 * kMebibyte}),
                         [](const auto& disk) { return disk.param.type; });

}  // namespace
}  // namespace tallowmere::kernel
