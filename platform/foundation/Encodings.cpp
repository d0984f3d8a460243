#include "foundation/Encodings.h"

#include <algorithm>
#include <bit>
#include <cstring>

#include "text/MacRoman.h"
#include "text/Utf16.h"
#include "text/Utf8.h"

namespace tallowmere::foundation {
namespace {

using Decoded = std::optional<std::u16string>;

EncodedCharacter NextInMacRoman(std::u16string_view text) {
  const text::MacRomanStep step = text::NextMacRoman(text);
  if (!step.byte) return {step.units, 0, {}};
  return {step.units, 1, {*step.byte}};
}

Decoded DecodedMacRoman(std::string_view bytes) {
  return text::DecodeMacRoman(bytes);
}

// ASCII and Latin-1 are the first kCount code points of Unicode.
template <char32_t kCount>
EncodedCharacter NextInPrefixOfUnicode(std::u16string_view text) {
  const auto [codePoint, units] = text::NextUtf16(text);
  if (codePoint >= kCount) return {units, 0, {}};
  return {units, 1, {static_cast<std::uint8_t>(codePoint)}};
}

template <char32_t kCount>
Decoded DecodedPrefixOfUnicode(std::string_view bytes) {
  std::u16string text;
  text.reserve(bytes.size());
  for (const char byte : bytes) {
    const auto codePoint = static_cast<std::uint8_t>(byte);
    if (codePoint >= kCount) return std::nullopt;
    text.push_back(codePoint);
  }
  return text;
}

EncodedCharacter NextInUtf16(std::u16string_view text) {
  const std::size_t units = text::NextUtf16(text).units;
  EncodedCharacter character{units, units * sizeof(char16_t), {}};
  std::memcpy(character.bytes.data(), text.data(), character.size);
  return character;
}

Decoded DecodedUtf16(std::string_view bytes) {
  if (bytes.size() % sizeof(char16_t) != 0) return std::nullopt;
  std::u16string text(bytes.size() / sizeof(char16_t), u'\0');
  bytes.copy(reinterpret_cast<char*>(text.data()), bytes.size());
  return text;
}

EncodedCharacter NextInUtf8(std::u16string_view text) {
  const auto [codePoint, units] = text::NextUtf16(text);
  if (text::IsSurrogate(codePoint)) return {units, 0, {}};
  const text::Utf8Sequence sequence = text::EncodeUtf8(codePoint);
  return {units, sequence.length,
          std::bit_cast<std::array<std::uint8_t, std::size(sequence.bytes)>>(sequence.bytes)};
}

Decoded DecodedUtf8(std::string_view bytes) {
  std::u16string text;
  text.reserve(bytes.size());
  while (!bytes.empty()) {
    const text::Utf8Character character = text::NextUtf8(bytes);
    if (character.length == 0) return std::nullopt;
    text::AppendUtf16(text, character.codePoint);
    bytes.remove_prefix(character.length);
  }
  return text;
}

constexpr auto kEncodings = std::to_array<Encoding>({
    {kCFStringEncodingMacRoman, 1, NextInMacRoman, DecodedMacRoman},
    {kCFStringEncodingASCII, 1, NextInPrefixOfUnicode<0x80>, DecodedPrefixOfUnicode<0x80>},
    {kCFStringEncodingISOLatin1, 1, NextInPrefixOfUnicode<0x100>, DecodedPrefixOfUnicode<0x100>},
    {kCFStringEncodingUTF16, 2, NextInUtf16, DecodedUtf16},
    {kCFStringEncodingUTF8, 3, NextInUtf8, DecodedUtf8},
});

constexpr auto kList = [] {
  std::array<CFStringEncoding, kEncodings.size() + 1> list{};
  std::transform(kEncodings.begin(), kEncodings.end(), list.begin(),
                 [](const Encoding& encoding) { return encoding.id; });
  list.back() = kCFStringEncodingInvalidId;
  return list;
}();

}  // namespace

const Encoding* FindEncoding(CFStringEncoding id) {
  const auto* const found =
      std::find_if(kEncodings.begin(), kEncodings.end(),
                   [id](const Encoding& encoding) { return encoding.id == id; });
  return found == kEncodings.end() ? nullptr : found;
}

const CFStringEncoding* EncodingList() {
  return kList.data();
}

EncodedLength Encode(std::u16string_view text, const Encoding& encoding, std::uint8_t lossByte,
                     std::uint8_t* buffer, std::size_t capacity) {
  EncodedLength done{0, 0};
  while (done.units < text.size()) {
    EncodedCharacter character = encoding.next(text.substr(done.units));
    if (character.size == 0) {
      if (lossByte == 0) break;
      character = {character.units, 1, {lossByte}};
    }
    if (character.size > capacity - done.bytes) break;
    if (buffer != nullptr) {
      std::copy_n(character.bytes.begin(), character.size, buffer + done.bytes);
    }
    done.units += character.units;
    done.bytes += character.size;
  }
  return done;
}

}  // namespace tallowmere::foundation
