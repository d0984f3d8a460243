#include <gtest/gtest.h>
#include <tallowmere/Types.h>

namespace tallowmere {
namespace {

TEST(HFSNameText, EveryNameHasATextAndComesBack) {
  std::string name;
  for (int byte = 0; byte < 256; ++byte) name.push_back(static_cast<char>(byte));
  EXPECT_EQ(HFSNameOfUtf8(Utf8OfHFSName(name)), name);
}

TEST(HFSNameText, ATextIsPrecomposed) {
  EXPECT_EQ(Utf8OfHFSName("\x8E"), "\u00E9");
}

TEST(HFSNameText, ATextMayBeDecomposed) {
  EXPECT_EQ(HFSNameOfUtf8("cafe\u0301"), "caf\x8E");
  EXPECT_EQ(HFSNameOfUtf8("caf\u00E9"), "caf\x8E");
}

TEST(HFSNameText, WhatMacRomanLacksHasNoName) {
  EXPECT_EQ(HFSNameOfUtf8("\u0416"), std::nullopt);
  EXPECT_EQ(HFSNameOfUtf8("\U0001F600"), std::nullopt);
}

TEST(HFSNameText, WhatIsNoUtf8HasNoName) {
  for (const char* text : {"\x80", "a\xE9", "\xC3", "\xED\xA0\x80", "\xC1\x81"}) {
    EXPECT_EQ(HFSNameOfUtf8(text), std::nullopt);
  }
}

}  // namespace
}  // namespace tallowmere
