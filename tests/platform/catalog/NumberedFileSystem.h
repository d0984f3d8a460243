// A file system in which a test chooses the inode numbers: an item has the number after the last
// '@' of its name, or else one of its own. Nothing can be written, only folders can be removed, and
// nothing can be moved over an existing item.
#pragma once

#include <sys/types.h>

#include <filesystem>
#include <string>

#include "support/TemporaryFolder.h"

namespace tallowmere::test {

class NumberedFileSystem {
 public:
  // On a block device it mounts as fuseblk, like a file system on a disk.
  enum class On { kNothing, kBlockDevice };

  // Whether names that differ only in the case of ASCII letters find the same item.
  enum class Case { kCounts, kIgnored };

  // How times advance: as finely as the clock, in the kernel's ticks of some milliseconds, or in
  // seconds. Within a tick, all changes have one time.
  enum class Ticks { kFine, kKernels, kSeconds };

  // Serves from a child process. REQUIRES: the test is in a mount namespace of its own.
  explicit NumberedFileSystem(On on = On::kNothing, Case letterCase = Case::kCounts,
                              Ticks ticks = Ticks::kFine);
  NumberedFileSystem(const NumberedFileSystem&) = delete;
  NumberedFileSystem& operator=(const NumberedFileSystem&) = delete;
  ~NumberedFileSystem();

  bool IsMounted() const { return mIsMounted; }
  std::filesystem::path Path() const { return mFolder.Path() / "numbered"; }

  // Both make an item with that inode number and return its path.
  std::string MakeFolder(const std::string& name, unsigned long number) const;
  std::string MakeFile(const std::string& name, unsigned long number) const;

  // Gives an item another number, without a change of its folder. Returns whether it could.
  static bool Renumber(const std::string& path, unsigned long number);

 private:
  TemporaryFolder mFolder;
  pid_t mServer = -1;
  bool mIsMounted = false;
};

}  // namespace tallowmere::test
