#include "BigTree.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdint>

#include "Server.h"

namespace tallowmere::benchmark {
namespace {

constexpr long kFoldersInAHundred = 11;
constexpr std::size_t kFoldersInAFolder = 8;

// No limit on the contents, which take memory only as they are made.
constexpr const char* kNoLimit = "size=0,nr_inodes=0,mode=0755";

// Inode numbers in memory start at 1; those below this are not the node ids of their items.
constexpr std::uint64_t kReservedInodes = 16;

}  // namespace

void MakeEmptyFile(const std::filesystem::path& path) {
  const int file = open(path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0644);
  if (file < 0) Fail(path);
  close(file);
}

Tree MakeTree(const std::filesystem::path& top, long entries) {
  const auto folders = static_cast<std::size_t>(entries * kFoldersInAHundred / 100);
  const std::size_t files = static_cast<std::size_t>(entries) - folders;
  Tree tree;
  tree.folders.reserve(folders + 1);
  tree.files.reserve(files);
  tree.folders.push_back(top);
  for (std::size_t next = 0; next < tree.folders.size(); ++next) {
    const std::filesystem::path folder = tree.folders[next];
    for (std::size_t i = 0; i < kFoldersInAFolder && tree.folders.size() <= folders; ++i) {
      tree.folders.push_back(folder / ("folder " + std::to_string(i)));
      if (mkdir(tree.folders.back().c_str(), 0755) != 0) Fail(tree.folders.back());
    }
    const std::size_t filesByThen = files * (next + 1) / (folders + 1);
    for (std::size_t i = 0; tree.files.size() < filesByThen; ++i) {
      tree.files.push_back(folder / ("a track " + std::to_string(i) + ".aif"));
      MakeEmptyFile(tree.files.back());
    }
  }
  return tree;
}

MemoryVolume::MemoryVolume()
    : mMount("tmpfs", mFolder.Path(), test::EnterOwnMountNamespace() ? "tmpfs" : "", 0, kNoLimit) {
  chmod(mFolder.Path().c_str(), 0755);
  for (std::uint64_t i = 0; i < kReservedInodes; ++i) {
    MakeEmptyFile(Path() / "used up");
    unlink((Path() / "used up").c_str());
  }
}

const BigTree& TheBigTree(long entries) {
  static const auto big = [entries] {
    auto made = std::make_unique<BigTree>();
    made->tree = MakeTree(made->volume.Path(), entries);
    return made;
  }();
  return *big;
}

}  // namespace tallowmere::benchmark
