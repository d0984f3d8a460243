// A root folder of its own for this process and what it starts, with nothing on it but what a
// service needs: so that the machine's volumes are no part of what is tested.
#pragma once

#include <filesystem>
#include <optional>
#include <string>
#include <vector>

#include "support/FileSystemImage.h"
#include "support/MountNamespace.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {

class SmallRoot {
 public:
  // With these programs and libraries at their places, the libraries of this process, /proc, a
  // volume in memory at kDisk and, where one can be mounted, an ext4 volume at kImage. The process
  // stays outside where that is not permitted. REQUIRES: it is in a mount namespace of its own.
  explicit SmallRoot(const std::vector<std::string>& files);
  SmallRoot(const SmallRoot&) = delete;
  SmallRoot& operator=(const SmallRoot&) = delete;
  ~SmallRoot();  // the process is back

  static constexpr char kDisk[] = "/Disk";
  static constexpr char kImage[] = "/Image";

  bool IsEntered() const { return mIsEntered; }
  bool HasImage() const { return mImagePlace && mImagePlace->IsMounted(); }

 private:
  // The place that a path inside has outside.
  std::filesystem::path Outside(const std::string& path) const {
    return mFolder.Path() / path.substr(1);
  }

  TemporaryFolder mFolder;
  ScopedMount mRoot;
  std::optional<ScopedMount> mProc;
  std::optional<ScopedMount> mDisk;
  std::optional<FileSystemImage> mImage;
  std::optional<ScopedMount> mImagePlace;
  int mFormerRoot = -1;
  bool mIsEntered = false;
};

}  // namespace tallowmere::test
