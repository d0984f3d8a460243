// The encodings that strings convert to and from: Mac Roman, ASCII, Latin-1, UTF-16, UTF-8.
#pragma once

#include <CoreFoundation/CoreFoundation.h>

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace tallowmere::foundation {

// The first character of a text, encoded.
struct EncodedCharacter {
  std::size_t units;  // UTF-16 units taken from the text, 1 or 2
  std::size_t size;   // bytes used, 1 to 4; 0 when the encoding lacks the character
  std::array<std::uint8_t, 4> bytes;
};

struct Encoding {
  CFStringEncoding id;
  std::size_t bytesPerUnit;  // upper bound, for each UTF-16 unit

  // Encodes the first character of a text. REQUIRES: the text is not empty.
  EncodedCharacter (*next)(std::u16string_view text);

  // Decodes bytes. Nullopt when they are not valid in the encoding.
  std::optional<std::u16string> (*decode)(std::string_view bytes);
};

// The encoding with this number, or null when it is not available.
const Encoding* FindEncoding(CFStringEncoding id);

// The numbers of all encodings, terminated by kCFStringEncodingInvalidId.
const CFStringEncoding* EncodingList();

// How much of a text was encoded.
struct EncodedLength {
  std::size_t units;  // of the text; all of them unless a character or a full buffer stopped it
  std::size_t bytes;  // written
};

// Encodes from the front into at most `capacity` bytes; no character is written in part. A
// character that the encoding lacks becomes `lossByte`; when that is 0, encoding stops there. With
// a null buffer nothing is written.
EncodedLength Encode(std::u16string_view text, const Encoding& encoding, std::uint8_t lossByte,
                     std::uint8_t* buffer, std::size_t capacity);

}  // namespace tallowmere::foundation
