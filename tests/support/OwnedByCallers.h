// What the callers of this process own of its platform.
#pragma once

#include <cstddef>
#include <string>
#include <utility>

#include "calls/Process.h"

namespace tallowmere::test {

inline std::size_t LiveHandles() {
  return calls::ThisProcess().handles.Live();
}

inline std::size_t OpenInstances() {
  return calls::ThisProcess().components.OpenInstances();
}

// A new block with these bytes.
inline Handle NewHandleWith(std::string bytes) {
  return calls::ThisProcess().handles.Make(std::move(bytes));
}

}  // namespace tallowmere::test
