// Names in Pascal strings.
#pragma once

#include <MacTypes.h>

#include <algorithm>
#include <string_view>

namespace tallowmere::names {

// The text of a Pascal string, valid as long as that is.
inline std::string_view TextOfPascal(const unsigned char* string) {
  return {reinterpret_cast<const char*>(string + 1), string[0]};
}

// REQUIRES: the text has at most 255 bytes, and the destination room for one more.
inline void CopyToPascal(std::string_view text, StringPtr destination) {
  destination[0] = static_cast<unsigned char>(text.size());
  std::copy(text.begin(), text.end(), destination + 1);
}

}  // namespace tallowmere::names
