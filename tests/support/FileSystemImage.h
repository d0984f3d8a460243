// A file system in an image file, for tests that need a real one.
#pragma once

#include <filesystem>
#include <optional>
#include <string>
#include <vector>

#include "support/MountNamespace.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {

// Runs a program to its end, discarding its output. Returns false when it fails or is not
// installed.
bool RunTool(const std::vector<std::string>& command);

// Whether the kernel supports a file system; loads its module if possible.
bool KernelHas(const std::string& fileSystem);

class FileSystemImage {
 public:
  // Makes an image of this size; `makeCommand` is the tool that fills it, to which the image's path
  // is passed as the last argument.
  FileSystemImage(std::string type, std::vector<std::string> makeCommand, std::uintmax_t bytes);
  ~FileSystemImage() { Unmount(); }

  // Whether there is an image. False when the tool is not installed.
  bool IsMade() const { return mIsMade; }

  // Mounts it through a loop device. REQUIRES: the test is in a mount namespace of its own.
  bool Mount(const std::string& options = "");
  void Unmount();

  // The mount point.
  std::filesystem::path Path() const { return mFolder.Path() / "mounted"; }

 private:
  TemporaryFolder mFolder;
  std::string mType;
  bool mIsMade;
  bool mIsMounted = false;
};

}  // namespace tallowmere::test
