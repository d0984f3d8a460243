#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include "cli/Records.h"

namespace tallowmere::cli {
namespace {

TEST(Records, AreWrittenAsVolumeParentAndName) {
  EXPECT_EQ(TextOfFSSpec({-27, 19, "host\x8E"}), "-27:19:host\xC3\xA9");
}

TEST(Records, AreWrittenAsThe70BytesOfTheProtocol) {
  EXPECT_EQ(HexOfRecord({-27, 0x01020304, "ab"}),
            "e5ff"
            "04030201"
            "02"
            "6162" +
                std::string(2 * 61, '0'));
}

RC_GTEST_PROP(Records, ComeBackFromBothForms, ()) {
  auto name = *rc::gen::container<std::string>(rc::gen::arbitrary<char>());
  name.resize(std::min<std::size_t>(name.size(), 63));
  const FSSpec spec{*rc::gen::arbitrary<std::int16_t>(), *rc::gen::arbitrary<std::int32_t>(), name};
  RC_ASSERT(ReadRecord(TextOfFSSpec(spec)) == spec);
  RC_ASSERT(ReadRecord(HexOfRecord(spec)) == spec);
}

TEST(Records, AParentIDIsTakenSignedOrUnsigned) {
  EXPECT_EQ(ReadRecord("1:4294967295:a"), (FSSpec{1, -1, "a"}));
  EXPECT_EQ(ReadRecord("1:-2147483648:a"), (FSSpec{1, -2147483647 - 1, "a"}));
}

TEST(Records, ANameMayHoldColonsAndBeEmpty) {
  EXPECT_EQ(ReadRecord("1:2:a:b"), (FSSpec{1, 2, "a:b"}));
  EXPECT_EQ(ReadRecord("1:2:"), (FSSpec{1, 2, ""}));
}

// A text as long as a record in hexadecimal.
TEST(Records, ATextOf140BytesIsTakenAsText) {
  std::string text = "1:2:a";
  std::string name = "a";
  for (int i = 0; i < 45; ++i) {
    text += "\xE2\x89\xA0";
    name += '\xAD';
  }
  ASSERT_EQ(text.size(), 140u);
  EXPECT_EQ(ReadRecord(text), (FSSpec{1, 2, name}));
}

TEST(Records, CapitalHexadecimalDigitsAreTaken) {
  const std::string digits =
      "E5FF0200000001"
      "6A" +
      std::string(2 * 62, '0');
  EXPECT_EQ(ReadRecord(digits), (FSSpec{-27, 2, "j"}));
}

TEST(Records, WhatIsNoneIsNotTaken) {
  const std::string whole = HexOfRecord({-27, 2, "a"});
  for (const std::string& text :
       {std::string(), std::string("1:2"), std::string("x:2:a"), std::string("1:y:a"),
        std::string("1 :2:a"), std::string("+1:2:a"), std::string("32768:2:a"),
        std::string("-32769:2:a"), std::string("1:4294967296:a"), std::string("1:-2147483649:a"),
        std::string("1::a"), std::string(":2:a"), "1:2:" + std::string(64, 'n'),
        std::string("1:2:\xE6\x97\xA5"), std::string("1:2:\xFF"), whole.substr(2), whole + "00",
        "g" + whole.substr(1), whole.substr(0, 12) + "40" + whole.substr(14)}) {
    EXPECT_EQ(ReadRecord(text), std::nullopt) << text;
  }
}

}  // namespace
}  // namespace tallowmere::cli
