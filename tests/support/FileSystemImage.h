// A file system in an image file, for tests that need a real one.
#pragma once

#include <filesystem>
#include <optional>
#include <string>
#include <vector>

#include "support/MountNamespace.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {

// Runs a program to its end, its output thrown away. False when it fails or is not installed.
bool RunTool(const std::vector<std::string>& command);

// Whether the kernel has a file system, loading its module if it can.
bool KernelHas(const std::string& fileSystem);

class FileSystemImage {
 public:
  // An image of so many bytes; `makeCommand` is the tool that fills it, the image's path goes
  // behind its arguments.
  FileSystemImage(std::string type, std::vector<std::string> makeCommand, std::uintmax_t bytes);
  ~FileSystemImage() { Unmount(); }

  // Whether there is an image. Not without the tool.
  bool IsMade() const { return mIsMade; }

  // Mounts it through a loop device. REQUIRES: the test is in a mount namespace of its own.
  bool Mount(const std::string& options = "");
  void Unmount();

  // Where it is mounted.
  std::filesystem::path Path() const { return mFolder.Path() / "mounted"; }

 private:
  TemporaryFolder mFolder;
  std::string mType;
  bool mIsMade;
  bool mIsMounted = false;
};

}  // namespace tallowmere::test
