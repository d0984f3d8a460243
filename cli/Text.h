// Names and paths as text for a person.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace tallowmere::cli {

// The text with each byte of a control character, and each byte outside UTF-8, written as a
// backslash and three octal digits, so that no name can break a table or control a terminal.
std::string Printable(std::string_view text);

// The text for a message: its beginning and its size when it is longer than any path.
std::string Shortened(std::string_view text);

// The text with U+FFFD for each byte that is not UTF-8.
std::string Utf8OfAnyBytes(std::string_view bytes);

// Why a text cannot stand for HFS names, for a message.
std::string WhyNotHFSNames(std::string_view text);

// The number of characters in a UTF-8 text.
std::size_t CharacterCount(std::string_view text);

}  // namespace tallowmere::cli
