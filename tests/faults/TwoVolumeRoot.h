// A root folder with two volumes that contain only what a service needs. The process leaves it
// again. So the machine's volumes are not part of the test, and the files can be removed
// afterwards.
#pragma once

#include <filesystem>
#include <optional>
#include <string>
#include <vector>

#include "support/FileSystemImage.h"
#include "support/MountNamespace.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {

class TwoVolumeRoot {
 public:
  // Enters a root with these programs and libraries at their paths, all that they need, /proc, a
  // home folder kHome for this process's user, and a volume in memory at kDisk. It is an ext4
  // volume named kLabel where one can be mounted, else one in memory. Where any of this is not
  // permitted, the process stays outside. REQUIRES: the process is in a mount namespace of its own.
  explicit TwoVolumeRoot(const std::vector<std::string>& files);
  TwoVolumeRoot(const TwoVolumeRoot&) = delete;
  TwoVolumeRoot& operator=(const TwoVolumeRoot&) = delete;
  ~TwoVolumeRoot();  // brings the process back

  static constexpr char kDisk[] = "/Disk";
  static constexpr char kHome[] = "/Home";
  static constexpr char kUser[] = "user";  // the owner of kHome
  static constexpr char kLabel[] = "System";

  bool IsEntered() const { return mIsEntered; }
  bool IsImage() const { return !mRoot; }

 private:
  void Furnish(const std::vector<std::string>& files);

  // The outside path of a path inside.
  std::filesystem::path Outside(const std::string& path) const { return mTop / path.substr(1); }

  TemporaryFolder mFolder;
  FileSystemImage mImage;
  std::optional<ScopedMount> mRoot;  // in memory
  std::filesystem::path mTop;
  std::optional<ScopedMount> mProc;
  std::optional<ScopedMount> mDisk;
  int mFormerRoot = -1;
  bool mIsEntered = false;
};

}  // namespace tallowmere::test
