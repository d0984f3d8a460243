#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>
#include <tallowmere/Types.h>

#include "support/Wire.h"

namespace tallowmere {
namespace {

TEST(FSSpecBytes, AreTheRecordOfTheProtocol) {
  EXPECT_EQ(EncodeFSSpec({-27, 0x01020304, "a name"}), test::Record(-27, 0x01020304, "a name"));
}

RC_GTEST_PROP(FSSpecBytes, GiveTheRecordBack, ()) {
  auto name = *rc::gen::container<std::string>(rc::gen::arbitrary<char>());
  name.resize(std::min<std::size_t>(name.size(), 63));
  const FSSpec spec{*rc::gen::arbitrary<std::int16_t>(), *rc::gen::arbitrary<std::int32_t>(), name};
  RC_ASSERT(DecodeFSSpec(EncodeFSSpec(spec)) == spec);
}

TEST(FSSpecBytes, WhatLiesBehindTheNameDoesNotCount) {
  std::string bytes = test::Record(-27, 2, "a");
  bytes.back() = 'x';
  EXPECT_EQ(DecodeFSSpec(bytes), (FSSpec{-27, 2, "a"}));
}

TEST(FSSpecBytes, OfAnotherNumberOrWithALongerNameAreNoRecord) {
  const std::string bytes = test::Record(-27, 2, std::string(63, 'n'));
  EXPECT_TRUE(DecodeFSSpec(bytes));
  EXPECT_FALSE(DecodeFSSpec(bytes.substr(0, 69)));
  EXPECT_FALSE(DecodeFSSpec(bytes + 'x'));
  EXPECT_FALSE(DecodeFSSpec(""));
  std::string tooLong = bytes;
  tooLong[6] = 64;
  EXPECT_FALSE(DecodeFSSpec(tooLong));
}

}  // namespace
}  // namespace tallowmere
