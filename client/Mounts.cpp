#include "client/Mounts.h"

#include <algorithm>
#include <cstddef>
#include <fstream>
#include <iterator>
#include <unordered_set>
#include <utility>

namespace tallowmere {
namespace {

constexpr std::size_t kFieldOfMountPoint = 4;  // after mount id, parent id, device and root
constexpr std::size_t kDigitsOfAnEscape = 3;

bool IsOctalDigit(char c) {
  return c >= '0' && c <= '7';
}

// Removes the text up to the next `separator`, and the separator, from the front of `rest`; returns
// the text.
std::string_view TakeUntil(std::string_view& rest, char separator) {
  const std::size_t end = rest.find(separator);
  const std::string_view taken = rest.substr(0, end);
  rest.remove_prefix(end == std::string_view::npos ? rest.size() : end + 1);
  return taken;
}

// A space, tab, newline, backslash or '#' is written as a backslash and three octal digits.
std::string Unescape(std::string_view text) {
  std::string plain;
  while (!text.empty()) {
    const std::string_view digits = text.substr(1, kDigitsOfAnEscape);
    const bool isEscape = text[0] == '\\' && digits.size() == kDigitsOfAnEscape &&
                          std::all_of(digits.begin(), digits.end(), IsOctalDigit);
    int code = 0;
    for (const char digit : digits) code = code * 8 + (digit - '0');
    plain.push_back(isEscape ? static_cast<char>(code) : text[0]);
    text.remove_prefix(isEscape ? 1 + kDigitsOfAnEscape : 1);
  }
  return plain;
}

// What follows the separator of a line's optional fields, " - ", is the kind of file system.
std::string KindIn(std::string_view line) {
  constexpr std::string_view kEndOfOptionalFields = " - ";
  const std::size_t end = line.find(kEndOfOptionalFields);
  if (end == std::string_view::npos) return {};
  line.remove_prefix(end + kEndOfOptionalFields.size());
  return Unescape(TakeUntil(line, ' '));
}

std::string ReadTable() {
  std::ifstream table("/proc/self/mountinfo");
  return {std::istreambuf_iterator<char>(table), {}};
}

}  // namespace

std::vector<Mount> MountsIn(std::string_view mountInfo) {
  std::vector<Mount> all;
  while (!mountInfo.empty()) {
    std::string_view line = TakeUntil(mountInfo, '\n');
    for (std::size_t field = 0; field < kFieldOfMountPoint; ++field) TakeUntil(line, ' ');
    std::string point = Unescape(TakeUntil(line, ' '));
    if (point.starts_with('/')) all.push_back({std::move(point), KindIn(line)});
  }
  // The last mount at "/" is the first of the list.
  Mount root{"/", {}};
  std::unordered_set<std::string> met;
  std::vector<Mount> last;
  for (auto mount = all.rbegin(); mount != all.rend(); ++mount) {
    if (!met.insert(mount->point).second) continue;
    (mount->point == root.point ? root : last.emplace_back()) = std::move(*mount);
  }
  last.push_back(std::move(root));
  std::reverse(last.begin(), last.end());
  return last;
}

std::vector<std::string> MountPointsIn(std::string_view mountInfo) {
  std::vector<std::string> points;
  for (Mount& mount : MountsIn(mountInfo)) points.push_back(std::move(mount.point));
  return points;
}

std::vector<std::string> ReadMountPoints() {
  return MountPointsIn(ReadTable());
}

std::vector<Mount> ReadMounts() {
  return MountsIn(ReadTable());
}

// The kinds as proc_filesystems(5) names them; a FUSE server's has a name of its own behind a dot.
bool HasServer(const Mount& mount) {
  constexpr std::string_view kKinds[] = {"9p",   "afs",   "autofs",  "ceph", "cifs",
                                         "coda", "fuse",  "nfs",     "nfs4", "orangefs",
                                         "smb3", "smbfs", "virtiofs"};
  return mount.kind.starts_with("fuse.") ||
         std::find(std::begin(kKinds), std::end(kKinds), mount.kind) != std::end(kKinds);
}

}  // namespace tallowmere
