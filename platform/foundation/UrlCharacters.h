// The character classes of RFC 3986, section 2, for one byte each.
#pragma once

#include <cstdint>
#include <string_view>

namespace tallowmere::foundation {

constexpr bool IsAsciiLetter(char c) {
  return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z');
}
constexpr bool IsAsciiDigit(char c) {
  return c >= '0' && c <= '9';
}

constexpr bool IsUnreserved(char c) {
  return IsAsciiLetter(c) || IsAsciiDigit(c) ||
         std::string_view("-._~").find(c) != std::string_view::npos;
}
constexpr bool IsSubDelimiter(char c) {
  return std::string_view("!$&'()*+,;=").find(c) != std::string_view::npos;
}

// Characters that a path segment holds as they are: pchar without percent-encodings.
constexpr bool IsPathCharacter(char c) {
  return IsUnreserved(c) || IsSubDelimiter(c) || c == ':' || c == '@';
}

// The value of a hexadecimal digit, upper or lower case, or -1.
constexpr int HexValue(char c) {
  if (IsAsciiDigit(c)) return c - '0';
  if (c >= 'a' && c <= 'f') return c - 'a' + 10;
  if (c >= 'A' && c <= 'F') return c - 'A' + 10;
  return -1;
}

}  // namespace tallowmere::foundation
