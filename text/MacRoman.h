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

// The byte of one character (a Basic Multilingual Plane code point), or none.
std::optional<std::uint8_t> MacRomanFromUnicode(char16_t character);

// One step of encoding a text: the byte for what stands at its beginning and how many UTF-16 units
// that took. A base letter followed by the combining mark of a Mac Roman letter is taken together
// and gives the precomposed letter's byte. The byte is none for what Mac Roman lacks (a surrogate
// pair is taken whole). REQUIRES: text is not empty.
struct MacRomanStep {
  std::optional<std::uint8_t> byte;
  std::size_t units;  // 1 or 2
};
MacRomanStep NextMacRoman(std::u16string_view text);

// The whole text in Mac Roman, or none when any of it has no byte.
std::optional<std::string> EncodeMacRoman(std::u16string_view text);

// The text of Mac Roman bytes.
std::u16string DecodeMacRoman(std::string_view bytes);

// The text with every accented Mac Roman letter split into base letter and combining mark
// (canonical decomposition).
std::u16string DecomposeMacRoman(std::u16string_view text);

}  // namespace tallowmere::text
