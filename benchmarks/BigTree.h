// Very many files and folders to search for something.
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
  std::vector<std::filesystem::path> folders;  // breadth first, starting with the top
  std::vector<std::filesystem::path> files;
};

// Creates an empty file.
void MakeEmptyFile(const std::filesystem::path& path);

// Makes this many entries in `top`, an existing folder: of 100 entries, 11 are folders. Each folder
// has up to eight folders, and as close as possible to the same number of files.
Tree MakeTree(const std::filesystem::path& top, long entries);

// A volume in memory, which lives as long as its object. Its items have inode numbers that are node
// ids.
class MemoryVolume {
 public:
  MemoryVolume();

  // Where mounting is not permitted, it is a folder on the volume of temporary files.
  bool IsMounted() const { return mMount.IsMounted(); }
  const std::filesystem::path& Path() const { return mFolder.Path(); }

 private:
  test::TemporaryFolder mFolder;
  test::ScopedMount mMount;
};

// A volume with a big tree, made on first use. Everybody can read it.
struct BigTree {
  MemoryVolume volume;
  Tree tree;
};
const BigTree& TheBigTree(long entries);

}  // namespace tallowmere::benchmark
