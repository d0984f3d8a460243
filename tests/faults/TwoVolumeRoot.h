// A root folder with two volumes and nothing on them but what a service needs, which the process
// leaves again: so that the machine's volumes are no part of what is tested, and its files can be
// removed afterwards.
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
  // With these programs and libraries at their places, all that they need, /proc, a home folder
  // kHome for this process's user, and a volume in memory at kDisk. It is an ext4 volume called
  // kLabel where one can be mounted, else one in memory. The process stays outside where all that
  // is not permitted. REQUIRES: it is in a mount namespace of its own.
  explicit TwoVolumeRoot(const std::vector<std::string>& files);
  TwoVolumeRoot(const TwoVolumeRoot&) = delete;
  TwoVolumeRoot& operator=(const TwoVolumeRoot&) = delete;
  ~TwoVolumeRoot();  // the process is back

  static constexpr char kDisk[] = "/Disk";
  static constexpr char kHome[] = "/Home";
  static constexpr char kUser[] = "user";  // whose that is
  static constexpr char kLabel[] = "System";

  bool IsEntered() const { return mIsEntered; }
  bool IsImage() const { return !mRoot; }

 private:
  void Furnish(const std::vector<std::string>& files);

  // Where a path inside is outside.
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
