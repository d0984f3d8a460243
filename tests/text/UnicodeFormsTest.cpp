// Composed and decomposed forms of Unicode text.
#include <gtest/gtest.h>

#include <string>
#include <utility>

#include "text/UnicodeForms.h"

namespace tallowmere::text {
namespace {

// Normalization forms C and D of the same text.
const std::pair<std::u16string, std::u16string> kForms[] = {
    {u"plain", u"plain"},
    {u"Caf\u00E9", u"Cafe\u0301"},
    {u"\u1EBF", u"e\u0302\u0301"},                   // two marks above
    {u"\u1EC7", u"e\u0323\u0302"},                   // one below, one above
    {u"\u30AC\u30D1", u"\u30AB\u3099\u30CF\u309A"},  // katakana
    {u"\uD55C\uAE00\uAC00", u"\u1112\u1161\u11AB\u1100\u1173\u11AF\u1100\u1161"},
    {u"\u0439", u"\u0438\u0306"},
    {u"\u1F82", u"\u03B1\u0313\u0300\u0345"},  // three marks
    {u"a\xD83D\xDE00", u"a\xD83D\xDE00"},
};

TEST(UnicodeForms, ComposeAndDecompose) {
  for (const auto& [composed, decomposed] : kForms) {
    EXPECT_EQ(Compose(decomposed), composed);
    EXPECT_EQ(Decompose(composed), decomposed);
    EXPECT_EQ(Compose(composed), composed);
    EXPECT_EQ(Decompose(decomposed), decomposed);
  }
}

TEST(UnicodeForms, LeaveMarksWithoutALetterAlone) {
  EXPECT_EQ(Compose(u"\u0301e"), u"\u0301e");
  EXPECT_EQ(Compose(u"\u11AB"), u"\u11AB");
  EXPECT_EQ(Compose(u""), u"");
}

TEST(UnicodeForms, AreEqualButForCase) {
  EXPECT_TRUE(EqualButForCase(u"Disk \u00C9\u0394\u0416", u"dISK \u00E9\u03B4\u0436"));
  EXPECT_TRUE(EqualButForCase(u"\u0100\u1E00", u"\u0101\u1E01"));
  EXPECT_FALSE(EqualButForCase(u"Disk", u"Disk "));
  EXPECT_FALSE(EqualButForCase(u"\u00E9", u"e"));
  EXPECT_FALSE(EqualButForCase(u"\u0101", u"\u0103"));
}

}  // namespace
}  // namespace tallowmere::text
