#include "foundation/FileNameText.h"

#include <cstddef>
#include <cstdint>

#include "foundation/Utf16.h"

namespace tallowmere::foundation {
namespace {

constexpr char32_t kFirstSupplementary = 0x10000;

std::uint8_t ByteAt(std::string_view bytes, std::size_t i) {
  return static_cast<std::uint8_t>(bytes[i]);
}

struct Decoded {
  char32_t codePoint;
  std::size_t length;  // bytes taken; 0 when no valid sequence begins here
};

// Table 3-7 of the Unicode standard: the second byte's range is what rules out overlong forms,
// surrogates and code points above U+10FFFF.
Decoded DecodeUtf8At(std::string_view bytes, std::size_t i) {
  const std::uint8_t lead = ByteAt(bytes, i);
  if (lead < 0x80) return {lead, 1};
  if (lead < 0xC2 || lead > 0xF4) return {0, 0};
  const std::size_t length = lead < 0xE0 ? 2 : lead < 0xF0 ? 3 : 4;
  if (bytes.size() - i < length) return {0, 0};
  std::uint8_t low = 0x80;
  std::uint8_t high = 0xBF;
  if (lead == 0xE0) low = 0xA0;
  if (lead == 0xED) high = 0x9F;
  if (lead == 0xF0) low = 0x90;
  if (lead == 0xF4) high = 0x8F;
  char32_t codePoint = lead & (0x7Fu >> length);
  for (std::size_t k = 1; k < length; ++k) {
    const std::uint8_t next = ByteAt(bytes, i + k);
    if (next < low || next > high) return {0, 0};
    codePoint = codePoint << 6 | (next & 0x3Fu);
    low = 0x80;
    high = 0xBF;
  }
  return {codePoint, length};
}

void AppendUtf8(std::string& bytes, char32_t codePoint) {
  const auto add = [&bytes](char32_t value) { bytes.push_back(static_cast<char>(value)); };
  if (codePoint < 0x80) {
    add(codePoint);
  } else if (codePoint < 0x800) {
    add(0xC0 | codePoint >> 6);
    add(0x80 | (codePoint & 0x3F));
  } else if (codePoint < kFirstSupplementary) {
    add(0xE0 | codePoint >> 12);
    add(0x80 | (codePoint >> 6 & 0x3F));
    add(0x80 | (codePoint & 0x3F));
  } else {
    add(0xF0 | codePoint >> 18);
    add(0x80 | (codePoint >> 12 & 0x3F));
    add(0x80 | (codePoint >> 6 & 0x3F));
    add(0x80 | (codePoint & 0x3F));
  }
}

}  // namespace

std::u16string TextOfFileName(std::string_view bytes) {
  std::u16string text;
  text.reserve(bytes.size());
  for (std::size_t i = 0; i < bytes.size();) {
    const Decoded decoded = DecodeUtf8At(bytes, i);
    if (decoded.length == 0) {
      text.push_back(static_cast<char16_t>(kByteEscape + ByteAt(bytes, i)));
      ++i;
      continue;
    }
    if (decoded.codePoint < kFirstSupplementary) {
      text.push_back(static_cast<char16_t>(decoded.codePoint));
    } else {
      const char32_t rest = decoded.codePoint - kFirstSupplementary;
      text.push_back(static_cast<char16_t>(0xD800 + (rest >> 10)));
      text.push_back(static_cast<char16_t>(0xDC00 + (rest & 0x3FF)));
    }
    i += decoded.length;
  }
  return text;
}

std::optional<std::string> FileNameOfText(std::u16string_view text) {
  std::string bytes;
  bytes.reserve(text.size());
  for (std::size_t i = 0; i < text.size(); ++i) {
    const char16_t unit = text[i];
    if (IsHighSurrogate(unit) && i + 1 < text.size() && IsLowSurrogate(text[i + 1])) {
      const char32_t high = unit - 0xD800u;
      const char32_t low = text[i + 1] - 0xDC00u;
      AppendUtf8(bytes, kFirstSupplementary + (high << 10 | low));
      ++i;
    } else if (IsEscapedByte(unit)) {
      bytes.push_back(static_cast<char>(unit - kByteEscape));
    } else if (IsHighSurrogate(unit) || IsLowSurrogate(unit)) {
      return std::nullopt;
    } else {
      AppendUtf8(bytes, unit);
    }
  }
  return bytes;
}

}  // namespace tallowmere::foundation
