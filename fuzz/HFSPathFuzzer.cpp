// Converts HFS and Windows paths to Linux paths and back: arbitrary bytes as each of them.
#include <optional>
#include <string>

#include "foundation/PathStyles.h"
#include "fuzz/Check.h"

namespace tallowmere::fuzz {
namespace {

using foundation::HfsPathOfLinuxPath;
using foundation::LinuxPathOfHfsPath;
using foundation::LinuxPathOfWindowsPath;
using foundation::WindowsPathOfLinuxPath;

// A path's HFS path leads back to where the path leads, and is its own HFS path.
void CheckLinuxPath(std::string_view path, bool isFolder) {
  if (path.empty()) return;
  const auto hfs = HfsPathOfLinuxPath(path, isFolder);
  if (!hfs) return;
  const auto back = LinuxPathOfHfsPath(*hfs);
  Check(back.has_value());
  Check(path.starts_with('/') == back->starts_with('/'));
  Check(HfsPathOfLinuxPath(*back, isFolder) == hfs);
}

// An HFS path that leads somewhere has an HFS path that leads to the same place, unless it climbs
// above a volume.
void CheckHFSPath(std::string_view hfs) {
  const auto path = LinuxPathOfHfsPath(hfs);
  if (!path) return;
  Check(!path->empty());
  const auto again = HfsPathOfLinuxPath(*path, hfs.ends_with(':'));
  if (!again) return;
  const auto back = LinuxPathOfHfsPath(*again);
  Check(back.has_value());
  Check(back == path);
}

void CheckWindowsPath(std::string_view bytes) {
  const auto windows = WindowsPathOfLinuxPath(bytes);
  if (windows) Check(LinuxPathOfWindowsPath(*windows) == bytes);
  const std::string path = LinuxPathOfWindowsPath(bytes);
  const auto again = WindowsPathOfLinuxPath(path);
  if (again) Check(LinuxPathOfWindowsPath(*again) == path);
}

}  // namespace
}  // namespace tallowmere::fuzz

// The input: the kind of path, then the path.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using namespace tallowmere::fuzz;
  Input input(data, size);
  switch (input.TakeByte() % 4) {
    case 0:
      CheckLinuxPath(input.Rest(), false);
      break;
    case 1:
      CheckLinuxPath(input.Rest(), true);
      break;
    case 2:
      CheckHFSPath(input.Rest());
      break;
    default:
      CheckWindowsPath(input.Rest());
  }
  return 0;
}
