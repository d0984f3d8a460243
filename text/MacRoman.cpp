#include "text/MacRoman.h"

#include <algorithm>
#include <array>

#include "text/Utf16.h"

namespace tallowmere::text {
namespace {

// Bytes 0x80 to 0xFF; the lower half is ASCII. The mapping published by the Unicode Consortium for
// Mac Roman, with 0xDB as the euro sign.
constexpr std::array<char16_t, 128> kUpperHalf = {
    0x00C4, 0x00C5, 0x00C7, 0x00C9, 0x00D1, 0x00D6, 0x00DC, 0x00E1,  // 80
    0x00E0, 0x00E2, 0x00E4, 0x00E3, 0x00E5, 0x00E7, 0x00E9, 0x00E8,  // 88
    0x00EA, 0x00EB, 0x00ED, 0x00EC, 0x00EE, 0x00EF, 0x00F1, 0x00F3,  // 90
    0x00F2, 0x00F4, 0x00F6, 0x00F5, 0x00FA, 0x00F9, 0x00FB, 0x00FC,  // 98
    0x2020, 0x00B0, 0x00A2, 0x00A3, 0x00A7, 0x2022, 0x00B6, 0x00DF,  // A0
    0x00AE, 0x00A9, 0x2122, 0x00B4, 0x00A8, 0x2260, 0x00C6, 0x00D8,  // A8
    0x221E, 0x00B1, 0x2264, 0x2265, 0x00A5, 0x00B5, 0x2202, 0x2211,  // B0
    0x220F, 0x03C0, 0x222B, 0x00AA, 0x00BA, 0x03A9, 0x00E6, 0x00F8,  // B8
    0x00BF, 0x00A1, 0x00AC, 0x221A, 0x0192, 0x2248, 0x2206, 0x00AB,  // C0
    0x00BB, 0x2026, 0x00A0, 0x00C0, 0x00C3, 0x00D5, 0x0152, 0x0153,  // C8
    0x2013, 0x2014, 0x201C, 0x201D, 0x2018, 0x2019, 0x00F7, 0x25CA,  // D0
    0x00FF, 0x0178, 0x2044, 0x20AC, 0x2039, 0x203A, 0xFB01, 0xFB02,  // D8
    0x2021, 0x00B7, 0x201A, 0x201E, 0x2030, 0x00C2, 0x00CA, 0x00C1,  // E0
    0x00CB, 0x00C8, 0x00CD, 0x00CE, 0x00CF, 0x00CC, 0x00D3, 0x00D4,  // E8
    0xF8FF, 0x00D2, 0x00DA, 0x00DB, 0x00D9, 0x0131, 0x02C6, 0x02DC,  // F0
    0x00AF, 0x02D8, 0x02D9, 0x02DA, 0x00B8, 0x02DD, 0x02DB, 0x02C7,  // F8
};

struct AccentedLetter {
  char16_t letter;
  char16_t base;
  char16_t mark;
};

// The accented letters of kUpperHalf and their canonical decompositions, by code point.
constexpr auto kAccentedLetters = std::to_array<AccentedLetter>({
    {0x00C0, u'A', 0x0300}, {0x00C1, u'A', 0x0301}, {0x00C2, u'A', 0x0302}, {0x00C3, u'A', 0x0303},
    {0x00C4, u'A', 0x0308}, {0x00C5, u'A', 0x030A}, {0x00C7, u'C', 0x0327}, {0x00C8, u'E', 0x0300},
    {0x00C9, u'E', 0x0301}, {0x00CA, u'E', 0x0302}, {0x00CB, u'E', 0x0308}, {0x00CC, u'I', 0x0300},
    {0x00CD, u'I', 0x0301}, {0x00CE, u'I', 0x0302}, {0x00CF, u'I', 0x0308}, {0x00D1, u'N', 0x0303},
    {0x00D2, u'O', 0x0300}, {0x00D3, u'O', 0x0301}, {0x00D4, u'O', 0x0302}, {0x00D5, u'O', 0x0303},
    {0x00D6, u'O', 0x0308}, {0x00D9, u'U', 0x0300}, {0x00DA, u'U', 0x0301}, {0x00DB, u'U', 0x0302},
    {0x00DC, u'U', 0x0308}, {0x00E0, u'a', 0x0300}, {0x00E1, u'a', 0x0301}, {0x00E2, u'a', 0x0302},
    {0x00E3, u'a', 0x0303}, {0x00E4, u'a', 0x0308}, {0x00E5, u'a', 0x030A}, {0x00E7, u'c', 0x0327},
    {0x00E8, u'e', 0x0300}, {0x00E9, u'e', 0x0301}, {0x00EA, u'e', 0x0302}, {0x00EB, u'e', 0x0308},
    {0x00EC, u'i', 0x0300}, {0x00ED, u'i', 0x0301}, {0x00EE, u'i', 0x0302}, {0x00EF, u'i', 0x0308},
    {0x00F1, u'n', 0x0303}, {0x00F2, u'o', 0x0300}, {0x00F3, u'o', 0x0301}, {0x00F4, u'o', 0x0302},
    {0x00F5, u'o', 0x0303}, {0x00F6, u'o', 0x0308}, {0x00F9, u'u', 0x0300}, {0x00FA, u'u', 0x0301},
    {0x00FB, u'u', 0x0302}, {0x00FC, u'u', 0x0308}, {0x00FF, u'y', 0x0308}, {0x0178, u'Y', 0x0308},
});

struct ByteOfCharacter {
  char16_t character;
  std::uint8_t byte;
};

// The inverse of kUpperHalf, by code point.
constexpr auto kBytes = [] {
  std::array<ByteOfCharacter, kUpperHalf.size()> bytes{};
  for (std::size_t i = 0; i < bytes.size(); ++i) {
    bytes[i] = {kUpperHalf[i], static_cast<std::uint8_t>(0x80 + i)};
  }
  std::sort(bytes.begin(), bytes.end(),
            [](const auto& a, const auto& b) { return a.character < b.character; });
  return bytes;
}();

// Whether the unit is in U+0300 to U+036F, the block of all marks of kAccentedLetters.
bool IsCombiningMark(char16_t unit) {
  return unit >= 0x0300 && unit <= 0x036F;
}

}  // namespace

char16_t MacRomanToUnicode(std::uint8_t byte) {
  return byte < 0x80 ? byte : kUpperHalf[byte - 0x80u];
}

std::optional<std::uint8_t> MacRomanFromUnicode(char16_t character) {
  if (character < 0x80) return static_cast<std::uint8_t>(character);
  const auto found =
      std::lower_bound(kBytes.begin(), kBytes.end(), character,
                       [](const auto& entry, char16_t wanted) { return entry.character < wanted; });
  if (found == kBytes.end() || found->character != character) return std::nullopt;
  return found->byte;
}

MacRomanStep NextMacRoman(std::u16string_view text) {
  const char16_t first = text[0];
  if (text.size() > 1 && IsCombiningMark(text[1])) {
    for (const AccentedLetter& letter : kAccentedLetters) {
      if (letter.base == first && letter.mark == text[1]) {
        return {MacRomanFromUnicode(letter.letter), 2};
      }
    }
  }
  if (text.size() > 1 && IsHighSurrogate(first) && IsLowSurrogate(text[1])) return {{}, 2};
  return {MacRomanFromUnicode(first), 1};
}

std::optional<std::string> EncodeMacRoman(std::u16string_view text) {
  if (IsAllAscii(text)) return std::string(text.begin(), text.end());
  std::string bytes;
  bytes.reserve(text.size());
  while (!text.empty()) {
    const MacRomanStep step = NextMacRoman(text);
    if (!step.byte) return std::nullopt;
    bytes.push_back(static_cast<char>(*step.byte));
    text.remove_prefix(step.units);
  }
  return bytes;
}

std::u16string DecodeMacRoman(std::string_view bytes) {
  if (IsAllAscii(bytes)) return {bytes.begin(), bytes.end()};
  std::u16string text;
  text.reserve(bytes.size());
  for (const char byte : bytes) text.push_back(MacRomanToUnicode(static_cast<std::uint8_t>(byte)));
  return text;
}

std::u16string DecomposeMacRoman(std::u16string_view text) {
  std::u16string decomposed;
  decomposed.reserve(text.size() * 2);
  for (const char16_t unit : text) {
    const auto begin = IsAscii(unit) ? kAccentedLetters.end() : kAccentedLetters.begin();
    const auto letter =
        std::find_if(begin, kAccentedLetters.end(),
                     [unit](const AccentedLetter& entry) { return entry.letter == unit; });
    if (letter == kAccentedLetters.end()) {
      decomposed.push_back(unit);
    } else {
      decomposed.push_back(letter->base);
      decomposed.push_back(letter->mark);
    }
  }
  return decomposed;
}

}  // namespace tallowmere::text
