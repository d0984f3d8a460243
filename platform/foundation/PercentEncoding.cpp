#include "foundation/PercentEncoding.h"

#include <cstdint>

#include "foundation/UrlCharacters.h"

namespace tallowmere::foundation {

std::string PercentEncodePath(std::string_view bytes, bool firstSegmentIsUrlStart) {
  constexpr char kDigits[] = "0123456789ABCDEF";
  std::string text;
  text.reserve(bytes.size());
  bool colonIsPlain = !firstSegmentIsUrlStart;
  for (const char c : bytes) {
    if (c == '/') colonIsPlain = true;
    if (c == '/' || (IsPathCharacter(c) && (c != ':' || colonIsPlain))) {
      text.push_back(c);
    } else {
      const auto byte = static_cast<std::uint8_t>(c);
      text.push_back('%');
      text.push_back(kDigits[byte >> 4]);
      text.push_back(kDigits[byte & 0xF]);
    }
  }
  return text;
}

std::string PercentDecode(std::string_view text) {
  if (text.find('%') == text.npos) return std::string(text);
  std::string bytes;
  bytes.reserve(text.size());
  for (std::size_t i = 0; i < text.size(); ++i) {
    const int high = text[i] == '%' && text.size() - i > 2 ? HexValue(text[i + 1]) : -1;
    const int low = high >= 0 ? HexValue(text[i + 2]) : -1;
    if (low < 0) {
      bytes.push_back(text[i]);
    } else {
      bytes.push_back(static_cast<char>(high << 4 | low));
      i += 2;
    }
  }
  return bytes;
}

}  // namespace tallowmere::foundation
