#include "cli/Paths.h"

#include <sys/stat.h>

#include <algorithm>
#include <filesystem>

namespace tallowmere::cli {

std::string AbsolutePath(const std::string& path) {
  std::string absolute = std::filesystem::absolute(path);
  const std::size_t last = absolute.find_last_not_of('/');
  absolute.resize(last == std::string::npos ? 1 : last + 1);
  return absolute;
}

bool IsFolder(const std::string& path) {
  struct stat about {};
  return lstat(path.c_str(), &about) == 0 && S_ISDIR(about.st_mode);
}

}  // namespace tallowmere::cli
