#include "kernel/Clock.h"

#include <ctime>

namespace tallowmere::kernel {

Nanoseconds NanosecondsOf(std::int64_t seconds, std::int64_t nanoseconds) {
  constexpr std::uint64_t kInASecond = 1'000'000'000;
  return static_cast<Nanoseconds>(static_cast<std::uint64_t>(seconds) * kInASecond +
                                  static_cast<std::uint64_t>(nanoseconds));
}

Nanoseconds Now() {
  timespec now{};
  clock_gettime(CLOCK_REALTIME, &now);
  return NanosecondsOf(now.tv_sec, now.tv_nsec);
}

}  // namespace tallowmere::kernel
