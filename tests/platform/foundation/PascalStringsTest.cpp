// Copies between Pascal strings and C strings.
#include <CoreServices/CoreServices.h>
#include <gtest/gtest.h>

#include <cstring>
#include <string>

namespace {

TEST(PascalStrings, CopyOfACStringHasItsLengthInFront) {
  Str255 pascal;
  c2pstrcpy(pascal, "Data");
  EXPECT_EQ(0, std::memcmp(pascal, "\4Data", 5));
}

TEST(PascalStrings, CopyOfACStringIsCutAt255Bytes) {
  Str255 pascal;
  c2pstrcpy(pascal, std::string(300, 'x').c_str());
  EXPECT_EQ(pascal[0], 255);
  EXPECT_EQ(pascal[255], 'x');
}

TEST(PascalStrings, EmptyTextHasLengthZero) {
  Str255 pascal;
  c2pstrcpy(pascal, "");
  EXPECT_EQ(pascal[0], 0);
  char text[256] = "old";
  p2cstrcpy(text, pascal);
  EXPECT_STREQ(text, "");
}

TEST(PascalStrings, LongestPascalStringBecomesACStringInItsOwnBuffer) {
  Str255 pascal;
  std::memset(pascal, 'x', sizeof pascal);
  pascal[0] = 255;
  char copy[256];
  p2cstrcpy(copy, pascal);
  EXPECT_EQ(std::string(copy), std::string(255, 'x'));
  P2CStr(pascal);
  EXPECT_EQ(0, std::memcmp(pascal, copy, sizeof copy));
}

}  // namespace
