// Characters of UTF-16, and the surrogates among them that stand for bytes of a file name.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <type_traits>

namespace tallowmere::text {

constexpr char16_t kFirstHighSurrogate = 0xD800;
constexpr char16_t kFirstLowSurrogate = 0xDC00;
constexpr char32_t kFirstSupplementary = 0x10000;

constexpr bool IsAscii(char16_t unit) {
  return unit < 0x80;
}

// Whether a text, in bytes or in UTF-16, is pure ASCII, as most names are: its characters are then
// the same in every encoding of a name. Examines the whole text, so that the compiler can process
// several characters at a time.
template <typename Char>
constexpr bool IsAllAscii(std::basic_string_view<Char> text) {
  char32_t bits = 0;
  for (const Char character : text) bits |= static_cast<std::make_unsigned_t<Char>>(character);
  return bits < 0x80;
}

constexpr bool IsHighSurrogate(char16_t unit) {
  return unit >= kFirstHighSurrogate && unit <= 0xDBFF;
}
constexpr bool IsLowSurrogate(char16_t unit) {
  return unit >= kFirstLowSurrogate && unit <= 0xDFFF;
}
constexpr bool IsSurrogate(char32_t codePoint) {
  return codePoint >= kFirstHighSurrogate && codePoint <= 0xDFFF;
}

// U+DC00 + byte stands for a byte from 0x80 to 0xFF that is not part of valid UTF-8.
constexpr char16_t kByteEscape = kFirstLowSurrogate;
constexpr bool IsEscapedByte(char32_t codePoint) {
  return codePoint >= kByteEscape + 0x80 && codePoint <= kByteEscape + 0xFF;
}

// The first character of a text. An unpaired surrogate is a character of its own.
struct Utf16Character {
  char32_t codePoint;
  std::size_t units;  // 1 or 2
};

// REQUIRES: the text is not empty.
constexpr Utf16Character NextUtf16(std::u16string_view text) {
  if (text.size() < 2 || !IsHighSurrogate(text[0]) || !IsLowSurrogate(text[1])) return {text[0], 1};
  const char32_t high = text[0] - char32_t{kFirstHighSurrogate};
  const char32_t low = text[1] - char32_t{kFirstLowSurrogate};
  return {kFirstSupplementary + (high << 10 | low), 2};
}

// Appends a code point, which may be a surrogate, to a text.
inline void AppendUtf16(std::u16string& text, char32_t codePoint) {
  if (codePoint < kFirstSupplementary) {
    text.push_back(static_cast<char16_t>(codePoint));
    return;
  }
  const char32_t rest = codePoint - kFirstSupplementary;
  text.push_back(static_cast<char16_t>(kFirstHighSurrogate + (rest >> 10)));
  text.push_back(static_cast<char16_t>(kFirstLowSurrogate + (rest & 0x3FF)));
}

}  // namespace tallowmere::text
