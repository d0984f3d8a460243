// Letter case under a locale in which "I" is not the capital of "i".
#include <gtest/gtest.h>

#include "TestReferences.h"
#include "support/TurkishLocale.h"

namespace tallowmere::test {
namespace {

class LetterCaseInTurkish : public testing::Test {
 protected:
  void SetUp() override {
    if (!mLocale.IsChosen()) GTEST_SKIP() << "the C library's locales cannot be made here";
  }

  const TurkishLocale mLocale;
};

TEST_F(LetterCaseInTurkish, OfAnExtensionIsIgnored) {
  EXPECT_TRUE(CFileRef("/x/TITLE.AIF", false).HasExtension("aif"));
}

TEST_F(LetterCaseInTurkish, OfAContainingPathIsIgnored) {
  EXPECT_TRUE(CFileRef("/x/TITLE", true).PathContains(CFileRef("/x/title/f", false)));
}

TEST_F(LetterCaseInTurkish, OfLettersBeyondASCIICounts) {
  EXPECT_FALSE(CFileRef("/x.\xDC", false).HasExtension("\xFC"));  // Ü and ü in that locale
}

TEST_F(LetterCaseInTurkish, OfTheSchemeOfAFileURLIsIgnored) {
  CFileRef root;
  ASSERT_TRUE(root.SetFromURLString("FILE:///"));
  EXPECT_TRUE(root.UpdateInternalFSRef());
}

}  // namespace
}  // namespace tallowmere::test
