// Texts compared without regard to letter case.
#pragma once

#include <locale.h>
#include <strings.h>

#include <string_view>

namespace tallowmere::foundation {

// Whether two texts are equal but for the case of ASCII letters, as in the POSIX locale, whatever
// locale the program has chosen: in a Turkish one "I" and "i" are two letters. That locale, which
// POSIX calls "C" too, is there without memory and need not be given back.
inline bool EqualIgnoringCase(std::string_view first, std::string_view second) {
  return first.size() == second.size() && strncasecmp_l(first.data(), second.data(), first.size(),
                                                        newlocale(LC_ALL_MASK, "C", nullptr)) == 0;
}

}  // namespace tallowmere::foundation
