// Setting a reference from a path, folder and name, URL or FSRef, and expanding a tilde.
#include <gtest/gtest.h>
#include <pwd.h>

#include <functional>
#include <string>

#include "TestReferences.h"
#include "platform/foundation/TestVolumes.h"

namespace tallowmere::test {
namespace {

constexpr auto kUnknownStyle = static_cast<tPathStyle>(5);

// An unpaired surrogate, which no file name and no URL can express.
const auto kUnpaired = u"a\xD800";

// The current user's entry, read anew before each use.
struct User {
  std::string name;
  std::string home;
};
std::optional<User> CurrentUser() {
  const passwd* const entry = getpwuid(getuid());
  if (entry == nullptr || entry->pw_dir[0] != '/' || entry->pw_name[0] == '\0') return std::nullopt;
  return User{entry->pw_name, entry->pw_dir};
}

std::string WithoutSlash(std::string path) {
  while (path.size() > 1 && path.ends_with('/')) path.pop_back();
  return path;
}

class HomeFolder : public testing::Test {
 protected:
  void SetUp() override {
    const auto user = CurrentUser();
    if (!user) GTEST_SKIP() << "the current user has no entry with an absolute home folder";
    mUser = *user;
  }

  // Checks setting from a path, both as C text and as a string.
  static void ExpectPath(const std::string& path, bool isDirectory, const std::string& expected,
                         bool expectedFolder) {
    CFileRef reference;
    EXPECT_TRUE(reference.Set(path.c_str(), isDirectory)) << path;
    EXPECT_EQ(PathOf(reference), expected);
    EXPECT_EQ(IsMarkedAsFolder(reference), expectedFolder) << path;
    EXPECT_TRUE(reference.Set(MakeName(path).Get(), kPathStylePOSIX, isDirectory)) << path;
    EXPECT_EQ(PathOf(reference), expected);
    EXPECT_EQ(IsMarkedAsFolder(reference), expectedFolder) << path;
  }

