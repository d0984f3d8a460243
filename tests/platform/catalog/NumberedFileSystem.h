// A file system whose items have the inode numbers that a test gives them: the number behind the
// last '@' of their names, else one of their own. Nothing can be written, and folders alone can be
// removed; nothing can be moved to where something is.
#pragma once

#include <sys/types.h>

#include <filesystem>
#include <string>

#include "support/TemporaryFolder.h"

namespace tallowmere::test {

class NumberedFileSystem {
 public:
  // On a block device it passes for a file system of a disk: fuseblk.
  enum class On { kNothing, kBlockDevice };

  // Whether a name finds an item whose name has ASCII letters in the other case.
  enum class Case { kCounts, kIgnored };

  // How times advance: as finely as the clock, in the kernel's ticks of some milliseconds, or in
  // seconds. Within a tick, all changes have one time.
  enum class Ticks { kFine, kKernels, kSeconds };

  // Served by a child process. REQUIRES: the test is in a mount namespace of its own.
  explicit NumberedFileSystem(On on = On::kNothing, Case letterCase = Case::kCounts,
                              Ticks ticks = Ticks::kFine);
  NumberedFileSystem(const NumberedFileSystem&) = delete;
  NumberedFileSystem& operator=(const NumberedFileSystem&) = delete;
  ~NumberedFileSystem();

  bool IsMounted() const { return mIsMounted; }
  std::filesystem::path Path() const { return mFolder.Path() / "numbered"; }

  // Makes a folder or a file with that inode number. The path.
  std::string MakeFolder(const std::string& name, unsigned long number) const;
  std::string MakeFile(const std::string& name, unsigned long number) const;

 private:
  TemporaryFolder mFolder;
  pid_t mServer = -1;
  bool mIsMounted = false;
};

}  // namespace tallowmere::test
