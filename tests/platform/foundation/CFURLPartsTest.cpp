// Components, extension, folder mark and editing of URLs, and URLs parsed from text.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "TestStrings.h"
#include "foundation/Url.h"

namespace tallowmere::foundation::test {
namespace {

using Name = std::optional<std::string>;

Name LastOf(const CFOwned<CFURLRef>& url) {
  return NameOf(CFOwned(CFURLCopyLastPathComponent(url.Get())).Get());
}

Name ExtensionOf(const std::string& path) {
  return NameOf(CFOwned(CFURLCopyPathExtension(MakeUrl(path, false).Get())).Get());
}

Name TextOfUrl(const CFOwned<CFURLRef>& url) {
  if (!url) return std::nullopt;
  return UrlOf(url.Get()).Text();
}

Name Parent(const std::string& text) {
  const auto url = ParseUrl(text);
  return TextOfUrl(
      CFOwned(CFURLCreateCopyDeletingLastPathComponent(kCFAllocatorDefault, url.Get())));
}

Name Appended(const std::string& text, std::u16string_view component, bool folder) {
  const auto url = ParseUrl(text);
  const auto string = MakeString(component);
  return TextOfUrl(CFOwned(CFURLCreateCopyAppendingPathComponent(kCFAllocatorDefault, url.Get(),
                                                                 string.Get(), folder ? 1 : 0)));
}

// --- Last component and extension -------------------------------------------------------------

TEST(CFURLLastComponent, ComesWithoutTheFolderMark) {
  EXPECT_EQ(LastOf(MakeUrl("/a/b", true)), "b");
  EXPECT_EQ(LastOf(MakeUrl("/a/b", false)), "b");
  EXPECT_EQ(LastOf(MakeUrl("b", false)), "b");
}

TEST(CFURLLastComponent, OfTheRootIsASlash) {
  EXPECT_EQ(LastOf(MakeUrl("/", true)), "/");
}

TEST(CFURLLastComponent, OfNoPathIsNull) {
  EXPECT_EQ(CFURLCopyLastPathComponent(ParseUrl("http://host?a/b").Get()), nullptr);
}

TEST(CFURLLastComponent, IsPercentDecoded) {
  EXPECT_EQ(LastOf(MakeUrl("/a/%20 \xFF", false)), "%20 \xFF");
  EXPECT_EQ(LastOf(ParseUrl("file:///a/b%20c")), "b c");
}

TEST(CFURLLastComponent, WithAnEncodedNulIsNull) {
  EXPECT_EQ(CFURLCopyLastPathComponent(ParseUrl("file:///a/b%00c").Get()), nullptr);
  EXPECT_EQ(CFURLCopyPathExtension(ParseUrl("file:///a/b.c%00").Get()), nullptr);
}

TEST(CFURLExtension, FollowsTheLastDot) {
  EXPECT_EQ(ExtensionOf("/a/report.TXT"), "TXT");
  EXPECT_EQ(ExtensionOf("/a/archive.tar.gz"), "gz");
  EXPECT_EQ(ExtensionOf("/a/.profile.bak"), "bak");
  EXPECT_EQ(ExtensionOf("/a/x.\xC3\xA9\xFF"), "\xC3\xA9\xFF");
}

TEST(CFURLExtension, OfANameWithoutOneIsNull) {
  EXPECT_EQ(ExtensionOf("/a.b/README"), std::nullopt);
  EXPECT_EQ(ExtensionOf("/"), std::nullopt);
}

TEST(CFURLExtension, ThatIsEmptyIsNull) {
  EXPECT_EQ(ExtensionOf("/a/b."), std::nullopt);
  EXPECT_EQ(ExtensionOf("/a/b.c."), std::nullopt);
  EXPECT_EQ(ExtensionOf("/a/.."), std::nullopt);
}

TEST(CFURLExtension, IsNotWhatFollowsALeadingDot) {
  EXPECT_EQ(ExtensionOf("/a/.profile"), std::nullopt);
}

TEST(CFURLExtension, OfAFolderIsItsNames) {
  const CFOwned extension(CFURLCopyPathExtension(MakeUrl("/a/b.app", true).Get()));
  EXPECT_EQ(NameOf(extension.Get()), "app");
}

TEST(CFURLExtension, OfNoPathIsNull) {
  EXPECT_EQ(CFURLCopyPathExtension(ParseUrl("http://host.org").Get()), nullptr);
}

// --- Folder mark ------------------------------------------------------------------------------

TEST(CFURLFolderMark, IsASlashAtTheEndOfThePath) {
  EXPECT_TRUE(CFURLHasDirectoryPath(MakeUrl("/a", true).Get()));
  EXPECT_FALSE(CFURLHasDirectoryPath(MakeUrl("/a", false).Get()));
  EXPECT_TRUE(CFURLHasDirectoryPath(MakeUrl("/", false).Get()));
  EXPECT_TRUE(CFURLHasDirectoryPath(ParseUrl("http://host/a/?q").Get()));
  EXPECT_FALSE(CFURLHasDirectoryPath(ParseUrl("http://host/a?q/").Get()));
  EXPECT_FALSE(CFURLHasDirectoryPath(ParseUrl("http://host").Get()));
}

TEST(CFURLFolderMark, IsADotOrTwoForALastComponent) {
  for (const char* path : {"/a/.", "/a/..", ".", ".."}) {
    EXPECT_TRUE(CFURLHasDirectoryPath(MakeUrl(path, false).Get())) << path;
  }
  EXPECT_TRUE(CFURLHasDirectoryPath(ParseUrl("file:///a/%2e%2E").Get()));
  for (const char* path : {"/a/...", "/a/.b", "/../b", "/a.."}) {
    EXPECT_FALSE(CFURLHasDirectoryPath(MakeUrl(path, false).Get())) << path;
  }
}

// --- Deleting the last component --------------------------------------------------------------

TEST(CFURLParent, IsTheContainingFolder) {
  EXPECT_EQ(Parent("file:///a/b"), "file:///a/");
  EXPECT_EQ(Parent("file:///a/b/"), "file:///a/");
  EXPECT_EQ(Parent("file:///a"), "file:///");
  EXPECT_EQ(Parent("a/b"), "a/");
}

TEST(CFURLParent, OfTheRootIsTheRoot) {
  EXPECT_EQ(Parent("file:///"), "file:///");
}

TEST(CFURLParent, OfABareNameIsTheCurrentFolder) {
  EXPECT_EQ(Parent("a"), "./");
  EXPECT_EQ(Parent("a/"), "./");
}

TEST(CFURLParent, OfDotsIsOneLevelFurtherUp) {
  EXPECT_EQ(Parent("file:///a/."), "file:///a/./../");
  EXPECT_EQ(Parent("file:///a/.."), "file:///a/../../");
  EXPECT_EQ(Parent("file:///a/../"), "file:///a/../../");
  EXPECT_EQ(Parent("."), "./../");
  EXPECT_EQ(Parent("./"), "./../");
  EXPECT_EQ(Parent(".."), "../../");
  EXPECT_EQ(Parent("file:///a/%2E%2e"), "file:///a/%2E%2e/../");
}

TEST(CFURLParent, OfANameThatBeginsWithDotsIsItsFolder) {
  EXPECT_EQ(Parent("file:///a/.b"), "file:///a/");
  EXPECT_EQ(Parent("file:///a/..."), "file:///a/");
}

TEST(CFURLParent, KeepsAllButThePath) {
  EXPECT_EQ(Parent("http://u@host:80/a/b?q/r#f/g"), "http://u@host:80/a/?q/r#f/g");
  EXPECT_EQ(Parent("s:a"), "s:./");
}

TEST(CFURLParent, OfNoPathIsNull) {
  EXPECT_EQ(Parent("http://host"), std::nullopt);
  EXPECT_EQ(Parent("#f"), std::nullopt);
}

// --- Appending a component --------------------------------------------------------------------

TEST(CFURLAppend, AddsAComponentBelow) {
  EXPECT_EQ(Appended("file:///a", u"b", false), "file:///a/b");
  EXPECT_EQ(Appended("file:///a/", u"b", false), "file:///a/b");
  EXPECT_EQ(Appended("file:///", u"b", false), "file:///b");
  EXPECT_EQ(Appended("file:///a/..", u"b", false), "file:///a/../b");
  EXPECT_EQ(Appended("./", u"b", false), "./b");
}

TEST(CFURLAppend, MarksAFolder) {
  EXPECT_EQ(Appended("file:///a", u"b", true), "file:///a/b/");
  EXPECT_EQ(Appended("file:///a", u"b/", true), "file:///a/b/");
  EXPECT_EQ(Appended("file:///a", u"b/", false), "file:///a/b");
}

TEST(CFURLAppend, AddsSlashesLiterally) {
  EXPECT_EQ(Appended("file:///a", u"b/c", false), "file:///a/b/c");
  EXPECT_EQ(Appended("file:///a", u"/b//c", false), "file:///a//b//c");
  EXPECT_EQ(Appended("file:///a", u"../b", false), "file:///a/../b");
}

TEST(CFURLAppend, EncodesWhereTheSyntaxNeedsIt) {
  EXPECT_EQ(Appended("file:///a", u"b c%?\u00E9\xDCFF:~", false),
            "file:///a/b%20c%25%3F%C3%A9%FF:~");
}

TEST(CFURLAppend, KeepsAllButThePath) {
  EXPECT_EQ(Appended("http://u@host:80/a?q/r#f/g", u"b", true), "http://u@host:80/a/b/?q/r#f/g");
}

TEST(CFURLAppend, StartsAPathWhereThereIsNone) {
  EXPECT_EQ(Appended("http://host", u"b", false), "http://host/b");
  EXPECT_EQ(Appended("?q", u"b:c", false), "b%3Ac?q");
  EXPECT_EQ(Appended("?q", u"", false), std::nullopt);
}

TEST(CFURLAppend, DoesNotMakeAnAuthorityOfAPath) {
  EXPECT_EQ(Appended("file:/", u"/b", false), "file:/.//b");
  EXPECT_EQ(Appended("/", u"/b", false), "/.//b");
}

TEST(CFURLAppend, OfNullOrAnUnpairedSurrogateIsNull) {
  const auto url = MakeUrl("/a", false);
  EXPECT_EQ(CFURLCreateCopyAppendingPathComponent(kCFAllocatorDefault, url.Get(), nullptr, 0),
            nullptr);
  EXPECT_EQ(Appended("file:///a", u"\xD800", false), std::nullopt);
}

TEST(CFURLAppend, LeavesTheOriginalAlone) {
  const auto url = MakeUrl("/a", false);
  const CFOwned longer(
      CFURLCreateCopyAppendingPathComponent(kCFAllocatorDefault, url.Get(), CFSTR("b"), 0));
  EXPECT_EQ(TextOfUrl(url), "file:///a");
  EXPECT_EQ(CFGetRetainCount(url.Get()), 1);
}

// --- URLs of their text -----------------------------------------------------------------------

TEST(CFURLBytes, BecomeTheTextUnchanged) {
  EXPECT_EQ(TextOfUrl(ParseUrl("HTTP://a/%7eb/../c")), "HTTP://a/%7eb/../c");
}

TEST(CFURLBytes, AreTakenUpToTheirLength) {
  const std::string text = "file:///abc";
  EXPECT_EQ(TextOfUrl(ParseUrl(std::string_view(text).substr(0, 9))), "file:///a");
  EXPECT_FALSE(ParseUrl(std::string_view("file:///a\0b", 11)));
}

TEST(CFURLBytes, MustBeAUrl) {
  EXPECT_FALSE(ParseUrl(""));
  EXPECT_FALSE(ParseUrl("a b"));
  EXPECT_FALSE(ParseUrl("\xC3\xA9"));
  EXPECT_FALSE(ParseUrl("\xC5\xA1"));  // U+0161, whose lower half is a letter
}

TEST(CFURLBytes, MayBeInAnyEncoding) {
  const auto parse = [](const std::string& bytes, CFStringEncoding encoding) {
    return CFOwned(CFURLCreateWithBytes(kCFAllocatorDefault,
                                        reinterpret_cast<const UInt8*>(bytes.data()),
                                        static_cast<CFIndex>(bytes.size()), encoding, nullptr));
  };
  const char16_t utf16[] = u"a/b";
  EXPECT_EQ(TextOfUrl(parse("a/b", kCFStringEncodingMacRoman)), "a/b");
  EXPECT_EQ(TextOfUrl(parse({reinterpret_cast<const char*>(utf16), 6}, kCFStringEncodingUTF16)),
            "a/b");
  EXPECT_FALSE(parse("\xE9", kCFStringEncodingISOLatin1));
  EXPECT_FALSE(parse("a/b", kCFStringEncodingInvalidId));
}

TEST(CFURLBytes, EqualAUrlMadeOfThePath) {
  EXPECT_TRUE(CFEqual(ParseUrl("file:///a%20b:c/").Get(), MakeUrl("/a b:c", true).Get()));
}

}  // namespace
}  // namespace tallowmere::foundation::test