  User mUser;
};

TEST_F(HomeFolder, OfTheCurrentUserIsAFolderWhateverIsAsked) {
  for (const char* path : {"~", "~/"}) {
    ExpectPath(path, false, WithoutSlash(mUser.home), true);
    ExpectPath(path, true, WithoutSlash(mUser.home), true);
  }
}

TEST_F(HomeFolder, OfTheCurrentUserIsPutInFrontOfAPath) {
  ExpectPath("~/Music/a.aif", false, mUser.home + "/Music/a.aif", false);
  ExpectPath("~/Music/a.aif", true, mUser.home + "/Music/a.aif", true);
}

TEST_F(HomeFolder, OfANamedUserIsAFolderWhateverIsAsked) {
  for (const std::string& path : {"~" + mUser.name, "~" + mUser.name + "/"}) {
    ExpectPath(path, false, WithoutSlash(mUser.home), true);
    ExpectPath(path, true, WithoutSlash(mUser.home), true);
  }
}

TEST_F(HomeFolder, OfANamedUserIsPutInFrontOfAPath) {
  ExpectPath("~" + mUser.name + "/x", false, mUser.home + "/x", false);
  ExpectPath("~" + mUser.name + "/x", true, mUser.home + "/x", true);
}

TEST_F(HomeFolder, IsJoinedWithoutRemovingSlashes) {
  ExpectPath("~//x", false, mUser.home + "//x", false);
}

TEST_F(HomeFolder, IsExpandedInAFolderWithAName) {
  const CFileRef reference(MakeString(u"~").Get(), MakeString(u"x").Get());
  EXPECT_EQ(PathOf(reference), mUser.home + "/x");
  EXPECT_FALSE(IsMarkedAsFolder(reference));
}

TEST_F(HomeFolder, OfANameThatCannotBeConvertedIsTheCurrentUsers) {
  const CFileRef reference(MakeString(u"~\xD800/x").Get(), kPathStylePOSIX, false);
  EXPECT_EQ(PathOf(reference), mUser.home + "/x");
}

TEST_F(HomeFolder, OfAPartlyConvertibleNameIsThatOfTheConvertedPart) {
  ExpectPath("~" + mUser.name + "\xFFz/x", false, mUser.home + "/x", false);
}

TEST(SettingAReference, ToTheHomeFolderOfAnUnknownUserFails) {
  ASSERT_EQ(getpwnam("tallowmere no such user"), nullptr);
  CFileRef reference("/a", false);
  EXPECT_FALSE(reference.Set("~tallowmere no such user/x", false));
  EXPECT_TRUE(IsEmpty(reference));
  EXPECT_FALSE(reference.Set(("~" + std::string(100000, 'x')).c_str(), false));
}

TEST(SettingAReference, ExpandsATildeOnlyInTheFirstPosition) {
  EXPECT_EQ(PathOf(CFileRef("a~b", false)), "a~b");
  EXPECT_EQ(PathOf(CFileRef("/x/~", false)), "/x/~");
  EXPECT_EQ(PathOf(CFileRef("./~", false)), "./~");
}

TEST(SettingAReference, ExpandsATildeOnlyInThePosixStyle) {
  EXPECT_EQ(PathOf(CFileRef(MakeString(u"~").Get(), kPathStyleWindows, false)), "~");
  EXPECT_EQ(PathOf(CFileRef(MakeString(u":~").Get(), kPathStyleHFS, false)), "~");
}

TEST(SettingAReference, MarksAFolderAsAsked) {
  for (const bool isDirectory : {false, true}) {
    CFileRef reference("/a/b", isDirectory);
    EXPECT_EQ(PathOf(reference), "/a/b");
    EXPECT_EQ(IsMarkedAsFolder(reference), isDirectory);
    reference.Set(MakeString(u"/a/b").Get(), kPathStylePOSIX, isDirectory);
    EXPECT_EQ(IsMarkedAsFolder(reference), isDirectory);
  }
}

TEST(SettingAReference, TakesPathsThatAreNotUtf8) {
  EXPECT_STREQ(CFileRef("/a/\xFF\x80 b", false).GetPath(), "/a/\xFF\x80 b");
}

TEST(SettingAReference, TakesItsOwnPath) {
  CFileRef reference("/a/b", false);
  EXPECT_TRUE(reference.Set(reference.GetPath(), true));
  EXPECT_STREQ(reference.GetPath(), "/a/b");
  EXPECT_TRUE(IsMarkedAsFolder(reference));
}

TEST(SettingAReference, FromItsOwnCacheLeavesItEmpty) {
  CFileRef reference("/", true);
  FSRef const& cache = reference;
  EXPECT_FALSE(reference.Set(&cache));
  EXPECT_FALSE(reference.IsValid());
}

// --- Styles -----------------------------------------------------------------------------------

TEST(SettingAReference, FromAnHfsPathFindsItsVolume) {
  const CFileRef reference(MakeString(u"Data:a/b:c").Get(), kPathStyleHFS, false);
  EXPECT_EQ(PathOf(reference), "/mnt/data/a:b/c");
  EXPECT_EQ(PathOf(CFileRef(MakeString(u"No such volume:a").Get(), kPathStyleHFS, false)),
            std::nullopt);
}

TEST(SettingAReference, FromAWindowsPathAndFromAnUnknownStyleIsTheSame) {
  for (const tPathStyle style : {kPathStyleWindows, kUnknownStyle}) {
    const CFileRef reference(MakeString(u"C:\\a\\b").Get(), style, true);
    EXPECT_EQ(PathOf(reference), "/C:/a/b");
    EXPECT_TRUE(IsMarkedAsFolder(reference));
  }
}

// --- Folder and name --------------------------------------------------------------------------

struct Joined {
  std::optional<std::string> path;
  bool isFolder;
};

Joined JoinedFrom(const char16_t* folder, const char16_t* name) {
  const auto nameString = name != nullptr ? MakeString(name) : CFOwned<CFStringRef>();
  CFileRef reference("/former", false);
  const bool isSet = reference.Set(MakeString(folder).Get(), nameString.Get());
  EXPECT_EQ(isSet, reference.IsValid());
  return {PathOf(reference), isSet && IsMarkedAsFolder(reference)};
}

TEST(SettingAReference, FromAnEmptyFolderAndANameIsTheRelativeName) {
  const auto [path, isFolder] = JoinedFrom(u"", u"x");
  EXPECT_EQ(path, "x");
  EXPECT_FALSE(isFolder);
}

TEST(SettingAReference, FromAFolderAndANameJoinsThemWithASlash) {
  const auto [path, isFolder] = JoinedFrom(u"/a", u"x");
  EXPECT_EQ(path, "/a/x");
  EXPECT_FALSE(isFolder);
}

TEST(SettingAReference, FromAFolderWithASlashDoublesIt) {
  EXPECT_EQ(JoinedFrom(u"/a/", u"x").path, "/a//x");
}

TEST(SettingAReference, FromAFolderAloneIsAFolder) {
  const auto [path, isFolder] = JoinedFrom(u"/a", nullptr);
  EXPECT_EQ(path, "/a");
  EXPECT_TRUE(isFolder);
}

TEST(SettingAReference, FromTwoEmptyStringsFails) {
  EXPECT_EQ(JoinedFrom(u"", u"").path, std::nullopt);
  EXPECT_EQ(JoinedFrom(u"", nullptr).path, std::nullopt);
}

TEST(SettingAReference, ByConstructorsIsTheSameAsBySetters) {
  const auto url = MakeUrl("/a", true);
  EXPECT_EQ(PathOf(CFileRef(MakeString(u"/a").Get(), MakeString(u"x").Get())), "/a/x");
  EXPECT_EQ(PathOf(CFileRef(url.Get())), "/a");
  EXPECT_TRUE(IsEmpty(CFileRef("", false)));
  EXPECT_TRUE(IsEmpty(CFileRef(static_cast<char const*>(nullptr), false)));
  EXPECT_TRUE(IsEmpty(CFileRef(static_cast<CFURLRef>(nullptr))));
  EXPECT_TRUE(IsEmpty(CFileRef(static_cast<FSRef const*>(nullptr))));
  EXPECT_TRUE(IsEmpty(CFileRef(nullptr, kPathStylePOSIX, false)));
}

// --- URLs -------------------------------------------------------------------------------------

TEST(SettingAReference, ToAUrlSharesIt) {
  const auto url = MakeUrl("/a", false);
  CFileRef reference;
  EXPECT_TRUE(reference.Set(url.Get()));
  EXPECT_EQ(UrlOf(reference), url.Get());
  EXPECT_EQ(CFGetRetainCount(url.Get()), 2);
}

TEST(SettingAReference, ToAUrlWithAFolderFlagMakesANewOne) {
  for (const bool isDirectory : {false, true}) {
    const auto url = MakeUrl("/a/b", !isDirectory);
    CFileRef reference;
    EXPECT_TRUE(reference.Set(url.Get(), isDirectory));
    EXPECT_EQ(CFGetRetainCount(url.Get()), 1);
    EXPECT_EQ(PathOf(reference), "/a/b");
    EXPECT_EQ(IsMarkedAsFolder(reference), isDirectory);
  }
}

TEST(SettingAReference, ToAnotherWithAFolderFlagMakesANewUrl) {
  for (const bool isDirectory : {false, true}) {
    const CFileRef source("/a/b", !isDirectory);
    CFileRef reference("/former", false);
    EXPECT_TRUE(reference.Set(source, isDirectory));
    EXPECT_NE(UrlOf(reference), UrlOf(source));
    EXPECT_EQ(CFGetRetainCount(UrlOf(source)), 1);
    EXPECT_EQ(PathOf(reference), "/a/b");
    EXPECT_EQ(IsMarkedAsFolder(reference), isDirectory);
  }
}

TEST(SettingAReference, ToAUrlWithAFolderFlagExpandsNoTilde) {
  CFileRef reference;
  EXPECT_TRUE(reference.Set(MakeUrl("~", false).Get(), true));
  EXPECT_EQ(PathOf(reference), "~");
}

TEST(SettingAReference, FromUrlTextTakesAnyScheme) {
  CFileRef reference;
  for (const char* text : {"file:///a%20b", "http://host/a", "mailto:somebody", "a/b"}) {
    EXPECT_TRUE(reference.SetFromURLString(text)) << text;
    EXPECT_EQ(CFGetRetainCount(UrlOf(reference)), 1);
    EXPECT_TRUE(CFEqual(UrlOf(reference), ParseUrl(text).Get()));
  }
}

TEST(SettingAReference, FromTextThatIsNoUrlFails) {
  for (const std::string& text :
       {std::string(), std::string("a b"), std::string("%zz"), std::string("/\xC3\xA9"),
        std::string("/\xFF"), std::string("file:///a\0b", 11)}) {
    CFileRef reference("/former", false);
    EXPECT_FALSE(reference.SetFromURLString(text)) << text;
    EXPECT_TRUE(IsEmpty(reference));
  }
}

// --- FSRefs -----------------------------------------------------------------------------------

TEST(SettingAReference, ToAnFSRefIsTheItemsPath) {
  const TemporaryFolder folder;
  const CFileRef file(folder.MakeFile("x").c_str(), true);
  CFileRef reference;
  EXPECT_TRUE(reference.Set(static_cast<FSRef const*>(file)));
  EXPECT_EQ(PathOf(reference), folder.Path() / "x");
  EXPECT_FALSE(IsMarkedAsFolder(reference));
  const CFileRef ofFolder(static_cast<FSRef const*>(CFileRef(folder.Path().c_str(), false)));
  EXPECT_EQ(PathOf(ofFolder), folder.Path());
  EXPECT_TRUE(IsMarkedAsFolder(ofFolder));
}

TEST(SettingAReference, ToTheFSRefOfNothingFails) {
  const FSRef nothing = {};
  CFileRef reference("/former", false);
  EXPECT_FALSE(reference.Set(&nothing));
  EXPECT_TRUE(IsEmpty(reference));
}

// --- Failure ----------------------------------------------------------------------------------

TEST(SettingAReference, UnsuccessfullyEmptiesItAndReleasesWhatItHeld) {
  const auto url = MakeUrl("/", true);
  const auto pathless = ParseUrl("http://host");
  const auto unpaired = MakeString(kUnpaired);
  const auto empty = MakeString(u"");
  const FSRef nothing = {};
  const CFileRef none;
  const std::function<bool(CFileRef&)> failures[] = {
      [](CFileRef& r) { return r.Set(static_cast<char const*>(nullptr), false); },
      [](CFileRef& r) { return r.Set("", false); },
      [](CFileRef& r) { return r.Set(nullptr, kPathStylePOSIX, false); },
      [](CFileRef& r) { return r.Set(nullptr, kPathStyleHFS, false); },
      [&](CFileRef& r) { return r.Set(unpaired.Get(), kPathStylePOSIX, false); },
      [&](CFileRef& r) { return r.Set(unpaired.Get(), kPathStyleHFS, false); },
      [&](CFileRef& r) { return r.Set(unpaired.Get(), kPathStyleWindows, false); },
      [&](CFileRef& r) { return r.Set(empty.Get(), kPathStylePOSIX, false); },
      [&](CFileRef& r) { return r.Set(empty.Get(), empty.Get()); },
      [](CFileRef& r) { return r.SetFromURLString("a b"); },
      [](CFileRef& r) { return r.Set(static_cast<CFURLRef>(nullptr)); },
      [](CFileRef& r) { return r.Set(static_cast<CFURLRef>(nullptr), false); },
      [&](CFileRef& r) { return r.Set(pathless.Get(), false); },
      [](CFileRef& r) { return r.Set(static_cast<FSRef const*>(nullptr)); },
      [&](CFileRef& r) { return r.Set(&nothing); },
      [&](CFileRef& r) { return r.Set(none, false); },
  };
  for (std::size_t i = 0; i < std::size(failures); ++i) {
    CFileRef reference(url.Get());
    reference.GetPath();
    reference.UpdateInternalFSRef();
    EXPECT_FALSE(failures[i](reference)) << i;
    EXPECT_TRUE(IsEmpty(reference)) << i;
    EXPECT_EQ(CFGetRetainCount(url.Get()), 1) << i;
  }
  EXPECT_EQ(CFGetRetainCount(pathless.Get()), 1);
  EXPECT_EQ(CFGetRetainCount(unpaired.Get()), 1);
}

TEST(SettingAReference, DropsTheCachesOfTheFormerItem) {
  CFileRef reference("/", true);
  reference.GetPath();
  reference.UpdateInternalFSRef();
  EXPECT_TRUE(reference.Set("/a", false));
  EXPECT_EQ(CachedPathOf(reference), nullptr);
  EXPECT_TRUE(IsZero(CachedFSRefOf(reference)));
}

// --- CreateURLByExpandingTildePath ------------------------------------------------------------

TEST(ExpandingATilde, GivesAUrlThatTheCallerOwns) {
  const CFOwned url(CreateURLByExpandingTildePath(MakeString(u"/a").Get(), true));
  EXPECT_EQ(CFGetRetainCount(url.Get()), 1);
  EXPECT_TRUE(CFEqual(url.Get(), MakeUrl("/a", true).Get()));
}

TEST(ExpandingATilde, KeepsNothingOfItsArgumentBeyondTheUrl) {
  for (const char16_t* text : {u"/a", u"~", u"~/x", u"~tallowmere no such user", u"", u"a\xD800"}) {
    const auto path = MakeString(text);
    CFOwned(CreateURLByExpandingTildePath(path.Get(), true));
    EXPECT_EQ(CFGetRetainCount(path.Get()), 1);
  }
}

TEST(ExpandingATildeDeathTest, StopsTheProcessForANullPath) {
  EXPECT_DEATH(const CFOwned url(CreateURLByExpandingTildePath(nullptr, false)),
               "path != NULL.*CreateURLByExpandingTildePath.*CFileRef.*line 64");
}

}  // namespace
}  // namespace tallowmere::test
