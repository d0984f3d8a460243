// The name of a reference's item and its extension.
#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>
#include <strings.h>

#include <cstring>
#include <vector>

#include "TestReferences.h"
#include "platform/foundation/TestGenerators.h"

namespace tallowmere::test {
namespace {

CFileRef Named(const std::string& name) {
  return CFileRef(("/a/b/" + name).c_str(), false);
}

std::string PathWithExtension(const std::string& name, const std::string& extension) {
  CFileRef reference = Named(name);
  reference.ReplaceExtensionBy(extension);
  return reference;
}

std::optional<std::string> ExtensionOf(const CFileRef& reference) {
  std::string extension = "former";
  if (reference.GetExtension(extension)) return extension;
  EXPECT_EQ(extension, "former");
  return std::nullopt;
}

// --- Names ------------------------------------------------------------------------------------

TEST(TheNameOfAReference, IsItsLastComponent) {
  char name[100];
  EXPECT_TRUE(CFileRef("/a/b c/", true).GetFileName(name, sizeof name));
  EXPECT_STREQ(name, "b c");
  EXPECT_EQ(NameOf(CFOwned(CFileRef("/a/b c/", true).CopyFileName()).Get()), "b c");
}

TEST(TheNameOfAReference, IsThereForARelativePath) {
  char name[100];
  EXPECT_TRUE(CFileRef("a/b", false).GetFileName(name, sizeof name));
  EXPECT_STREQ(name, "b");
}

TEST(TheNameOfAReference, ThatIsNotUtf8IsKept) {
  char name[100];
  EXPECT_TRUE(Named("\xFFz").GetFileName(name, sizeof name));
  EXPECT_STREQ(name, "\xFFz");
}

TEST(TheNameOfAReference, OfExactlyTheSizeLosesItsLastByte) {
  char name[5] = "xxxx";
  EXPECT_TRUE(Named("abc").GetFileName(name, 3));
  EXPECT_STREQ(name, "ab");
}

TEST(TheNameOfAReference, BeyondTheSizeIsCut) {
  char name[5] = "xxxx";
  EXPECT_FALSE(Named("abc").GetFileName(name, 2));
  EXPECT_STREQ(name, "a");
}

TEST(TheNameOfAReference, WithoutRoomTakesTheSlashesFromTheCallersText) {
  for (const long size : {0L, -1L}) {
    char name[] = "old//";
    EXPECT_FALSE(Named("abc").GetFileName(name, size));
    EXPECT_STREQ(name, "old");
    char slashes[] = "//";
    EXPECT_FALSE(Named("abc").GetFileName(slashes, size));
    EXPECT_STREQ(slashes, "");
  }
}

TEST(TheNameOfAReference, BeyondTheNameBufferIsRefused) {
  char name[2000] = "former/";
  EXPECT_TRUE(Named(std::string(1023, 'x')).HasValidName());
  EXPECT_FALSE(Named(std::string(1024, 'x')).HasValidName());
  EXPECT_FALSE(Named(std::string(1024, 'x')).GetFileName(name, sizeof name));
  EXPECT_STREQ(name, "former/");
}

TEST(TheNameOfAReference, ThatIsNoFileNameIsRefused) {
  CFileRef reference;
  ASSERT_TRUE(reference.SetFromURLString("file:///a%00b"));
  EXPECT_FALSE(reference.HasValidName());
  ASSERT_TRUE(reference.SetFromURLString("http://host"));
  EXPECT_FALSE(reference.HasValidName());
}

TEST(AnEmptyReferencesName, IsNoneInEveryQuery) {
  CFileRef empty;
  char text[] = "former/";
  std::string string = "former";
  EXPECT_EQ(empty.CopyFileName(), nullptr);
  EXPECT_EQ(empty.CopyFileExtension(), nullptr);
  EXPECT_FALSE(empty.GetFileName(text, sizeof text));
  EXPECT_FALSE(empty.HasValidName());
  EXPECT_FALSE(empty.GetExtension(text, sizeof text));
  EXPECT_FALSE(empty.GetExtension(string));
  EXPECT_FALSE(empty.HasExtension("txt"));
  empty.ReplaceExtensionBy("txt");
  EXPECT_TRUE(IsEmpty(empty));
  EXPECT_STREQ(text, "former/");
  EXPECT_EQ(string, "former");
}

// --- Extensions -------------------------------------------------------------------------------

TEST(TheExtensionOfAReference, IsWhatFollowsTheLastDot) {
  EXPECT_EQ(ExtensionOf(Named("report.TXT")), "TXT");
  EXPECT_EQ(ExtensionOf(Named("archive.tar.gz")), "gz");
  EXPECT_EQ(ExtensionOf(Named(".profile")), "profile");
  EXPECT_EQ(ExtensionOf(Named("name.")), "");
  EXPECT_EQ(ExtensionOf(Named("README")), std::nullopt);
}

TEST(TheExtensionOfAReference, DiffersFromThePlatformsView) {
  EXPECT_EQ(NameOf(CFOwned(Named("report.TXT").CopyFileExtension()).Get()), "TXT");
  EXPECT_EQ(Named(".profile").CopyFileExtension(), nullptr);
  EXPECT_EQ(Named("name.").CopyFileExtension(), nullptr);
}

TEST(TheExtensionOfAReference, NeedsRoomForItsNul) {
  char extension[5] = "xxxx";
  EXPECT_FALSE(Named("report.TXT").GetExtension(extension, 3));
  EXPECT_STREQ(extension, "xxxx");
  EXPECT_TRUE(Named("report.TXT").GetExtension(extension, 4));
  EXPECT_STREQ(extension, "TXT");
  EXPECT_FALSE(Named("name.").GetExtension(extension, 0));
}

TEST(TheExtensionOfAReference, FillsTheBufferWithNuls) {
  char extension[8] = "xxxxxxx";
  EXPECT_TRUE(Named("a.b").GetExtension(extension, 7));
  EXPECT_EQ(std::memcmp(extension, "b\0\0\0\0\0\0", 8), 0);
  EXPECT_TRUE(Named("name.").GetExtension(extension, 1));
  EXPECT_STREQ(extension, "");
}

TEST(TheExtensionOfAReference, IsNotWrittenToNull) {
  EXPECT_FALSE(Named("report.TXT").GetExtension(nullptr, 10));
}

TEST(TheExtensionOfAReference, MatchesWhatBeginsWithItInAnyLetterCase) {
  const CFileRef reference = Named("report.TXT");
  for (const char* match : {"txt", ".txt", "TXT", "txts"}) {
    EXPECT_TRUE(reference.HasExtension(match)) << match;
  }
  for (const char* other : {"", "t", "tx", "..txt", ".", "doc"}) {
    EXPECT_FALSE(reference.HasExtension(other)) << other;
  }
}

TEST(TheExtensionOfAReference, ThatIsEmptyMatchesEverythingButAnEmptyArgument) {
  EXPECT_TRUE(Named("name.").HasExtension("txt"));
  EXPECT_TRUE(Named("name.").HasExtension("."));
  EXPECT_FALSE(Named("name.").HasExtension(""));
}

TEST(TheExtensionOfAReference, ThatIsMissingMatchesNothing) {
  EXPECT_FALSE(Named("README").HasExtension("txt"));
  EXPECT_FALSE(Named("README").HasExtension("."));
}

TEST(TheExtensionOfAReference, OfTwentyCharactersMatchesNothing) {
  const std::string nineteen(19, 'x');
  const std::string twenty(20, 'x');
  EXPECT_TRUE(Named("a." + nineteen).HasExtension(nineteen));
  EXPECT_FALSE(Named("a." + twenty).HasExtension(twenty));
}

TEST(ReplacingTheExtension, KeepsTheNameUpToItsLastDot) {
  EXPECT_EQ(PathWithExtension("archive.tar.gz", "zip"), "/a/b/archive.tar.zip");
  EXPECT_EQ(PathWithExtension("archive.tar.gz", ".zip"), "/a/b/archive.tar.zip");
  EXPECT_EQ(PathWithExtension("archive.tar.gz", "..zip"), "/a/b/archive.tar..zip");
  EXPECT_EQ(PathWithExtension(".profile", "txt"), "/a/b/.txt");
}

TEST(ReplacingTheExtension, ByNothingCutsItOffWithItsDot) {
  EXPECT_EQ(PathWithExtension("archive.tar.gz", ""), "/a/b/archive.tar");
}

TEST(ReplacingTheExtension, ByADotKeepsTheDot) {
  EXPECT_EQ(PathWithExtension("archive.tar.gz", "."), "/a/b/archive.tar.");
}

TEST(ReplacingTheExtension, AddsOneWhereThereIsNone) {
  EXPECT_EQ(PathWithExtension("README", ".md"), "/a/b/README.md");
  EXPECT_EQ(PathWithExtension("README", ""), "/a/b/README.");
}

TEST(ReplacingTheExtension, MakesAFileOfAFolder) {
  CFileRef reference("/a/b/c.d", true);
  reference.ReplaceExtensionBy("e");
  EXPECT_STREQ(reference.GetPath(), "/a/b/c.e");
  EXPECT_FALSE(IsMarkedAsFolder(reference));
}

TEST(ReplacingTheExtension, OfANameThatIsNotUtf8ChangesNothing) {
  CFileRef reference = Named("\xFF.txt");
  const CFURLRef url = UrlOf(reference);
  reference.ReplaceExtensionBy("md");
  EXPECT_EQ(UrlOf(reference), url);
}

TEST(ReplacingTheExtension, OfTooLongANameChangesNothing) {
  CFileRef reference = Named(std::string(1100, 'x'));
  const CFURLRef url = UrlOf(reference);
  reference.ReplaceExtensionBy("md");
  EXPECT_EQ(UrlOf(reference), url);
}

// --- Models -----------------------------------------------------------------------------------

// Returns false for names that a URL's path does not keep as a component.
bool IsPlain(const std::string& name) {
  return !name.empty() && name != "." && name != "..";
}

std::string Buffer() {
  return std::string(1200, 'x');
}

// Returns the text before the first NUL.
std::string TextIn(const std::string& buffer) {
  return buffer.substr(0, buffer.find('\0'));
}

RC_GTEST_PROP(NameModel, GetFileName, ()) {
  const auto name = *rc::gen::suchThat(foundation::test::AnyName(), IsPlain);
  const auto size = *rc::gen::inRange<std::size_t>(0, 1101);
  std::string buffer = Buffer();
  const std::string before = size == 0 ? "old/" : buffer;
  if (size == 0) buffer = "old/";
  const bool fits = Named(name).GetFileName(buffer.data(), static_cast<long>(size));
  RC_ASSERT(fits == (name.size() < 1024 && name.size() <= size));
  if (size == 0) {
    RC_ASSERT(TextIn(buffer) == (name.size() < 1024 ? "old" : "old/"));
  } else if (name.size() >= 1024) {
    RC_ASSERT(buffer == before);
  } else {
    RC_ASSERT(TextIn(buffer) == name.substr(0, size - 1));
  }
}

// As above, mostly with lengths around the size of the name buffer.
RC_GTEST_PROP(NameModel, GetFileNameOfLongNames, ()) {
  const std::string name(*rc::gen::inRange<std::size_t>(1, 1100), 'n');
  const auto size = *rc::gen::inRange<std::size_t>(1, 1101);
  std::string buffer = Buffer();
  const bool fits = Named(name).GetFileName(buffer.data(), static_cast<long>(size));
  RC_ASSERT(fits == (name.size() < 1024 && name.size() <= size));
  if (name.size() < 1024) RC_ASSERT(TextIn(buffer) == name.substr(0, size - 1));
}

RC_GTEST_PROP(NameModel, GetExtension, ()) {
  const auto name = *rc::gen::suchThat(foundation::test::AnyName(), IsPlain);
  const auto size = *rc::gen::inRange<std::size_t>(0, 1101);
  const std::size_t dot = name.rfind('.');
  const bool has = name.size() < 1024 && dot != std::string::npos;
  const std::string expected = has ? name.substr(dot + 1) : "";
  std::string buffer = Buffer();
  RC_ASSERT(Named(name).GetExtension(buffer.data(), size) == (has && expected.size() < size));
  if (has && expected.size() < size) {
    RC_ASSERT(buffer.substr(0, size) == expected + std::string(size - expected.size(), '\0'));
  } else {
    RC_ASSERT(buffer == Buffer());
  }
  RC_ASSERT(ExtensionOf(Named(name)) == (has ? std::optional(expected) : std::nullopt));
}

RC_GTEST_PROP(NameModel, HasExtension, ()) {
  const auto stem = *foundation::test::AnyName();
  const auto own = *rc::gen::container<std::string>(rc::gen::element('a', 'A', 'b', '.'));
  const auto asked = *rc::gen::container<std::string>(rc::gen::element('a', 'A', 'b', '.'));
  const std::string name = stem + "." + own;
  RC_PRE(IsPlain(name));
  const std::string extension = name.substr(name.rfind('.') + 1);
  const std::string wanted = asked.starts_with('.') ? asked.substr(1) : asked;
  const bool begins =
      wanted.size() >= extension.size() &&
      strcasecmp(wanted.substr(0, extension.size()).c_str(), extension.c_str()) == 0;
  RC_ASSERT(Named(name).HasExtension(asked) ==
            (!asked.empty() && name.size() < 1024 && extension.size() < 20 && begins));
}

}  // namespace
}  // namespace tallowmere::test
