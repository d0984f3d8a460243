#include "text/FileNameText.h"

#include <cstdint>

#include "text/Utf16.h"
#include "text/Utf8.h"

namespace tallowmere::text {

std::u16string TextOfFileName(std::string_view bytes) {
  if (IsAllAscii(bytes)) return {bytes.begin(), bytes.end()};
  std::u16string text;
  text.reserve(bytes.size());
  while (!bytes.empty()) {
    const Utf8Character character = NextUtf8(bytes);
    if (character.length == 0) {
      text.push_back(static_cast<char16_t>(kByteEscape + static_cast<std::uint8_t>(bytes[0])));
      bytes.remove_prefix(1);
    } else {
      AppendUtf16(text, character.codePoint);
      bytes.remove_prefix(character.length);
    }
  }
  return text;
}

std::optional<std::string> FileNameOfText(std::u16string_view text) {
  if (IsAllAscii(text)) return std::string(text.begin(), text.end());
  std::string bytes;
  bytes.reserve(text.size());
  while (!text.empty()) {
    const auto [codePoint, units] = NextUtf16(text);
    if (IsEscapedByte(codePoint)) {
      bytes.push_back(static_cast<char>(codePoint - kByteEscape));
    } else if (IsSurrogate(codePoint)) {
      return std::nullopt;
    } else {
      bytes += EncodeUtf8(codePoint).View();
    }
    text.remove_prefix(units);
  }
  return bytes;
}

}  // namespace tallowmere::text
