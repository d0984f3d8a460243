// Surrogates of UTF-16, and the ones among them that stand for bytes of a file name.
#pragma once

namespace tallowmere::foundation {

constexpr bool IsHighSurrogate(char16_t unit) {
  return unit >= 0xD800 && unit <= 0xDBFF;
}
constexpr bool IsLowSurrogate(char16_t unit) {
  return unit >= 0xDC00 && unit <= 0xDFFF;
}

// U+DC00 + byte stands for a byte from 0x80 to 0xFF that is not part of valid UTF-8.
constexpr char16_t kByteEscape = 0xDC00;
constexpr bool IsEscapedByte(char16_t unit) {
  return unit >= kByteEscape + 0x80 && unit <= kByteEscape + 0xFF;
}

}  // namespace tallowmere::foundation
