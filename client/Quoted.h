// Text in the messages of errors.
#pragma once

#include <string>
#include <string_view>

namespace tallowmere {

inline std::string Quoted(std::string_view text) {
  return '"' + std::string(text) + '"';
}

}  // namespace tallowmere
