// Strings to bytes and back: encodings, loss, full buffers, Pascal strings and file names.
#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <bit>
#include <limits>
#include <set>
#include <string>

#include "TestGenerators.h"
#include "TestStrings.h"

namespace tallowmere::foundation::test {
namespace {

using namespace std::string_literals;

constexpr CFStringEncoding kUnknownEncoding = 0x0999;

struct Bytes {
  CFIndex units;
  std::string bytes;
  bool operator==(const Bytes&) const = default;
};

void PrintTo(const Bytes& bytes, std::ostream* out) {
  *out << bytes.units << " units: " << testing::PrintToString(bytes.bytes);
}

// Runs CFStringGetBytes on a text with a buffer of some size.
Bytes GetBytes(std::u16string_view text, CFStringEncoding encoding, UInt8 lossByte = 0,
               std::size_t capacity = 64) {
  const auto string = MakeString(text);
  std::string buffer(capacity, '\x7E');
  CFIndex used = -1;
  const CFIndex units = CFStringGetBytes(string.Get(), Whole(string.Get()), encoding, lossByte,
                                         false, reinterpret_cast<UInt8*>(buffer.data()),
                                         static_cast<CFIndex>(capacity), &used);
  EXPECT_EQ(buffer.find_first_not_of('\x7E', static_cast<std::size_t>(used)), buffer.npos);
  return {units, buffer.substr(0, static_cast<std::size_t>(used))};
}

std::optional<std::u16string> Decode(const std::string& bytes, CFStringEncoding encoding) {
  const CFOwned string(CFStringCreateWithCString(kCFAllocatorDefault, bytes.c_str(), encoding));
  if (!string) return std::nullopt;
  return TextOf(string.Get());
}

// --- The encodings ----------------------------------------------------------------------------

TEST(CFStringBytes, SystemEncodingIsMacRoman) {
  EXPECT_EQ(CFStringGetSystemEncoding(), kCFStringEncodingMacRoman);
}

TEST(CFStringBytes, ListHasEveryEncodingOnce) {
  std::multiset<CFStringEncoding> encodings;
  for (const CFStringEncoding* encoding = CFStringGetListOfAvailableEncodings();
       *encoding != kCFStringEncodingInvalidId; ++encoding) {
    encodings.insert(*encoding);
  }
  EXPECT_EQ(encodings, (std::multiset<CFStringEncoding>{0, 0x0100, 0x0201, 0x0600, 0x08000100}));
}

TEST(CFStringBytes, MaximumSizeIsEnoughForEveryText) {
  EXPECT_EQ(CFStringGetMaximumSizeForEncoding(7, kCFStringEncodingMacRoman), 7);
  EXPECT_EQ(CFStringGetMaximumSizeForEncoding(7, kCFStringEncodingUTF16), 14);
  EXPECT_EQ(CFStringGetMaximumSizeForEncoding(7, kCFStringEncodingUTF8), 21);
  EXPECT_EQ(CFStringGetMaximumSizeForEncoding(0, kCFStringEncodingUTF8), 0);
}

TEST(CFStringBytes, MaximumSizeIsNotFoundWhenThereIsNone) {
  EXPECT_EQ(CFStringGetMaximumSizeForEncoding(7, kUnknownEncoding), kCFNotFound);
  constexpr CFIndex kLongest = std::numeric_limits<CFIndex>::max();
  EXPECT_EQ(CFStringGetMaximumSizeForEncoding(kLongest, kCFStringEncodingUTF8), kCFNotFound);
  EXPECT_EQ(CFStringGetMaximumSizeForEncoding(kLongest, kCFStringEncodingASCII), kLongest);
}

TEST(CFStringBytes, AsciiIsTheFirst128Characters) {
  EXPECT_EQ(Decode("a\x7F", kCFStringEncodingASCII), u"a\u007F");
  EXPECT_EQ(Decode("a\x80", kCFStringEncodingASCII), std::nullopt);
  EXPECT_EQ(GetBytes(u"a\u007F\u0080", kCFStringEncodingASCII), (Bytes{2, "a\x7F"}));
}

TEST(CFStringBytes, Latin1IsTheFirst256Characters) {
  EXPECT_EQ(Decode("\x80\xFF", kCFStringEncodingISOLatin1), u"\u0080\u00FF");
  EXPECT_EQ(GetBytes(u"\u00FF\u0100", kCFStringEncodingISOLatin1), (Bytes{1, "\xFF"}));
}

TEST(CFStringBytes, MacRomanIsTheEuroSignRevision) {
  EXPECT_EQ(Decode("\xDB\xF0\x8E", kCFStringEncodingMacRoman), u"\u20AC\uF8FF\u00E9");
  EXPECT_EQ(GetBytes(u"\u20AC\uF8FF", kCFStringEncodingMacRoman), (Bytes{2, "\xDB\xF0"}));
}

TEST(CFStringBytes, MacRomanConvertsALetterAndItsMarkTogether) {
  EXPECT_EQ(GetBytes(u"e\u0301x", kCFStringEncodingMacRoman), (Bytes{3, "\x8Ex"}));
}

TEST(CFStringBytes, Utf8IsStrict) {
  EXPECT_EQ(Decode("a\xF0\x9F\x98\x80", kCFStringEncodingUTF8), u"a\U0001F600");
  EXPECT_EQ(Decode("", kCFStringEncodingUTF8), u"");
  EXPECT_EQ(Decode("a\xFF", kCFStringEncodingUTF8), std::nullopt);
  EXPECT_EQ(Decode("\xED\xB2\x80", kCFStringEncodingUTF8), std::nullopt);  // U+DC80
  EXPECT_EQ(GetBytes(u"\u00E9\U0001F600\xDC80z", kCFStringEncodingUTF8),
            (Bytes{3, "\xC3\xA9\xF0\x9F\x98\x80"}));
}

TEST(CFStringBytes, Utf16IsInTheByteOrderOfTheMachine) {
  const char16_t text[] = u"a\xD800z";
  const std::string bytes(reinterpret_cast<const char*>(text), 6);
  EXPECT_EQ(GetBytes(text, kCFStringEncodingUTF16), (Bytes{3, bytes}));
  EXPECT_EQ(Decode("\x41\x42", kCFStringEncodingUTF16),
            std::u16string(1, std::endian::native == std::endian::little ? 0x4241 : 0x4142));
  EXPECT_EQ(Decode("\x41\x42\x43", kCFStringEncodingUTF16), std::nullopt);
}

TEST(CFStringBytes, UnknownEncodingConvertsNothing) {
  EXPECT_EQ(Decode("a", kUnknownEncoding), std::nullopt);
  EXPECT_EQ(GetBytes(u"a", kUnknownEncoding, '?'), (Bytes{0, ""}));
  EXPECT_EQ(GetBytes(u"a", kCFStringEncodingInvalidId, '?'), (Bytes{0, ""}));
}

// --- Loss and full buffers --------------------------------------------------------------------

TEST(CFStringBytes, LossByteStandsForOneCharacter) {
  EXPECT_EQ(GetBytes(u"a\u65E5\U0001F600\xDC80/b", kCFStringEncodingMacRoman, '?'), (Bytes{7,
                                                                                           "a?"
                                                                                           "?"
                                                                                           "?/b"}));
  EXPECT_EQ(GetBytes(u"\xD800z", kCFStringEncodingUTF8, '?'), (Bytes{2, "?z"}));
}

TEST(CFStringBytes, WithoutLossByteStopsBeforeWhatTheEncodingLacks) {
  EXPECT_EQ(GetBytes(u"ab\u65E5c", kCFStringEncodingMacRoman), (Bytes{2, "ab"}));
}

TEST(CFStringBytes, StopsAtAFullBufferBetweenCharacters) {
  EXPECT_EQ(GetBytes(u"abc", kCFStringEncodingMacRoman, '?', 2), (Bytes{2, "ab"}));
  EXPECT_EQ(GetBytes(u"a\u00E9z", kCFStringEncodingUTF8, '?', 2), (Bytes{1, "a"}));
  EXPECT_EQ(GetBytes(u"\U0001F600z", kCFStringEncodingUTF8, '?', 3), (Bytes{0, ""}));
  EXPECT_EQ(GetBytes(u"\U0001F600z", kCFStringEncodingUTF8, '?', 4),
            (Bytes{2, "\xF0\x9F\x98\x80"}));
  EXPECT_EQ(GetBytes(u"\U0001F600z", kCFStringEncodingUTF16, '?', 3), (Bytes{0, ""}));
}

TEST(CFStringBytes, BufferOfSizeZeroTakesNothing) {
  EXPECT_EQ(GetBytes(u"a", kCFStringEncodingUTF8, '?', 0), (Bytes{0, ""}));
}

TEST(CFStringBytes, NegativeCapacityTakesNothing) {
  UInt8 buffer[4] = {'x'};
  EXPECT_EQ(CFStringGetBytes(CFSTR("a"), CFRangeMake(0, 1), kCFStringEncodingUTF8, 0, false, buffer,
                             -1, nullptr),
            0);
  EXPECT_EQ(buffer[0], 'x');
}

TEST(CFStringBytes, WithoutBufferOnlyCounts) {
  const auto string = MakeString(u"a\u00E9\u65E5");
  CFIndex used = -1;
  EXPECT_EQ(CFStringGetBytes(string.Get(), CFRangeMake(1, 2), kCFStringEncodingUTF8, 0, false,
                             nullptr, 0, &used),
            2);
  EXPECT_EQ(used, 5);
}

TEST(CFStringBytes, ConvertsOnlyTheRange) {
  UInt8 buffer[8];
  CFIndex used = -1;
  const auto string = MakeString(u"~name/x");
  EXPECT_EQ(CFStringGetBytes(string.Get(), CFRangeMake(1, 4), kCFStringEncodingUTF8, 0, false,
                             buffer, sizeof buffer, &used),
            4);
  EXPECT_EQ(std::string(buffer, buffer + used), "name");
  EXPECT_EQ(CFStringGetBytes(string.Get(), CFRangeMake(1, 7), kCFStringEncodingUTF8, 0, false,
                             buffer, sizeof buffer, &used),
            0);
  EXPECT_EQ(used, 0);
}

// --- Pascal strings ---------------------------------------------------------------------------

struct PascalResult {
  bool done;
  std::string buffer;  // including bytes that were not written
};

PascalResult GetPascal(std::u16string_view text, std::size_t capacity,
                       CFStringEncoding encoding = kCFStringEncodingMacRoman) {
  std::string buffer(capacity, '.');
  const bool done =
      CFStringGetPascalString(MakeString(text).Get(), reinterpret_cast<StringPtr>(buffer.data()),
                              static_cast<CFIndex>(capacity), encoding) != 0;
  return {done, buffer};
}

TEST(CFStringPascal, HasItsLengthInFront) {
  const PascalResult result = GetPascal(u"a/\u00E9", 6);
  EXPECT_TRUE(result.done);
  EXPECT_EQ(result.buffer, "\3a/\x8E..");
}

TEST(CFStringPascal, EmptyTextFitsInOneByte) {
  const PascalResult result = GetPascal(u"", 1);
  EXPECT_TRUE(result.done);
  EXPECT_EQ(result.buffer, "\0"s);
}

TEST(CFStringPascal, FitsExactly) {
  EXPECT_TRUE(GetPascal(u"abc", 4).done);
  const PascalResult result = GetPascal(u"abc", 3);
  EXPECT_FALSE(result.done);
  EXPECT_EQ(result.buffer, "...");
}

TEST(CFStringPascal, HasAtMost255Bytes) {
  EXPECT_TRUE(GetPascal(std::u16string(255, u'x'), 300).done);
  EXPECT_FALSE(GetPascal(std::u16string(256, u'x'), 300).done);
}

TEST(CFStringPascal, RefusesWhatTheEncodingLacks) {
  const PascalResult result = GetPascal(u"a\u65E5", 8);
  EXPECT_FALSE(result.done);
  EXPECT_EQ(result.buffer, "........");
  EXPECT_FALSE(GetPascal(u"a", 8, kUnknownEncoding).done);
}

TEST(CFStringPascal, BufferOfSizeZeroIsTooSmall) {
  EXPECT_FALSE(CFStringGetPascalString(CFSTR(""), nullptr, 0, kCFStringEncodingMacRoman));
}

TEST(CFStringPascal, BecomesAString) {
  const unsigned char pascal[] = "\4a/\x8E:rest";
  const CFOwned string(
      CFStringCreateWithPascalString(kCFAllocatorDefault, pascal, kCFStringEncodingMacRoman));
  EXPECT_EQ(TextOf(string.Get()), u"a/\u00E9:");
}

TEST(CFStringPascal, MustBeValidInItsEncoding) {
  const unsigned char pascal[] = "\1\x8E";
  EXPECT_EQ(CFStringCreateWithPascalString(kCFAllocatorDefault, pascal, kCFStringEncodingASCII),
            nullptr);
  EXPECT_EQ(CFStringCreateWithPascalString(kCFAllocatorDefault, pascal, kCFStringEncodingUTF8),
            nullptr);
}

RC_GTEST_PROP(CFStringPascal, EveryMacRomanNameSurvivesARoundTrip, ()) {
  const auto size = *rc::gen::inRange<std::size_t>(0, 256);
  std::string pascal(size + 1, static_cast<char>(size));
  for (std::size_t i = 1; i <= size; ++i) pascal[i] = *rc::gen::arbitrary<char>();
  const CFOwned string(CFStringCreateWithPascalString(
      kCFAllocatorDefault, reinterpret_cast<ConstStr255Param>(pascal.data()),
      kCFStringEncodingMacRoman));
  std::string back(pascal.size(), '\0');
  RC_ASSERT(CFStringGetPascalString(string.Get(), reinterpret_cast<StringPtr>(back.data()),
                                    static_cast<CFIndex>(back.size()), kCFStringEncodingMacRoman));
  RC_ASSERT(back == pascal);
}

// --- File-system representation ---------------------------------------------------------------

TEST(CFStringFileName, BytesOutsideUtf8AreLoneSurrogates) {
  EXPECT_EQ(TextOf(MakeName("a\xFFz").Get()), u"a\xDCFFz");
}

TEST(CFStringFileName, EmptyNameIsEmptyString) {
  EXPECT_EQ(TextOf(MakeName("").Get()), u"");
  EXPECT_EQ(NameOf(CFSTR("")), "");
}

TEST(CFStringFileName, NeedsRoomForItsNul) {
  const auto string = MakeString(u"\u00E9\xDCFF");
  char buffer[5] = "....";
  EXPECT_FALSE(CFStringGetFileSystemRepresentation(string.Get(), buffer, 3));
  EXPECT_STREQ(buffer, "....");
  EXPECT_TRUE(CFStringGetFileSystemRepresentation(string.Get(), buffer, 4));
  EXPECT_STREQ(buffer, "\xC3\xA9\xFF");
}

TEST(CFStringFileName, BufferOfSizeZeroIsTooSmall) {
  EXPECT_FALSE(CFStringGetFileSystemRepresentation(CFSTR(""), nullptr, 0));
  EXPECT_FALSE(CFStringGetFileSystemRepresentation(CFSTR(""), nullptr, -1));
}

TEST(CFStringFileName, StringsThatAreNoNamesHaveNone) {
  EXPECT_EQ(NameOf(MakeString(u"a\xD800").Get()), std::nullopt);
  EXPECT_EQ(NameOf(MakeString(u"a\xDC7F").Get()), std::nullopt);
  EXPECT_EQ(NameOf(MakeString(u"a\0b"s).Get()), std::nullopt);
}

TEST(CFStringFileName, MaximumSizeIsEnoughWithTheNul) {
  const auto string = MakeString(u"\u65E5\u65E5");
  EXPECT_EQ(CFStringGetMaximumSizeOfFileSystemRepresentation(string.Get()), 7);
  EXPECT_EQ(NameOf(string.Get()), "\xE6\x97\xA5\xE6\x97\xA5");
}

RC_GTEST_PROP(CFStringFileName, EveryNameSurvivesARoundTrip, ()) {
  const auto bytes = *AnyName();
  RC_ASSERT(NameOf(MakeName(bytes).Get()) == bytes);
}

}  // namespace
}  // namespace tallowmere::foundation::test
