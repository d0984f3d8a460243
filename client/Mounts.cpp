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

}  // namespace

std::vector<std::string> MountPointsIn(std::string_view mountInfo) {
  std::vector<std::string> all;
  while (!mountInfo.empty()) {
    std::string_view line = TakeUntil(mountInfo, '\n');
    for (std::size_t field = 0; field < kFieldOfMountPoint; ++field) TakeUntil(line, ' ');
    std::string mountPoint = Unescape(TakeUntil(line, ' '));
    if (mountPoint.starts_with('/')) all.push_back(std::move(mountPoint));
  }
  std::unordered_set<std::string> met{"/"};
  std::vector<std::string> last;
  for (auto mountPoint = all.rbegin(); mountPoint != all.rend(); ++mountPoint) {
    if (met.insert(*mountPoint).second) last.push_back(std::move(*mountPoint));
  }
  last.emplace_back("/");
  std::reverse(last.begin(), last.end());
  return last;
}

std::vector<std::string> ReadMountPoints() {
  std::ifstream table("/proc/self/mountinfo");
  return MountPointsIn(std::string(std::istreambuf_iterator<char>(table), {}));
}

}  // namespace tallowmere
