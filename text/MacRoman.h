// The Mac Roman encoding in its euro-sign revision (byte 0xDB is U+20AC), all 256 bytes assigned.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace tallowmere::text {

// The character of a byte, always precomposed.
char16_t MacRomanToUnicode(std::uint8_t byte);

// The byte of one character (a Basic Multilingual Plane code point). Nullopt when Mac Roman lacks
// it.
std::optional<std::uint8_t> MacRomanFromUnicode(char16_t character);

// One step of encoding a text: the byte for its beginning, and the number of UTF-16 units that this
// takes. A base letter followed by the combining mark of a Mac Roman letter is taken together and
// gives the precomposed letter's byte. The byte is nullopt for a character that Mac Roman lacks (a
// surrogate pair is taken whole). REQUIRES: the text is not empty.
struct MacRomanStep {
  std::optional<std::uint8_t> byte;
  std::size_t units;  // 1 or 2
};
MacRomanStep NextMacRoman(std::u16string_view text);

// The whole text in Mac Roman. Nullopt when any part of it has no byte.
std::optional<std::string> EncodeMacRoman(std::u16string_view text);

// The text of Mac Roman bytes.
std::u16string DecodeMacRoman(std::string_view bytes);

// The text with every accented Mac Roman letter split into base letter and combining mark
// (canonical decomposition).
std::u16string DecomposeMacRoman(std::u16string_view text);

}  // namespace tallowmere::text
