#include "cli/Services.h"

#include <algorithm>
#include <fstream>
#include <iterator>
#include <sstream>
#include <thread>
#include <unordered_map>
#include <vector>

namespace tallowmere::cli {
namespace {

// The lowest volume reference number is -32768.
constexpr long kMostMountIDs = 32768;

struct Mount {
  long id = 0;
  std::string device;
  std::string root;  // what is mounted: a path within the file system
};

Mount MountIn(const std::string& line) {
  std::istringstream fields(line);
  Mount mount;
  std::string parent;
  fields >> mount.id >> parent >> mount.device >> mount.root;
  return mount;
}

// Whether a path is a folder's, or leads into it.
bool IsIn(const std::string& folder, const std::string& path) {
  return folder == "/" ||
         (path.starts_with(folder) && (path.size() == folder.size() || path[folder.size()] == '/'));
}

bool Overlap(const std::string& first, const std::string& second) {
  return IsIn(first, second) || IsIn(second, first);
}

}  // namespace

std::size_t MostServices() {
  std::ifstream file("/proc/self/mountinfo");
  const std::string mountInfo{std::istreambuf_iterator<char>(file), {}};
  return AllAnswerAlike(mountInfo) ? std::max(1U, std::thread::hardware_concurrency()) : 1;
}

bool AllAnswerAlike(const std::string& mountInfo) {
  std::unordered_map<std::string, std::vector<std::string>> rootsOfDevices;
  std::istringstream lines(mountInfo);
  for (std::string line; std::getline(lines, line);) {
    const Mount mount = MountIn(line);
    auto& roots = rootsOfDevices[mount.device];
    const auto overlaps = [&](const std::string& root) { return Overlap(root, mount.root); };
    if (mount.id > kMostMountIDs || std::any_of(roots.begin(), roots.end(), overlaps)) return false;
    roots.push_back(mount.root);
  }
  return true;
}

}  // namespace tallowmere::cli
