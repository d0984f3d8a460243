#include "foundation/PascalStrings.h"

#include <CoreServices/CoreServices.h>

#include <cstddef>
#include <cstring>

using tallowmere::foundation::kLongestPascalString;

void c2pstrcpy(StringPtr destination, const char* source) {
  const std::size_t length = strnlen(source, kLongestPascalString);
  std::memmove(destination + 1, source, length);
  destination[0] = static_cast<unsigned char>(length);
}

void p2cstrcpy(char* destination, ConstStr255Param source) {
  const std::size_t length = source[0];
  std::memmove(destination, source + 1, length);
  destination[length] = '\0';
}

void P2CStr(StringPtr string) {
  const std::size_t length = string[0];
  std::memmove(string, string + 1, length);
  string[length] = '\0';
}
