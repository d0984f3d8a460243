#include "cli/Paths.h"

#include <sys/stat.h>

#include <filesystem>
#include <system_error>

namespace tallowmere::cli {

std::string AbsolutePath(const std::string& path) {
  std::error_code none;
  std::filesystem::path absolute = std::filesystem::absolute(path, none);
  if (absolute.empty()) return path;
  while (!absolute.has_filename() && absolute != "/") absolute = absolute.parent_path();
  const std::filesystem::path name = absolute.filename();
  if (name == "." || name == "..") {
    const auto folder = FolderAt(absolute);
    return folder ? *folder : absolute.string();
  }
  const auto folder = FolderAt(absolute.parent_path());
  return folder ? (std::filesystem::path(*folder) / name).string() : absolute.string();
}

std::optional<std::string> FolderAt(const std::string& path) {
  std::error_code none;
  const auto real = std::filesystem::canonical(path, none);
  if (real.empty() || !IsFolder(real)) return std::nullopt;
  return real.string();
}

bool IsFolder(const std::string& path) {
  struct stat about {};
  return lstat(path.c_str(), &about) == 0 && S_ISDIR(about.st_mode);
}

}  // namespace tallowmere::cli
