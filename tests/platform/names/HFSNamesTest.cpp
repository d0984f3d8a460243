// The plain and short HFS names of Linux names.
#include <gtest/gtest.h>

#include "names/HFSNames.h"

namespace tallowmere::names {
namespace {

TEST(HFSNames, ColonAndSlashAreExchanged) {
  EXPECT_EQ(PlainHFSName("a:b", 63), "a/b");
  EXPECT_EQ(PlainHFSName("a/b", 63), "a:b");
}

TEST(HFSNames, LettersOfMacRomanAreEncodedInEitherNormalForm) {
  EXPECT_EQ(PlainHFSName("caf\xC3\xA9", 63), "caf\x8E");
  EXPECT_EQ(PlainHFSName("cafe\xCC\x81", 63), "caf\x8E");
}

TEST(HFSNames, ControlCharactersAreOrdinary) {
  EXPECT_EQ(PlainHFSName("a\n\x01\x7F", 63), "a\n\x01\x7F");
}

TEST(HFSNames, ACharacterOutsideMacRomanLeavesNoPlainName) {
  EXPECT_EQ(PlainHFSName("\xE6\x97\xA5", 63), std::nullopt);
  EXPECT_EQ(PlainHFSName("\xFF", 63), std::nullopt);
}

TEST(HFSNames, TheLimitCountsEncodedBytes) {
  EXPECT_TRUE(PlainHFSName(std::string(63, 'x'), 63));
  EXPECT_FALSE(PlainHFSName(std::string(64, 'x'), 63));
  std::string accented;
  for (int i = 0; i < 63; ++i) accented += "e\xCC\x81";
  EXPECT_EQ(PlainHFSName(accented, 63), std::string(63, '\x8E'));
}

TEST(HFSNames, AShortNameKeepsTheExtensionAndAsMuchOfTheRestAsFits) {
  EXPECT_EQ(ShortHFSName("A very long name that no FSSpec can hold.aif", 0x1B4A3F),
            "A very long name tha#1B4A3F.aif");
}

TEST(HFSNames, ALeadingDotBeginsNoExtension) {
  EXPECT_EQ(ShortHFSName(".\xE6\x97\xA5", 0x1B), ".?#1B");
  EXPECT_EQ(ShortHFSName(".aif\xFF", 0x1B), ".aif?#1B");
  EXPECT_EQ(ShortHFSName(".aif", 0x1B), ".aif#1B");
}

TEST(HFSNames, AShortNameHasAtMost31Bytes) {
  EXPECT_EQ(ShortHFSName(std::string(100, 'x'), 0xFFFFFFEF).size(), 31u);
  EXPECT_EQ(ShortHFSName(std::string(100, 'x') + ".12345", 0xFFFFFFEF).size(), 31u);
}

TEST(HFSNames, AShortNameHasQuestionMarksForWhatMacRomanLacks) {
  EXPECT_EQ(ShortHFSName("\xE6\x97\xA5-\xF0\x9F\x98\x80-\xFF", 0x2A), "?-?-?#2A");
}

TEST(HFSNames, AShortNameExchangesColonAndSlash) {
  EXPECT_EQ(ShortHFSName("\xE6\x97\xA5:x", 16), "?/x#10");
}

TEST(HFSNames, OnlyExtensionsOf1To5EncodableCharactersAreKept) {
  EXPECT_EQ(ShortHFSName("\xFF.a", 16), "?#10.a");
  EXPECT_EQ(ShortHFSName("\xFF.abcde", 16), "?#10.abcde");
  EXPECT_EQ(ShortHFSName("\xFF.abcdef", 16), "?.abcdef#10");
  EXPECT_EQ(ShortHFSName("\xFF.", 16), "?.#10");
  EXPECT_EQ(ShortHFSName("x.\xFF", 16), "x.?#10");
  EXPECT_EQ(ShortHFSName("\xFF", 16), "?#10");
}

TEST(HFSNames, AnExtensionOfAccentedLettersCountsItsCharacters) {
  EXPECT_EQ(ShortHFSName("\xFF.e\xCC\x81"
                         "bcde",
                         16),
            "?#10.\x8E"
            "bcde");
}

}  // namespace
}  // namespace tallowmere::names
