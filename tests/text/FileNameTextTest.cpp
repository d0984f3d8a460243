// Conversion of file names to UTF-16 and back, including names that are not UTF-8.
#include <gtest/gtest.h>

#include "text/FileNameText.h"

namespace tallowmere::text {
namespace {

using namespace std::string_literals;

TEST(FileNameText, ValidUtf8DecodesAsSuch) {
  EXPECT_EQ(TextOfFileName("a\xC3\xA9\xE6\x97\xA5\xF0\x9F\x98\x80"), u"a\u00E9\u65E5\U0001F600");
}

TEST(FileNameText, DoesNotNormalise) {
  EXPECT_EQ(TextOfFileName("e\xCC\x81"), u"e\u0301");
  EXPECT_EQ(FileNameOfText(u"e\u0301"), "e\xCC\x81");
}

TEST(FileNameText, EachByteOutsideValidUtf8BecomesALoneSurrogate) {
  EXPECT_EQ(TextOfFileName("\xFF"
                           "a"),
            u"\xDCFF"
            u"a");
  EXPECT_EQ(TextOfFileName("\xE6\x97"), u"\xDCE6\xDC97");                      // cut short
  EXPECT_EQ(TextOfFileName("\xC0\xAF"), u"\xDCC0\xDCAF");                      // overlong
  EXPECT_EQ(TextOfFileName("\xED\xA0\x80"), u"\xDCED\xDCA0\xDC80");            // a surrogate
  EXPECT_EQ(TextOfFileName("\xF4\x90\x80\x80"), u"\xDCF4\xDC90\xDC80\xDC80");  // above U+10FFFF
  EXPECT_EQ(TextOfFileName("\xE0\x9F\xBF"), u"\xDCE0\xDC9F\xDCBF");
  EXPECT_EQ(TextOfFileName("\xF0\x8F\xBF\xBF"), u"\xDCF0\xDC8F\xDCBF\xDCBF");
}

TEST(FileNameText, EveryNameOfTwoBytesSurvivesARoundTrip) {
  for (unsigned first = 0; first < 256; ++first) {
    for (unsigned second = 0; second < 256; ++second) {
      const std::string name = {static_cast<char>(first), static_cast<char>(second)};
      EXPECT_EQ(FileNameOfText(TextOfFileName(name)), name);
    }
  }
}

TEST(FileNameText, EveryCodePointSurvivesARoundTrip) {
  for (char32_t codePoint = 1; codePoint <= 0x10FFFF; ++codePoint) {
    if (codePoint >= 0xD800 && codePoint <= 0xDFFF) continue;
    std::u16string text;
    if (codePoint < 0x10000) {
      text = {static_cast<char16_t>(codePoint)};
    } else {
      text = {static_cast<char16_t>(0xD800 + ((codePoint - 0x10000) >> 10)),
              static_cast<char16_t>(0xDC00 + ((codePoint - 0x10000) & 0x3FF))};
    }
    const auto bytes = FileNameOfText(text);
    ASSERT_TRUE(bytes.has_value());
    ASSERT_EQ(TextOfFileName(*bytes), text) << std::hex << static_cast<unsigned>(codePoint);
  }
}

TEST(FileNameText, OtherUnpairedSurrogatesHaveNoName) {
  EXPECT_EQ(FileNameOfText(u"\xD800"), std::nullopt);
  EXPECT_EQ(FileNameOfText(u"a\xDBFFz"), std::nullopt);
  EXPECT_EQ(FileNameOfText(u"\xDC7F"), std::nullopt);
  EXPECT_EQ(FileNameOfText(u"\xDD00"), std::nullopt);
}

TEST(FileNameText, OnlyALowSurrogateCompletesAHighOne) {
  EXPECT_EQ(FileNameOfText(u"\xD800\xE000"), std::nullopt);
  EXPECT_EQ(FileNameOfText(u"\xD800\xD800"), std::nullopt);
  EXPECT_EQ(FileNameOfText(u"\xD800\xDFFF"), "\xF0\x90\x8F\xBF");
}

}  // namespace
}  // namespace tallowmere::text
