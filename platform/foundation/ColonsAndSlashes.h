// The one letter of difference between a Linux name and an HFS name.
#pragma once

#include <string>

namespace tallowmere::foundation {

// The name with every ':' turned into '/' and every '/' into ':', in bytes or in UTF-16.
template <typename Char>
std::basic_string<Char> ExchangeColonsAndSlashes(std::basic_string<Char> name) {
  for (Char& c : name) {
    if (c == Char{':'}) {
      c = Char{'/'};
    } else if (c == Char{'/'}) {
      c = Char{':'};
    }
  }
  return name;
}

}  // namespace tallowmere::foundation
