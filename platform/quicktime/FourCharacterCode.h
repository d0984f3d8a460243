// Four-character codes, spelled as characters.
#pragma once

#include <QuickTime/QuickTime.h>

namespace tallowmere::quicktime {

consteval OSType FourCharacterCode(const char (&text)[5]) {
  OSType code = 0;
  for (int i = 0; i < 4; ++i) code = code << 8 | static_cast<unsigned char>(text[i]);
  return code;
}

}  // namespace tallowmere::quicktime
