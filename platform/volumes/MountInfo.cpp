#include "volumes/MountInfo.h"

#include <algorithm>
#include <charconv>
#include <optional>
#include <utility>

#include "kernel/Item.h"

namespace tallowmere::volumes {
namespace {

// Removes the text up to the next `separator`, and the separator, from the front of `rest`; returns
// the text.
std::string_view TakeUntil(std::string_view& rest, char separator) {
  const std::size_t end = rest.find(separator);
  const std::string_view taken = rest.substr(0, end);
  rest.remove_prefix(end == std::string_view::npos ? rest.size() : end + 1);
  return taken;
}

template <class Number>
std::optional<Number> ParseNumber(std::string_view text) {
  Number number{};
  const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
  if (error != std::errc{} || end != text.data() + text.size()) return std::nullopt;
  return number;
}

bool IsOctalDigit(char c) {
  return c >= '0' && c <= '7';
}

// The kernel writes space, tab, newline, backslash and '#' as a backslash and three octal digits.
std::string Unescape(std::string_view text) {
  if (text.find('\\') == text.npos) return std::string(text);
  std::string plain;
  plain.reserve(text.size());
  for (std::size_t i = 0; i < text.size(); ++i) {
    if (text[i] == '\\' && text.size() - i > 3 && IsOctalDigit(text[i + 1]) &&
        IsOctalDigit(text[i + 2]) && IsOctalDigit(text[i + 3])) {
      const int code = (text[i + 1] - '0') * 64 + (text[i + 2] - '0') * 8 + (text[i + 3] - '0');
      plain.push_back(static_cast<char>(code));
      i += 3;
    } else {
      plain.push_back(text[i]);
    }
  }
  return plain;
}

std::optional<std::uint64_t> ParseDevice(std::string_view text) {
  const auto majorNumber = ParseNumber<unsigned>(TakeUntil(text, ':'));
  const auto minorNumber = ParseNumber<unsigned>(text);
  if (!majorNumber || !minorNumber) return std::nullopt;
  return kernel::DeviceNumber(*majorNumber, *minorNumber);
}

// "36 35 98:0 /mnt1 /mnt2 rw,noatime master:1 - ext3 /dev/root rw,errors=continue": any number of
// optional fields stand between the mount options and the lone "-".
std::optional<Mount> ParseLine(std::string_view line) {
  const auto id = ParseNumber<int>(TakeUntil(line, ' '));
  const auto parent = ParseNumber<int>(TakeUntil(line, ' '));
  const auto device = ParseDevice(TakeUntil(line, ' '));
  const std::string_view root = TakeUntil(line, ' ');
  const std::string_view mountPoint = TakeUntil(line, ' ');
  TakeUntil(line, ' ');  // mount options
  while (!line.empty() && TakeUntil(line, ' ') != "-") {
  }
  const std::string_view type = TakeUntil(line, ' ');
  if (!id || !parent || !device || root.empty() || !mountPoint.starts_with('/') || type.empty()) {
    return std::nullopt;
  }
  return Mount{*id, *parent, *device, Unescape(root), Unescape(mountPoint), Unescape(type)};
}

}  // namespace

std::vector<Mount> ParseMountInfo(std::string_view text) {
  std::vector<Mount> mounts;
  mounts.reserve(static_cast<std::size_t>(std::count(text.begin(), text.end(), '\n')));
  while (!text.empty()) {
    if (auto mount = ParseLine(TakeUntil(text, '\n'))) mounts.push_back(*std::move(mount));
  }
  return mounts;
}

}  // namespace tallowmere::volumes
