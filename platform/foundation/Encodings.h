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

// One character of a text in an encoding.
struct EncodedCharacter {
  std::size_t units;  // UTF-16 units taken from the text, 1 or 2
  std::size_t size;   // bytes used, 1 to 4; 0 when the encoding lacks the character
  std::array<std::uint8_t, 4> bytes;
};

struct Encoding {
  CFStringEncoding id;
  std::size_t bytesPerUnit;  // at most, for each UTF-16 unit

  // The character that a text begins with. REQUIRES: the text is not empty.
  EncodedCharacter (*next)(std::u16string_view text);

  // The text of bytes; none when they are not valid in the encoding.
  std::optional<std::u16string> (*decode)(std::string_view bytes);
};

// The encoding with a number, or null when it is not available.
const Encoding* FindEncoding(CFStringEncoding id);

// The numbers of all encodings, ended by kCFStringEncodingInvalidId.
const CFStringEncoding* EncodingList();

// How far an encoding of a text came.
struct EncodedLength {
  std::size_t units;  // of the text, all of them when nothing stopped it
  std::size_t bytes;  // written
};

// Encodes from the front into at most `capacity` bytes, a character wholly or not at all. A
// character that the encoding lacks becomes `lossByte`, or stops it when that is 0. With a null
// buffer nothing is written.
EncodedLength Encode(std::u16string_view text, const Encoding& encoding, std::uint8_t lossByte,
                     std::uint8_t* buffer, std::size_t capacity);

}  // namespace tallowmere::foundation
