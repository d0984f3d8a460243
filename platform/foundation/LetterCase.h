// Comparing texts without regard to letter case.
#pragma once

#include <locale.h>
#include <strings.h>

#include <string_view>

namespace tallowmere::foundation {

// Whether two texts are equal except for the case of ASCII letters. Uses the POSIX locale whatever
// locale the program has set: in a Turkish one "I" and "i" are two different letters. That locale,
// which POSIX also calls "C", takes no memory and need not be freed.
inline bool EqualIgnoringCase(std::string_view first, std::string_view second) {
  return first.size() == second.size() && strncasecmp_l(first.data(), second.data(), first.size(),
                                                        newlocale(LC_ALL_MASK, "C", nullptr)) == 0;
}

}  // namespace tallowmere::foundation
