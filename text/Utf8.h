// One character of UTF-8 (RFC 3629) at a time.
#pragma once

#include <array>
#include <cstddef>
#include <string_view>

namespace tallowmere::text {

struct Utf8Character {
  char32_t codePoint;
  std::size_t length;  // 1 to 4 bytes; 0 when the bytes do not begin with a valid sequence
};

// The first character of `bytes`. Overlong forms, surrogates and code points above U+10FFFF are
// invalid. REQUIRES: `bytes` is not empty.
Utf8Character NextUtf8(std::string_view bytes);

struct Utf8Sequence {
  std::array<char, 4> bytes;
  std::size_t length;  // 1 to 4
  std::string_view View() const { return {bytes.data(), length}; }
};

// REQUIRES: the code point is at most U+10FFFF and not a surrogate.
Utf8Sequence EncodeUtf8(char32_t codePoint);

}  // namespace tallowmere::text
