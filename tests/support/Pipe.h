// A pipe of the test's own.
#pragma once

#include <fcntl.h>
#include <unistd.h>

#include <array>
#include <cstdlib>

namespace tallowmere::test {

// The end to read from and the end to write to, which programs that are started do not inherit. To
// be closed by who asked.
inline std::array<int, 2> MakePipe() {
  std::array<int, 2> ends{};
  if (pipe2(ends.data(), O_CLOEXEC) != 0) std::abort();
  return ends;
}

}  // namespace tallowmere::test
