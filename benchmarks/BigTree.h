// Very many files and folders to look for something in.
#pragma once

#include <filesystem>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "support/FileSystemImage.h"
#include "support/MountNamespace.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::benchmark {

struct Tree {
  std::vector<std::filesystem::path> folders;  // breadth first, the first is the top
  std::vector<std::filesystem::path> files;
};

// A new file.
void MakeEmptyFile(const std::filesystem::path& path);

// So many entries below `top`, which is there: of 100 entries 11 are folders, each of which has up
// to eight folders and, as nearly as can be, the same number of files.
Tree MakeTree(const std::filesystem::path& top, long entries);

// A volume in memory, which ends with its object. Items in it have inode numbers that are node ids.
class MemoryVolume {
 public:
  MemoryVolume();

  // Where mounting is not permitted it is a folder on the volume of temporary files.
  bool IsMounted() const { return mMount.IsMounted(); }
  const std::filesystem::path& Path() const { return mFolder.Path(); }

 private:
  test::TemporaryFolder mFolder;
  test::ScopedMount mMount;
};

// A volume with a big tree, made when first asked for. Everybody can read it.
struct BigTree {
  MemoryVolume volume;
  Tree tree;
};
const BigTree& TheBigTree(long entries);

}  // namespace tallowmere::benchmark
