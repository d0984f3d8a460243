// The Mac Roman encoding against its published table.
#include <gtest/gtest.h>

#include "text/MacRoman.h"

namespace tallowmere::text {
namespace {

TEST(MacRoman, EveryByteDecodesAndEncodesBack) {
  for (unsigned byte = 0; byte < 256; ++byte) {
    const auto narrow = static_cast<std::uint8_t>(byte);
    EXPECT_EQ(MacRomanFromUnicode(MacRomanToUnicode(narrow)), narrow) << byte;
  }
}

TEST(MacRoman, TheUpperHalfIsThePublishedOne) {
  EXPECT_EQ(DecodeMacRoman([] {
              std::string bytes;
              for (int byte = 0x80; byte < 0x100; ++byte) bytes.push_back(static_cast<char>(byte));
              return bytes;
            }()),
            u"ÄÅÇÉÑÖÜáàâäãåçéè"
            u"êëíìîïñóòôöõúùûü"
            u"†°¢£§•¶ß®©™´¨≠ÆØ"
            u"∞±≤≥¥µ∂∑∏π∫ªºΩæø"
            u"¿¡¬√ƒ≈∆«»…\u00A0ÀÃÕŒœ"
            u"–—“”‘’÷◊ÿŸ⁄€‹›ﬁﬂ"
            u"‡·‚„‰ÂÊÁËÈÍÎÏÌÓÔ"
            u"\uF8FFÒÚÛÙıˆ˜¯˘˙˚¸˝˛ˇ");
}

TEST(MacRoman, IsTheEuroSignRevision) {
  EXPECT_EQ(MacRomanToUnicode(0xDB), 0x20AC);
  EXPECT_EQ(MacRomanToUnicode(0xF0), 0xF8FF);
  EXPECT_EQ(MacRomanFromUnicode(0x00A4), std::nullopt);  // the currency sign it replaced
}

TEST(MacRoman, EncodesPrecomposedAndDecomposedLettersAlike) {
  for (unsigned byte = 0x80; byte < 256; ++byte) {
    const std::string one(1, static_cast<char>(byte));
    const std::u16string decomposed = DecomposeMacRoman(DecodeMacRoman(one));
    EXPECT_EQ(EncodeMacRoman(decomposed), one) << byte;
  }
  EXPECT_EQ(EncodeMacRoman(u"e\u0301"), "\x8E");
  EXPECT_EQ(EncodeMacRoman(u"\u00E9"), "\x8E");
}

TEST(MacRoman, KeepsTheOrderOfLettersAroundACombinedOne) {
  EXPECT_EQ(EncodeMacRoman(u"xe\u0301y"), "x\x8Ey");
}

TEST(MacRoman, RefusesAMarkThatFormsNoLetterOfIts) {
  EXPECT_EQ(EncodeMacRoman(u"x\u0301"), std::nullopt);
  EXPECT_EQ(EncodeMacRoman(u"\u0301"), std::nullopt);
  EXPECT_EQ(EncodeMacRoman(u"e\u0301\u0301"), std::nullopt);
}

TEST(MacRoman, RefusesCharactersItLacks) {
  EXPECT_EQ(EncodeMacRoman(u"\u65E5"), std::nullopt);
  EXPECT_EQ(EncodeMacRoman(u"\U0001F600"), std::nullopt);
  EXPECT_EQ(EncodeMacRoman(u"\xDC80"), std::nullopt);
}

TEST(MacRoman, TreatsASurrogatePairAsOneCharacter) {
  const MacRomanStep step = NextMacRoman(u"\U0001F600x");
  EXPECT_EQ(step.byte, std::nullopt);
  EXPECT_EQ(step.units, 2u);
}

TEST(MacRoman, DecomposesOnlyAccentedLetters) {
  EXPECT_EQ(DecomposeMacRoman(u"a\u00E9\u2260z"), u"ae\u0301\u2260z");
}

}  // namespace
}  // namespace tallowmere::text
