#include "foundation/PercentEncoding.h"

#include <array>
#include <cstdint>
#include <limits>

#include "foundation/UrlCharacters.h"

namespace tallowmere::foundation {
namespace {

// The bytes of a path that a URL holds as they are.
constexpr auto kStandsForItself = [] {
  std::array<bool, std::size_t{std::numeric_limits<std::uint8_t>::max()} + 1> does{};
  for (std::size_t byte = 0; byte < does.size(); ++byte) {
    const char c = static_cast<char>(byte);
    does[byte] = c == '/' || IsPathCharacter(c);
  }
  return does;
}();

void AppendEncodedByte(std::string& text, char c) {
  constexpr char kDigits[] = "0123456789ABCDEF";
  const auto byte = static_cast<std::uint8_t>(c);
  text.append({'%', kDigits[byte >> 4], kDigits[byte & 0xF]});
}

}  // namespace

void AppendPercentEncodedPath(std::string& text, std::string_view bytes,
                              bool firstSegmentIsUrlStart) {
  const std::size_t plainColons = firstSegmentIsUrlStart ? bytes.find('/') : 0;
  std::size_t done = 0;
  for (std::size_t i = 0; i < bytes.size(); ++i) {
    const char c = bytes[i];
    if (kStandsForItself[static_cast<std::uint8_t>(c)] && (c != ':' || i >= plainColons)) continue;
    text.append(bytes, done, i - done);
    AppendEncodedByte(text, c);
    done = i + 1;
  }
  text.append(bytes, done);
}

std::string PercentDecode(std::string_view text) {
  std::string bytes;
  bytes.reserve(text.size());
  std::size_t done = 0;
  for (auto at = text.find('%'); at != text.npos; at = text.find('%', at)) {
    const int high = text.size() - at > 2 ? HexValue(text[at + 1]) : -1;
    const int low = high >= 0 ? HexValue(text[at + 2]) : -1;
    if (low < 0) {
      ++at;
      continue;
    }
    bytes.append(text, done, at - done).push_back(static_cast<char>(high << 4 | low));
    done = at += 3;
  }
  return bytes.append(text, done);
}

}  // namespace tallowmere::foundation
