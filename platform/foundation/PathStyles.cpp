#include "foundation/PathStyles.h"

#include <algorithm>

#include "foundation/ColonsAndSlashes.h"
#include "foundation/PathText.h"
#include "foundation/UrlCharacters.h"
#include "foundation/VolumePaths.h"
#include "text/FileNameText.h"

namespace tallowmere::foundation {
namespace {

constexpr std::string_view kHere = ".";
constexpr std::string_view kParent = "..";

// Removes from the front what precedes the first `separator`, and the separator, and returns the
// former.
std::string_view TakeComponent(std::string_view& path, char separator) {
  const std::string_view component = path.substr(0, path.find(separator));
  path.remove_prefix(std::min(path.size(), component.size() + 1));
  return component;
}

// The path without doubled "/", "." components or a trailing "/". Empty when nothing else is left.
std::string Tidied(std::string_view path) {
  std::string tidied(path.starts_with('/') ? "/" : "");
  while (!path.empty()) {
    const std::string_view component = TakeComponent(path, '/');
    if (!component.empty() && component != kHere) tidied = JoinPath(tidied, component);
  }
  return tidied;
}

// Whether a path begins with a drive such as "C:", followed by `separator` or by nothing.
bool BeginsWithDrive(std::string_view path, char separator) {
  return path.size() >= 2 && IsAsciiLetter(path[0]) && path[1] == ':' &&
         (path.size() == 2 || path[2] == separator);
}

}  // namespace

std::optional<std::string> LinuxPathOfHfsPath(std::string_view hfs) {
  if (hfs.empty()) return std::nullopt;
  const std::string_view volume = TakeComponent(hfs, ':');
  std::string path;
  if (!volume.empty()) {
    auto mountPoint = MountPointOfVolume(text::TextOfFileName(volume));
    if (!mountPoint) return std::nullopt;
    path = *std::move(mountPoint);
  }
  long depth = 0;
  while (!hfs.empty()) {
    const std::string_view name = TakeComponent(hfs, ':');
    depth += name.empty() ? -1 : 1;
    if (!volume.empty() && depth < 0) return std::nullopt;
    if (name == kHere || name == kParent) return std::nullopt;
    path = name.empty() ? JoinPath(path, kParent)
                        : JoinPath(path, ExchangeColonsAndSlashes(std::string(name)));
  }
  return path.empty() ? std::string(kHere) : path;
}

std::optional<std::string> HfsPathOfLinuxPath(std::string_view path, bool folder) {
  const std::string tidied = Tidied(path);
  std::string_view rest = tidied;
  std::string hfs;
  const bool absolute = path.starts_with('/');
  if (absolute) {
    const auto volume = FindVolumeOfPath(tidied);
    if (!volume) return std::nullopt;
    auto name = text::FileNameOfText(volume->name);
    if (!name) return std::nullopt;
    hfs = *std::move(name);
    rest.remove_prefix(volume->mountPointLength);
    if (rest.starts_with('/')) rest.remove_prefix(1);
  }
  hfs.push_back(':');
  long depth = 0;
  bool endsInName = false;
  while (!rest.empty()) {
    const std::string_view component = TakeComponent(rest, '/');
    endsInName = component != kParent;
    depth += endsInName ? 1 : -1;
    if (absolute && depth < 0) return std::nullopt;
    if (endsInName) hfs += ExchangeColonsAndSlashes(std::string(component));
    hfs.push_back(':');
  }
  if (endsInName && !folder) hfs.pop_back();
  return hfs;
}

std::string LinuxPathOfWindowsPath(std::string_view windows) {
  std::string path(BeginsWithDrive(windows, '\\') ? "/" : "");
  path += windows;
  std::replace(path.begin(), path.end(), '\\', '/');
  return path;
}

std::optional<std::string> WindowsPathOfLinuxPath(std::string_view path) {
  std::string windows(path);
  std::replace(windows.begin(), windows.end(), '/', '\\');
  if (windows.starts_with('\\') && BeginsWithDrive(windows.substr(1), '\\')) windows.erase(0, 1);
  if (LinuxPathOfWindowsPath(windows) != path) return std::nullopt;
  return windows;
}

}  // namespace tallowmere::foundation
