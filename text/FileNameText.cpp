#include "text/FileNameText.h"

#include <algorithm>
#include <cstdint>
#include <type_traits>

#include "text/Utf16.h"
#include "text/Utf8.h"

namespace tallowmere::text {
namespace {

// Moves the ASCII characters at the beginning of one text, as most names have no others, to the end
// of another.
template <class From, class To>
void MoveAscii(std::basic_string_view<From>& from, std::basic_string<To>& to) {
  const auto end = std::find_if(from.begin(), from.end(), [](From character) {
    return !IsAscii(static_cast<std::make_unsigned_t<From>>(character));
  });
  to.append(from.begin(), end);
  from.remove_prefix(static_cast<std::size_t>(end - from.begin()));
}

}  // namespace

std::u16string TextOfFileName(std::string_view bytes) {
  std::u16string text;
  text.reserve(bytes.size());
  for (MoveAscii(bytes, text); !bytes.empty(); MoveAscii(bytes, text)) {
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
  std::string bytes;
  bytes.reserve(text.size());
  for (MoveAscii(text, bytes); !text.empty(); MoveAscii(text, bytes)) {
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
