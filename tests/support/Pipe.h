// A pipe for a test.
#pragma once

#include <fcntl.h>
#include <unistd.h>

#include <array>
#include <cstdlib>

namespace tallowmere::test {

// The reading end and the writing end, which started programs do not inherit. The caller closes
// them.
inline std::array<int, 2> MakePipe() {
  std::array<int, 2> ends{};
  if (pipe2(ends.data(), O_CLOEXEC) != 0) std::abort();
  return ends;
}

}  // namespace tallowmere::test
