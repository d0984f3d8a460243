// The time of day.
#pragma once

#include <cstdint>

namespace tallowmere::kernel {

// A time in nanoseconds since 1970. Outside the years 1677 to 2262 the number wraps, so that
// different times still have different numbers.
using Nanoseconds = std::int64_t;

Nanoseconds NanosecondsOf(std::int64_t seconds, std::int64_t nanoseconds);

Nanoseconds Now();

}  // namespace tallowmere::kernel
