#include <gtest/gtest.h>

#include <memory>
#include <string>

#include "kernel/Result.h"

namespace tallowmere::kernel {
namespace {

Result<std::unique_ptr<std::string>> Make(bool works) {
  if (!works) return Error{ENOENT};
  return std::make_unique<std::string>("made");
}

Result<void> Do(bool works) {
  if (!works) return Error{EPERM};
  return Ok{};
}

TEST(Result, HasAValueOrAnError) {
  const auto made = Make(true);
  ASSERT_TRUE(made);
  EXPECT_EQ(**made, "made");
  EXPECT_EQ(made->get()->size(), 4u);
  EXPECT_EQ(made.Error().number, 0);
  const auto failed = Make(false);
  EXPECT_FALSE(failed);
  EXPECT_EQ(failed.Error().number, ENOENT);
}

TEST(Result, GivesItsValueAway) {
  const std::unique_ptr<std::string> taken = *Make(true);
  EXPECT_EQ(*taken, "made");
}

TEST(Result, WithoutAValueIsAnErrorOrNone) {
  EXPECT_TRUE(Do(true));
  EXPECT_EQ(Do(true).Error().number, 0);
  EXPECT_FALSE(Do(false));
  EXPECT_EQ(Do(false).Error().number, EPERM);
}

TEST(Result, KeepsTheErrorOfTheCallThatFailed) {
  errno = EIO;
  const Result<int> failed = LastError();
  errno = 0;
  EXPECT_EQ(failed.Error().number, EIO);
}

}  // namespace
}  // namespace tallowmere::kernel
