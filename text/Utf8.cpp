#include "text/Utf8.h"

#include <cstdint>

#include "text/Utf16.h"

namespace tallowmere::text {
namespace {

std::uint8_t ByteAt(std::string_view bytes, std::size_t i) {
  return static_cast<std::uint8_t>(bytes[i]);
}

// Combines a lead or continuation byte's fixed bits with the value's bits.
char Byte(char32_t fixed, char32_t value) {
  return static_cast<char>(fixed | value);
}

char Continuation(char32_t codePoint, unsigned shift) {
  return Byte(0x80, codePoint >> shift & 0x3F);
}

}  // namespace

// Table 3-7 of the Unicode standard: the range of the second byte rules out overlong forms,
// surrogates and code points above U+10FFFF.
Utf8Character NextUtf8(std::string_view bytes) {
  const std::uint8_t lead = ByteAt(bytes, 0);
  if (lead < 0x80) return {lead, 1};
  if (lead < 0xC2 || lead > 0xF4) return {0, 0};
  const std::size_t length = lead < 0xE0 ? 2 : lead < 0xF0 ? 3 : 4;
  if (bytes.size() < length) return {0, 0};
  std::uint8_t low = 0x80;
  std::uint8_t high = 0xBF;
  if (lead == 0xE0) low = 0xA0;
  if (lead == 0xED) high = 0x9F;
  if (lead == 0xF0) low = 0x90;
  if (lead == 0xF4) high = 0x8F;
  char32_t codePoint = lead & (0x7Fu >> length);
  for (std::size_t k = 1; k < length; ++k) {
    const std::uint8_t next = ByteAt(bytes, k);
    if (next < low || next > high) return {0, 0};
    codePoint = codePoint << 6 | (next & 0x3Fu);
    low = 0x80;
    high = 0xBF;
  }
  return {codePoint, length};
}

Utf8Sequence EncodeUtf8(char32_t codePoint) {
  if (codePoint < 0x80) return {{Byte(0, codePoint)}, 1};
  if (codePoint < 0x800) return {{Byte(0xC0, codePoint >> 6), Continuation(codePoint, 0)}, 2};
  if (codePoint < kFirstSupplementary) {
    return {{Byte(0xE0, codePoint >> 12), Continuation(codePoint, 6), Continuation(codePoint, 0)},
            3};
  }
  return {{Byte(0xF0, codePoint >> 18), Continuation(codePoint, 12), Continuation(codePoint, 6),
           Continuation(codePoint, 0)},
          4};
}

}  // namespace tallowmere::text
