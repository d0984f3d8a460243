// The clock and its times in nanoseconds.
#include <gtest/gtest.h>

#include <chrono>
#include <limits>

#include "kernel/Clock.h"
#include "support/OtherKernel.h"

namespace tallowmere::kernel {
namespace {

TEST(Clock, CountsNanosecondsSince1970) {
  EXPECT_EQ(NanosecondsOf(0, 0), 0);
  EXPECT_EQ(NanosecondsOf(1'700'000'000, 123'456'789), 1'700'000'000'123'456'789);
  EXPECT_EQ(NanosecondsOf(-1, 999'999'999), -1);
}

TEST(Clock, GivesDistinctNumbersToTimesOutOfRange) {
  constexpr std::int64_t kLast = std::numeric_limits<std::int64_t>::max();
  EXPECT_NE(NanosecondsOf(kLast, 0), NanosecondsOf(kLast, 1));
  EXPECT_NE(NanosecondsOf(kLast, 0), NanosecondsOf(kLast - 1, 0));
}

TEST(Clock, IsTheTimeOfDay) {
  const auto since1970 = [] { return std::chrono::system_clock::now().time_since_epoch().count(); };
  const Nanoseconds before = since1970();
  const Nanoseconds now = Now();
  EXPECT_LE(before, now);
  EXPECT_LE(now, since1970());
  const test::OtherTime later(std::chrono::hours(1));
  EXPECT_GE(Now(), now + std::chrono::nanoseconds(std::chrono::hours(1)).count());
}

}  // namespace
}  // namespace tallowmere::kernel
