// The file systems on which a soak can run.
#pragma once

#include <filesystem>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "Judge.h"
#include "support/FileSystemImage.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::soak {

// Mounts one of these file systems and removes its files at the end.
class MainVolume {
 public:
  static std::vector<std::string> Kinds();
  static bool IsKind(const std::string& kind);

  // REQUIRES: `kind` is one of Kinds().
  explicit MainVolume(const std::string& kind);

  Numbers InodeNumbers() const { return mNumbers; }

  // Mounts the volume. Returns the mount point, or nullopt where a tool or kernel support is
  // missing. REQUIRES: this process is in a mount namespace of its own.
  std::optional<std::string> Mount();

 private:
  std::string FolderFor(const std::string& name) const { return mFolder.MakeFolder(name); }
  bool MountImage(const std::string& place);
  bool MountOverlay(const std::string& place);
  bool MountServed(const std::string& place);

  test::TemporaryFolder mFolder;
  std::string mKind;
  Numbers mNumbers;
  std::optional<test::FileSystemImage> mImage;
};

}  // namespace tallowmere::soak
