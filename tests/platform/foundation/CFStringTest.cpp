// Strings: creation, formatting, changes and searching.
#include <gtest/gtest.h>

#include <string>

#include "TestStrings.h"

namespace tallowmere::foundation::test {
namespace {

using namespace std::string_literals;

CFOwned<CFMutableStringRef> MakeMutable(std::u16string_view text) {
  return CFOwned(CFStringCreateMutableCopy(kCFAllocatorDefault, 0, MakeString(text).Get()));
}

// --- Making -----------------------------------------------------------------------------------

TEST(CFString, KeepsEveryUnit) {
  const std::u16string text = u"a\xD800\0\xDC80z"s;
  const auto string = MakeString(text);
  EXPECT_EQ(CFStringGetLength(string.Get()), 5);
  EXPECT_EQ(TextOf(string.Get()), text);
}

TEST(CFString, OfNoUnitsIsEmpty) {
  const CFOwned string(CFStringCreateWithCharacters(kCFAllocatorDefault, nullptr, 0));
  ASSERT_TRUE(string);
  EXPECT_EQ(CFStringGetLength(string.Get()), 0);
}

TEST(CFString, OfANegativeLengthIsNull) {
  const UniChar unit = 'a';
  EXPECT_EQ(CFStringCreateWithCharacters(kCFAllocatorDefault, &unit, -1), nullptr);
}

TEST(CFString, ConstantIsMadeOnce) {
  CFStringRef constants[2];
  for (CFStringRef& constant : constants) constant = CFSTR("a\xC3\xA9");
  EXPECT_EQ(constants[0], constants[1]);
  EXPECT_EQ(TextOf(constants[0]), u"a\u00E9");
}

TEST(CFString, CopyKeepsTheTextFromWhenItWasMade) {
  const auto original = MakeMutable(u"a");
  const CFOwned copy(CFStringCreateCopy(kCFAllocatorDefault, original.Get()));
  CFStringAppend(original.Get(), CFSTR("b"));
  EXPECT_EQ(TextOf(copy.Get()), u"a");
  EXPECT_EQ(TextOf(original.Get()), u"ab");
}

TEST(CFString, MutableCopyLeavesItsOriginalAlone) {
  const auto original = MakeString(u"a");
  const CFOwned copy(CFStringCreateMutableCopy(kCFAllocatorDefault, 1, original.Get()));
  CFStringAppend(copy.Get(), CFSTR("bcd"));
  EXPECT_EQ(TextOf(copy.Get()), u"abcd");
  EXPECT_EQ(TextOf(original.Get()), u"a");
}

TEST(CFString, SubstringIsTheUnitsOfTheRange) {
  const auto string = MakeString(u"abcd");
  const auto substring = [&string](CFIndex location, CFIndex length) {
    return CFOwned(CFStringCreateWithSubstring(kCFAllocatorDefault, string.Get(),
                                               CFRangeMake(location, length)));
  };
  EXPECT_EQ(TextOf(substring(1, 2).Get()), u"bc");
  EXPECT_EQ(TextOf(substring(4, 0).Get()), u"");
}

TEST(CFString, SubstringOutsideTheStringIsNull) {
  const auto string = MakeString(u"abcd");
  for (const CFRange range : {CFRangeMake(5, 0), CFRangeMake(3, 2), CFRangeMake(-1, 1),
                              CFRangeMake(1, -1), CFRangeMake(1, kCFNotFound)}) {
    EXPECT_EQ(CFStringCreateWithSubstring(kCFAllocatorDefault, string.Get(), range), nullptr);
  }
}

// --- Formatting -------------------------------------------------------------------------------

TEST(CFString, FormatPutsItsArgumentsInOrder) {
  const auto first = MakeString(u"/a");
  const auto second = MakeString(u"\xDC80");
  const CFOwned string(CFStringCreateWithFormat(kCFAllocatorDefault, nullptr, CFSTR("%@/%@"),
                                                first.Get(), second.Get()));
  EXPECT_EQ(TextOf(string.Get()), u"/a/\xDC80");
}

TEST(CFString, FormatDoesNotLookIntoItsArguments) {
  const auto argument = MakeString(u"%@%");
  const CFOwned string(
      CFStringCreateWithFormat(kCFAllocatorDefault, nullptr, CFSTR("<%@>"), argument.Get()));
  EXPECT_EQ(TextOf(string.Get()), u"<%@%>");
}

TEST(CFString, FormatHasAPercentSignAndNull) {
  const CFOwned string(CFStringCreateWithFormat(kCFAllocatorDefault, nullptr, CFSTR("100%% %@"),
                                                CFStringRef{nullptr}));
  EXPECT_EQ(TextOf(string.Get()), u"100% (null)");
}

TEST(CFString, FormatRefusesOtherDirectivesAndObjects) {
  EXPECT_EQ(CFStringCreateWithFormat(kCFAllocatorDefault, nullptr, CFSTR("%d"), 1), nullptr);
  EXPECT_EQ(CFStringCreateWithFormat(kCFAllocatorDefault, nullptr, CFSTR("a%")), nullptr);
  const auto url = MakeUrl("/a", false);
  EXPECT_EQ(CFStringCreateWithFormat(kCFAllocatorDefault, nullptr, CFSTR("%@"), url.Get()),
            nullptr);
}

// --- Changing ---------------------------------------------------------------------------------

TEST(CFString, AppendAddsAtTheEnd) {
  const auto string = MakeMutable(u"");
  CFStringAppend(string.Get(), CFSTR(""));
  EXPECT_EQ(TextOf(string.Get()), u"");
  CFStringAppend(string.Get(), CFSTR("a"));
  CFStringAppend(string.Get(), CFSTR("/b"));
  EXPECT_EQ(TextOf(string.Get()), u"a/b");
}

TEST(CFString, AppendsItself) {
  const auto string = MakeMutable(u"abcdefghij");
  CFStringAppend(string.Get(), string.Get());
  EXPECT_EQ(TextOf(string.Get()), u"abcdefghijabcdefghij");
}

TEST(CFString, ReplacesEveryOccurrence) {
  const auto string = MakeMutable(u"/a//b/");
  EXPECT_EQ(CFStringFindAndReplace(string.Get(), CFSTR("/"), CFSTR(":"), Whole(string.Get()), 0),
            4);
  EXPECT_EQ(TextOf(string.Get()), u":a::b:");
}

TEST(CFString, ReplacesNothingWhereThereIsNothing) {
  const auto string = MakeMutable(u"a:b");
  EXPECT_EQ(CFStringFindAndReplace(string.Get(), CFSTR("/"), CFSTR(":"), Whole(string.Get()), 0),
            0);
  EXPECT_EQ(TextOf(string.Get()), u"a:b");
}

TEST(CFString, DoesNotReplaceWithinItsReplacements) {
  const auto string = MakeMutable(u"aaa");
  EXPECT_EQ(CFStringFindAndReplace(string.Get(), CFSTR("aa"), CFSTR("ba"), Whole(string.Get()), 0),
            1);
  EXPECT_EQ(TextOf(string.Get()), u"baa");
}

TEST(CFString, ReplacesOnlyWithinTheRange) {
  const auto string = MakeMutable(u"//////");
  EXPECT_EQ(CFStringFindAndReplace(string.Get(), CFSTR("//"), CFSTR("--->"), CFRangeMake(1, 3), 0),
            1);
  EXPECT_EQ(TextOf(string.Get()), u"/--->///");
}

TEST(CFString, ReplacesNothingForAnEmptyTextOrARangeOutside) {
  const auto string = MakeMutable(u"ab");
  EXPECT_EQ(CFStringFindAndReplace(string.Get(), CFSTR(""), CFSTR("x"), Whole(string.Get()), 0), 0);
  EXPECT_EQ(CFStringFindAndReplace(string.Get(), CFSTR("a"), CFSTR("x"), CFRangeMake(0, 3), 0), 0);
  EXPECT_EQ(TextOf(string.Get()), u"ab");
}

// --- Searching --------------------------------------------------------------------------------

TEST(CFString, PrefixIsComparedUnitByUnit) {
  const auto string = MakeString(u"~a\u00E9");
  EXPECT_TRUE(CFStringHasPrefix(string.Get(), CFSTR("~")));
  EXPECT_TRUE(CFStringHasPrefix(string.Get(), string.Get()));
  EXPECT_TRUE(CFStringHasPrefix(string.Get(), CFSTR("")));
  EXPECT_FALSE(CFStringHasPrefix(string.Get(), CFSTR("a")));
  EXPECT_FALSE(CFStringHasPrefix(string.Get(), CFSTR("~A")));
  EXPECT_FALSE(CFStringHasPrefix(string.Get(), MakeString(u"~ae\u0301").Get()));
  EXPECT_FALSE(CFStringHasPrefix(CFSTR(""), CFSTR("~")));
}

TEST(CFString, FindsTheFirstOccurrenceInTheRange) {
  const auto string = MakeString(u"/a/b/c");
  CFRange found = {-5, -5};
  EXPECT_TRUE(CFStringFindWithOptions(string.Get(), CFSTR("/"), CFRangeMake(1, 5), 0, &found));
  EXPECT_EQ(found.location, 2);
  EXPECT_EQ(found.length, 1);
  EXPECT_TRUE(CFStringFindWithOptions(string.Get(), CFSTR("b/c"), Whole(string.Get()), 0, nullptr));
}

TEST(CFString, FindsNothingBeyondTheRange) {
  const auto string = MakeString(u"a/b");
  CFRange found = {-5, -5};
  EXPECT_FALSE(CFStringFindWithOptions(string.Get(), CFSTR("/"), CFRangeMake(0, 1), 0, &found));
  EXPECT_FALSE(CFStringFindWithOptions(string.Get(), CFSTR("/b"), CFRangeMake(0, 2), 0, &found));
  EXPECT_FALSE(CFStringFindWithOptions(string.Get(), CFSTR("/"), CFRangeMake(2, 0), 0, &found));
  EXPECT_FALSE(CFStringFindWithOptions(string.Get(), CFSTR("/"), CFRangeMake(0, 4), 0, &found));
  EXPECT_FALSE(CFStringFindWithOptions(string.Get(), CFSTR(""), Whole(string.Get()), 0, &found));
  EXPECT_EQ(found.location, -5);
}

TEST(CFString, GetCharactersCopiesOnlyTheRange) {
  const auto string = MakeString(u"abcd");
  UniChar buffer[4] = {'.', '.', '.', '.'};
  CFStringGetCharacters(string.Get(), CFRangeMake(1, 2), buffer);
  EXPECT_EQ(std::u16string(buffer, buffer + 4), u"bc..");
}

}  // namespace
}  // namespace tallowmere::foundation::test
