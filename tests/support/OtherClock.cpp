// Preloaded into a program, shows it another time of day: $TALLOWMERE_CLOCK seconds since 1970 on
// its first call, and on each further call $TALLOWMERE_CLOCK_STEP seconds more, which may be
// negative.
#include <dlfcn.h>
#include <sys/time.h>
#include <time.h>

#include <cstdlib>

namespace {

time_t Number(const char* variable) {
  const char* const text = std::getenv(variable);
  return text == nullptr ? 0 : std::atoll(text);
}

time_t NextTime() {
  static time_t now = Number("TALLOWMERE_CLOCK");
  static const time_t step = Number("TALLOWMERE_CLOCK_STEP");
  const time_t shown = now;
  now += step;
  return shown;
}

}  // namespace

// NOLINTBEGIN(readability-inconsistent-declaration-parameter-name): theirs are reserved.

extern "C" int clock_gettime(clockid_t clock, timespec* shown) noexcept {
  if (clock != CLOCK_REALTIME && clock != CLOCK_REALTIME_COARSE) {
    using Call = int (*)(clockid_t, timespec*);
    static const auto real = reinterpret_cast<Call>(dlsym(RTLD_NEXT, "clock_gettime"));
    return real(clock, shown);
  }
  *shown = {NextTime(), 0};
  return 0;
}

extern "C" int gettimeofday(timeval* shown, void*) noexcept {
  *shown = {NextTime(), 0};
  return 0;
}

extern "C" time_t time(time_t* shown) noexcept {
  const time_t now = NextTime();
  if (shown != nullptr) *shown = now;
  return now;
}

// NOLINTEND(readability-inconsistent-declaration-parameter-name)
