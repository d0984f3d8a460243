#include "client/FindService.h"

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <climits>
#include <cstdlib>
#include <string_view>

namespace tallowmere {
namespace {

constexpr std::string_view kProgramName = "tallowmere";

bool IsProgram(const std::string& path) {
  struct stat about {};
  return stat(path.c_str(), &about) == 0 && S_ISREG(about.st_mode) &&
         access(path.c_str(), X_OK) == 0;
}

std::string BesideThisProgram() {
  std::array<char, PATH_MAX> own;
  const ssize_t length = readlink("/proc/self/exe", own.data(), own.size());
  if (length <= 0) return {};
  const std::string_view path(own.data(), static_cast<std::size_t>(length));
  return std::string(path.substr(0, path.rfind('/') + 1)).append(kProgramName);
}

std::string OnSearchPath() {
  const char* const variable = std::getenv("PATH");
  std::string_view folders = variable == nullptr ? "" : variable;
  while (!folders.empty()) {
    const std::size_t end = std::min(folders.find(':'), folders.size());
    std::string path(folders.substr(0, end));
    path.append("/").append(kProgramName);
    if (end > 0 && IsProgram(path)) return path;
    folders.remove_prefix(std::min(end + 1, folders.size()));
  }
  return {};
}

}  // namespace

std::string FindService() {
  std::string beside = BesideThisProgram();
  return IsProgram(beside) ? beside : OnSearchPath();
}

}  // namespace tallowmere
