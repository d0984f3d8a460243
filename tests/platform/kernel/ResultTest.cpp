// Results with a value or an error.
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

TEST(Result, KeepsTheErrorOfTheCallThatFailed) {
  errno = EIO;
  const Result<int> failed = Error::OfLastCall();
  errno = 0;
  EXPECT_EQ(failed.Error().number, EIO);
}

TEST(Errors, ForMissingItemsDifferFromErrorsThatHideItems) {
  for (const int number : {ENOENT, ENOTDIR, ELOOP}) EXPECT_TRUE(MeansGone({number})) << number;
  for (const int number : {EACCES, EPERM, EIO, EMFILE}) EXPECT_FALSE(MeansGone({number})) << number;
  for (const int number : {EACCES, EPERM}) EXPECT_TRUE(MeansRefused({number})) << number;
  for (const int number : {ENOENT, EIO}) EXPECT_FALSE(MeansRefused({number})) << number;
  EXPECT_FALSE(MeansGone(kNoVolume) || MeansGone(kNoFolder));
}

}  // namespace
}  // namespace tallowmere::kernel
