// The one difference between the spelling of a Linux name and of an HFS name.
#pragma once

#include <string>

namespace tallowmere::foundation {

// The name with every ':' replaced by '/' and every '/' by ':', in bytes or in UTF-16.
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
