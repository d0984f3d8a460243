// Names between CFStrings and Pascal strings: encodings, separators and lengths.
#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <algorithm>
#include <cstring>
#include <vector>

#include "HFSBridgeSupport.h"

namespace tallowmere::test {
namespace {

using foundation::test::TextOf;

struct Converted {
  bool isWhole;
  std::string name;

  bool operator==(const Converted&) const = default;
};
std::ostream& operator<<(std::ostream& out, const Converted& converted) {
  return out << (converted.isWhole ? "whole \"" : "with loss \"") << converted.name << '"';
}

// Uses a buffer of exactly `size` bytes, so that sanitizers notice an access beyond it.
Converted Convert(std::u16string_view name, SInt32 size = sizeof(Str255)) {
  const auto buffer = std::make_unique<unsigned char[]>(static_cast<std::size_t>(size));
  const bool isWhole = GetPascalStringFromCFString(MakeString(name).Get(), buffer.get(), size);
  EXPECT_LT(buffer[0], size);
  return {isWhole, TextOfPascal(buffer.get())};
}

std::optional<std::u16string> Read(std::string_view name) {
  const CFOwned read(CreateCFStringFromPascalString(Pascal(name).Get()));
  return read ? std::optional(TextOf(read.Get())) : std::nullopt;
}

// Changes the class-wide encoding while the object exists.
class LocalEncoding {
 public:
  explicit LocalEncoding(CFStringEncoding encoding) { CFileRef::mLocalEncoding = encoding; }
  ~LocalEncoding() { CFileRef::mLocalEncoding = kCFStringEncodingMacRoman; }
};

TEST(PascalNames, SlashesAndColonsAreExchangedOnTheWayToHFS) {
  EXPECT_EQ(Convert(u"a/b:c"), (Converted{true, "a:b/c"}));
}

TEST(PascalNames, AnExchangedSeparatorIsNotExchangedBack) {
  EXPECT_EQ(Convert(u"/:/:"), (Converted{true, ":/:/"}));
}

TEST(PascalNames, TheEmptyNameHasLengthZero) {
  EXPECT_EQ(Convert(u""), (Converted{true, ""}));
  EXPECT_EQ(Convert(u"", 1), (Converted{true, ""}));
}

TEST(PascalNames, ABufferWithoutRoomForALengthStaysAsItIs) {
  const auto name = MakeString(u"name");
  for (const SInt32 size : {0, -1}) {
    unsigned char buffer[] = {7, 'f'};
    EXPECT_FALSE(GetPascalStringFromCFString(name.Get(), buffer, size));
    EXPECT_EQ(buffer[0], 7);
    EXPECT_EQ(buffer[1], 'f');
  }
}

TEST(PascalNames, ACharacterInNoEncodingBecomesAQuestionMarkAndNothingIsExchanged) {
  EXPECT_EQ(Convert(u"a/b:\u65E5c"), (Converted{false, "a/b:?c"}));
}

TEST(PascalNames, ALongNameIsCutTo255BytesAndNothingIsExchanged) {
  const std::u16string longest(255, u':');
  EXPECT_EQ(Convert(longest), (Converted{true, std::string(255, '/')}));
  EXPECT_EQ(Convert(longest + u":"), (Converted{false, std::string(255, ':')}));
}

TEST(PascalNames, ABufferBeyondAStr255IsUsedUpTo255Bytes) {
  EXPECT_EQ(Convert(std::u16string(300, u'x'), 400), (Converted{false, std::string(255, 'x')}));
}

TEST(PascalNames, ABufferWithoutRoomForACharacterGetsAnEmptyName) {
  EXPECT_EQ(Convert(u"abc", 1), (Converted{false, ""}));
  EXPECT_EQ(Convert(u"abc", 3), (Converted{false, "ab"}));
}

TEST(PascalNames, SlashesBecomeColonsOnTheWayFromHFSAndColonsStay) {
  EXPECT_EQ(Read("x/y"), u"x:y");
  EXPECT_EQ(Read("x:y"), u"x:y");
  EXPECT_EQ(Read("/x//y/"), u":x::y:");
}

TEST(PascalNames, TheEmptyNameIsReadAsAnEmptyString) {
  EXPECT_EQ(Read(""), u"");
}

TEST(PascalNames, NullIsReadAsNull) {
  EXPECT_EQ(CreateCFStringFromPascalString(nullptr), nullptr);
}

TEST(PascalNames, TheReadStringIsMutableAndTheCallersOwn) {
  const CFOwned name(CreateCFStringFromPascalString(Pascal("a").Get()));
  CFStringAppend(name.Get(), CFSTR("b"));
  EXPECT_EQ(TextOf(name.Get()), u"ab");
  EXPECT_EQ(CFGetRetainCount(name.Get()), 1);
}

TEST(PascalNames, NamesAreInMacRomanByDefault) {
  EXPECT_EQ(Convert(u"\u20AC\u00E9"), (Converted{true, "\xDB\x8E"}));
  EXPECT_EQ(Read("\xDB\x8E"), u"\u20AC\u00E9");
}

TEST(PascalNames, TheLocalEncodingIsTriedFirst) {
  const LocalEncoding latin1(kCFStringEncodingISOLatin1);
  EXPECT_EQ(Convert(u"\u00E9"), (Converted{true, "\xE9"}));
  EXPECT_EQ(Read("\xE9"), u"\u00E9");
}

TEST(PascalNames, MacRomanConvertsWhatTheLocalEncodingLacks) {
  const LocalEncoding ascii(kCFStringEncodingASCII);
  EXPECT_EQ(Convert(u"\u00E9"), (Converted{true, "\x8E"}));
  EXPECT_EQ(Read("\x8E"), u"\u00E9");
}

TEST(PascalNames, TheLossyConversionIsMacRomanWhateverTheLocalEncoding) {
  const LocalEncoding latin1(kCFStringEncodingISOLatin1);
  EXPECT_EQ(Convert(u"\u00E9\u65E5"), (Converted{false, "\x8E?"}));
}

TEST(PascalNames, AnUnknownLocalEncodingIsIgnored) {
  const LocalEncoding unknown(kCFStringEncodingInvalidId);
  EXPECT_EQ(Convert(u"\u00E9"), (Converted{true, "\x8E"}));
  EXPECT_EQ(Read("\x8E"), u"\u00E9");
}

TEST(PascalNames, EveryByteButTheColonSurvivesARoundTrip) {
  std::string name;
  for (int byte = 0; byte < 256; ++byte) {
    if (byte != ':') name.push_back(static_cast<char>(byte));
  }
  const auto text = Read(name);
  ASSERT_TRUE(text);
  EXPECT_EQ(Convert(*text), (Converted{true, name}));
}

RC_GTEST_PROP(PascalNames, EveryHFSNameSurvivesARoundTrip, (std::string name)) {
  if (name.size() > 255) name.resize(255);
  std::replace(name.begin(), name.end(), ':', '/');
  const auto text = Read(name);
  RC_ASSERT(text.has_value());
  RC_ASSERT(text->find(u'/') == std::u16string::npos);
  RC_ASSERT(Convert(*text) == (Converted{true, name}));
}

RC_GTEST_PROP(PascalNames, AnyTextInAnyBufferGivesAPascalStringInIt,
              (const std::vector<char16_t>& text)) {
  const int size = *rc::gen::inRange(1, 300);
  Convert({text.data(), text.size()}, size);
}

TEST(PascalNames, ARecordsNameLengthIsBoundedByTheRecord) {
  for (const std::size_t length : {0u, 1u, 63u, 64u, 128u, 255u}) {
    const FSSpec wire = Spec(-3, 17, std::string(length, 'x'));
    EXPECT_EQ(FieldsOf(BoundedFSSpec(wire)),
              (Fields{-3, 17, std::string(std::min<std::size_t>(length, 63), 'x')}));
  }
}

}  // namespace
}  // namespace tallowmere::test
