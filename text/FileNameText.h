// Converts file names between the bytes that Linux stores and the UTF-16 that strings hold.
//
// A Linux name is any sequence of bytes without NUL and '/'. Valid UTF-8 (RFC 3629) decodes as
// such; every byte that is not part of valid UTF-8 becomes the lone surrogate U+DC00 + byte, U+DC80
// to U+DCFF. Nothing is normalised in either direction, so every name survives the round trip bytes
// → UTF-16 → bytes.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace tallowmere::text {

// The text of a name. Every sequence of bytes has one.
std::u16string TextOfFileName(std::string_view bytes);

// The bytes of a text. Nullopt when it has an unpaired surrogate other than U+DC80 to U+DCFF, which
// stands for no byte.
std::optional<std::string> FileNameOfText(std::u16string_view text);

}  // namespace tallowmere::text
