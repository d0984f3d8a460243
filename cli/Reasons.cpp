#include "cli/Reasons.h"

#include <sys/stat.h>

#include <cerrno>
#include <filesystem>
#include <system_error>

#include "service/Protocol.h"

namespace tallowmere::cli {
namespace {

constexpr const char* kOnNoVolume = "it is on no volume";

std::string MessageOfSystem() {
  return errno == ENOENT || errno == ENOTDIR ? "there is no such file or folder"
                                             : std::generic_category().message(errno);
}

bool IsMounted(Client& client, const std::string& volume) {
  const auto number = client.GetVolRefnumByHFSName(volume);
  return number && *number;
}

}  // namespace

std::string WhyNoRecord(const std::string& path) {
  struct stat about {};
  if (lstat(path.c_str(), &about) == 0) return kOnNoVolume;
  if (errno != ENOENT) return MessageOfSystem();
  const std::string folder = std::filesystem::path(path).parent_path();
  return stat(folder.c_str(), &about) == 0 ? kOnNoVolume : "there is no such folder";
}

std::string WhyNoName(const std::string& path) {
  struct stat about {};
  if (lstat(path.c_str(), &about) != 0) return MessageOfSystem();
  const bool leadsNowhere = S_ISLNK(about.st_mode) && stat(path.c_str(), &about) != 0;
  return leadsNowhere ? "the link leads nowhere" : kOnNoVolume;
}

std::string WhyNoPath(Client& client, const FSSpec& spec) {
  const auto volume = client.GetHFSVolumeName(spec.vRefNum);
  if (volume && !*volume) return "no volume has the number " + std::to_string(spec.vRefNum);
  return "there is no such item, nor a folder for it";
}

std::string WhyNoPath(Client& client, const std::string& hfsPath) {
  if (hfsPath.size() > protocol::kLongestHFSPath) return "an HFS path has at most 255 bytes";
  const std::size_t end = hfsPath.find(protocol::kSeparator);
  const std::string volume = hfsPath.substr(0, end);
  if (end != 0 && end != std::string::npos && !IsMounted(client, volume)) {
    return "no volume is called \"" + Utf8OfHFSName(volume) + '"';
  }
  return "there is no such item that can be reached";
}

}  // namespace tallowmere::cli
