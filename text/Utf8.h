// One character of UTF-8 (RFC 3629) at a time.
#pragma once

#include <array>
#include <cstddef>
#include <string_view>

namespace tallowmere::text {

struct Utf8Character {
  char32_t codePoint;
  std::size_t length;  // bytes taken, 1 to 4; 0 when the bytes begin with no valid sequence
};

// The character that `bytes` begin with. Overlong forms, surrogates and code points above U+10FFFF
// are not valid. REQUIRES: bytes is not empty.
Utf8Character NextUtf8(std::string_view bytes);

struct Utf8Sequence {
  std::array<char, 4> bytes;
  std::size_t length;  // 1 to 4
  std::string_view View() const { return {bytes.data(), length}; }
};

// REQUIRES: codePoint is at most U+10FFFF and no surrogate.
Utf8Sequence EncodeUtf8(char32_t codePoint);

}  // namespace tallowmere::text
