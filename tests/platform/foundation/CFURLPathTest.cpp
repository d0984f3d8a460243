// URLs made from paths, and paths made from URLs.
#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <string>

#include "TestGenerators.h"
#include "TestStrings.h"
#include "TestVolumes.h"
#include "foundation/Url.h"

namespace tallowmere::foundation::test {
namespace {

using namespace std::string_literals;

std::string TextOfUrl(const CFOwned<CFURLRef>& url) {
  return UrlOf(url.Get()).Text();
}

// Makes a temporary folder and changes into it while the object exists.
class CurrentFolder {
 public:
  CurrentFolder() : mBefore(std::filesystem::current_path()) {
    std::string name = std::filesystem::temp_directory_path() / "tallowmere-XXXXXX";
    mPath = std::filesystem::canonical(mkdtemp(name.data()));
    std::filesystem::current_path(mPath);
  }
  CurrentFolder(const CurrentFolder&) = delete;
  CurrentFolder& operator=(const CurrentFolder&) = delete;
  ~CurrentFolder() {
    std::filesystem::current_path(mBefore);
    std::filesystem::remove_all(mPath);
  }
  const std::filesystem::path& Path() const { return mPath; }

 private:
  std::filesystem::path mBefore;
  std::filesystem::path mPath;
};

// --- POSIX paths ------------------------------------------------------------------------------

TEST(CFURLPath, FolderGetsATrailingSlashIfItHasNone) {
  EXPECT_EQ(TextOfUrl(MakeUrl("/a", true)), "file:///a/");
  EXPECT_EQ(TextOfUrl(MakeUrl("/a/", true)), "file:///a/");
  EXPECT_EQ(TextOfUrl(MakeUrl("/a//", true)), "file:///a//");
  EXPECT_EQ(TextOfUrl(MakeUrl("/", true)), "file:///");
}

TEST(CFURLPath, FileLosesTrailingSlashes) {
  EXPECT_EQ(TextOfUrl(MakeUrl("/a", false)), "file:///a");
  EXPECT_EQ(TextOfUrl(MakeUrl("/a//", false)), "file:///a");
  EXPECT_EQ(TextOfUrl(MakeUrl("a/", false)), "a");
}

TEST(CFURLPath, RootKeepsItsSlash) {
  EXPECT_EQ(TextOfUrl(MakeUrl("/", false)), "file:///");
  EXPECT_EQ(TextOfUrl(MakeUrl("//", false)), "file:///");
}

TEST(CFURLPath, EmptyPathHasNoUrl) {
  for (const CFURLPathStyle style :
       {kCFURLPOSIXPathStyle, kCFURLHFSPathStyle, kCFURLWindowsPathStyle}) {
    EXPECT_FALSE(MakeUrl("", false, style));
    EXPECT_FALSE(MakeUrl("", true, style));
  }
}

TEST(CFURLPath, UnknownStyleHasNoUrlAndNoPath) {
  EXPECT_FALSE(MakeUrl("/a", false, 3));
  EXPECT_EQ(PathIn(MakeUrl("/a", false), 3), std::nullopt);
}

TEST(CFURLPath, OtherUnpairedSurrogateHasNoUrl) {
  const auto path = MakeString(u"/a\xD800z");
  EXPECT_EQ(CFURLCreateWithFileSystemPath(kCFAllocatorDefault, path.Get(), kCFURLPOSIXPathStyle, 0),
            nullptr);
}

TEST(CFURLPath, BytesOutsideTheSyntaxArePercentEncoded) {
  EXPECT_EQ(TextOfUrl(MakeUrl("/a b%?#\xC3\xA9\xFF\x01[]~:@", false)),
            "file:///a%20b%25%3F%23%C3%A9%FF%01%5B%5D~:@");
}

TEST(CFURLPath, ColonInARelativePathDoesNotReadAsAScheme) {
  const auto url = MakeUrl("a:b/c:d", false);
  EXPECT_EQ(TextOfUrl(url), "a%3Ab/c:d");
  EXPECT_EQ(PathOf(url), "a:b/c:d");
}

TEST(CFURLPath, PathComesWithoutTheFolderMark) {
  EXPECT_EQ(PathOf(MakeUrl("/a/b/", true)), "/a/b");
  EXPECT_EQ(PathOf(MakeUrl("/a/b//", true)), "/a/b");
  EXPECT_EQ(PathOf(MakeUrl("a", true)), "a");
  EXPECT_EQ(PathOf(MakeUrl("/", true)), "/");
}

TEST(CFURLPath, DoubledSlashesStay) {
  EXPECT_EQ(PathOf(MakeUrl("//a//b", false)), "//a//b");
}

TEST(CFURLPath, RelativePathStaysRelative) {
  EXPECT_EQ(PathOf(MakeUrl("a/b", false)), "a/b");
  EXPECT_EQ(PathOf(MakeUrl("../a", false)), "../a");
}

TEST(CFURLPath, IsPercentDecoded) {
  EXPECT_EQ(PathOf(ParseUrl("file:///a%20%c3%A9%ff")), "/a \xC3\xA9\xFF");
}

TEST(CFURLPath, EscapedBytesThatFormUtf8AreReadTogether) {
  const CFOwned url(CFURLCreateWithFileSystemPath(
      kCFAllocatorDefault, MakeString(u"/\xDCC3\xDCA9").Get(), kCFURLPOSIXPathStyle, 0));
  const CFOwned path(CFURLCopyFileSystemPath(url.Get(), kCFURLPOSIXPathStyle));
  EXPECT_EQ(TextOf(path.Get()), u"/\u00E9");
}

TEST(CFURLPath, DoesNotFollowLaterChangesOfItsString) {
  const CFOwned string(CFStringCreateMutableCopy(kCFAllocatorDefault, 0, MakeName("/a").Get()));
  const CFOwned url(
      CFURLCreateWithFileSystemPath(kCFAllocatorDefault, string.Get(), kCFURLPOSIXPathStyle, 0));
  CFStringAppend(string.Get(), CFSTR("b"));
  EXPECT_EQ(PathOf(url), "/a");
}

TEST(CFURLPath, EncodedNulHasNoPath) {
  const auto url = ParseUrl("file:///a%00b");
  for (const CFURLPathStyle style :
       {kCFURLPOSIXPathStyle, kCFURLHFSPathStyle, kCFURLWindowsPathStyle}) {
    EXPECT_EQ(CFURLCopyFileSystemPath(url.Get(), style), nullptr);
  }
}

TEST(CFURLPath, UrlWithNoPathHasNone) {
  for (const char* text : {"http://host", "?q"}) {
    EXPECT_EQ(CFURLCopyFileSystemPath(ParseUrl(text).Get(), kCFURLPOSIXPathStyle), nullptr);
  }
}

TEST(CFURLPath, EverySchemeHasItsPath) {
  EXPECT_EQ(PathOf(ParseUrl("http://host:80/a/b/?q#f")), "/a/b");
}

TEST(CFURLPath, LongerThanALinuxPathSurvivesARoundTrip) {
  std::string path;
  for (int i = 0; i < 3000; ++i) path += "/\xC3\xA9";
  EXPECT_EQ(PathOf(MakeUrl(path, false)), path);
}

RC_GTEST_PROP(CFURLPath, EveryAbsolutePathSurvivesARoundTripWithTheRequestedMark, (bool folder)) {
  const std::string path = "/" + *AnyPath();
  const auto url = MakeUrl(path, folder);
  const auto name = path.substr(0, std::max(path.find_last_not_of('/') + 1, std::size_t{1}));
  RC_ASSERT(PathOf(url) == name);
  const auto text = TextOfUrl(url);
  RC_ASSERT(text.ends_with('/') == (folder || name == "/"));
  RC_ASSERT(TextOfUrl(ParseUrl(text)) == text);
}

RC_GTEST_PROP(CFURLPath, EveryRelativePathSurvivesARoundTrip, (bool folder)) {
  const std::string path = *rc::gen::distinctFrom(AnyName(), std::string()) + *AnyPath();
  const auto url = MakeUrl(path, folder);
  RC_ASSERT(PathOf(url) == path.substr(0, path.find_last_not_of('/') + 1));
  RC_ASSERT(static_cast<bool>(ParseUrl(TextOfUrl(url))));
}

// --- Strict paths -----------------------------------------------------------------------------

TEST(CFURLStrictPath, IsThePathAndWhetherItIsAbsolute) {
  Boolean isAbsolute = false;
  const auto absolute = MakeUrl("/a/b", true);
  EXPECT_EQ(NameOf(CFOwned(CFURLCopyStrictPath(absolute.Get(), &isAbsolute)).Get()), "/a/b");
  EXPECT_TRUE(isAbsolute);
  const auto relative = MakeUrl("a/b", true);
  EXPECT_EQ(NameOf(CFOwned(CFURLCopyStrictPath(relative.Get(), &isAbsolute)).Get()), "a/b");
  EXPECT_FALSE(isAbsolute);
}

TEST(CFURLStrictPath, OfNoPathIsNullAndNotAbsolute) {
  Boolean isAbsolute = true;
  EXPECT_EQ(CFURLCopyStrictPath(ParseUrl("http://host").Get(), &isAbsolute), nullptr);
  EXPECT_FALSE(isAbsolute);
}

TEST(CFURLStrictPath, FlagMayBeNull) {
  EXPECT_TRUE(CFOwned(CFURLCopyStrictPath(MakeUrl("/a", false).Get(), nullptr)));
}

// --- The current directory --------------------------------------------------------------------

TEST(CFURLBase, RelativePathRemembersTheCurrentDirectory) {
  const CurrentFolder here;
  const auto url = MakeUrl("a", false);
  std::filesystem::current_path("/");
  EXPECT_EQ(AbsolutePathOfUrl(url.Get()), here.Path() / "a");
}

TEST(CFURLBase, EqualTextsWithDifferentBasesAreNotEqual) {
  const CurrentFolder here;
  const auto url = MakeUrl("a", false);
  EXPECT_TRUE(CFEqual(url.Get(), MakeUrl("a", false).Get()));
  std::filesystem::current_path("/");
  EXPECT_FALSE(CFEqual(url.Get(), MakeUrl("a", false).Get()));
}

TEST(CFURLBase, AbsolutePathHasNone) {
  const CurrentFolder here;
  const auto url = MakeUrl("/a", false);
  std::filesystem::current_path("/");
  EXPECT_TRUE(CFEqual(url.Get(), MakeUrl("/a", false).Get()));
}

TEST(CFURLBase, DifferentFolderMarksAreNotEqual) {
  EXPECT_FALSE(CFEqual(MakeUrl("/a", false).Get(), MakeUrl("/a", true).Get()));
}

TEST(CFURLBase, EditingKeepsIt) {
  const CurrentFolder here;
  const auto url = MakeUrl("a/b", false);
  std::filesystem::current_path("/");
  const CFOwned parent(CFURLCreateCopyDeletingLastPathComponent(kCFAllocatorDefault, url.Get()));
  EXPECT_EQ(AbsolutePathOfUrl(parent.Get()), here.Path() / "a");
  const CFOwned child(
      CFURLCreateCopyAppendingPathComponent(kCFAllocatorDefault, url.Get(), CFSTR("c"), 0));
  EXPECT_EQ(AbsolutePathOfUrl(child.Get()), here.Path() / "a/b/c");
}

TEST(CFURLBase, MayBeLongAndOddlyNamed) {
  const CurrentFolder here;
  const std::string name = std::string(250, 'x') + "%\xFF";
  for (int i = 0; i < 20; ++i) {  // one step at a time to a path of more than 4096 bytes
    ASSERT_TRUE(std::filesystem::create_directory(name));
    ASSERT_EQ(chdir(name.c_str()), 0);
  }
  const auto path = AbsolutePathOfUrl(MakeUrl("a", false).Get());
  ASSERT_TRUE(path.has_value());
  EXPECT_EQ(path->size(), here.Path().native().size() + 20 * (name.size() + 1) + 2);
  EXPECT_TRUE(path->ends_with(name + "/" + name + "/a"));
}

TEST(CFURLBase, RelativePathInARemovedFolderHasNoUrl) {
  const CurrentFolder here;
  std::filesystem::remove(here.Path());
  EXPECT_FALSE(MakeUrl("a", false));
  EXPECT_TRUE(MakeUrl("/a", false));
}

// --- Absolute paths of file URLs --------------------------------------------------------------

TEST(CFURLAbsolutePath, IsOfFileUrlsOnThisMachine) {
  for (const char* text : {"file:///a%20b/", "FILE://LocalHost/a%20b", "file:/a%20b?q#f"}) {
    EXPECT_EQ(AbsolutePathOfUrl(ParseUrl(text).Get()), "/a b") << text;
  }
}

TEST(CFURLAbsolutePath, OtherUrlsHaveNone) {
  for (const char* text : {"http:///a", "file://server/a", "file:a", "/a", "a", "files:///a",
                           "file:///a%00", "file://"}) {
    EXPECT_EQ(AbsolutePathOfUrl(ParseUrl(text).Get()), std::nullopt) << text;
  }
}

TEST(CFURLAbsolutePath, HasNoFolderMark) {
  EXPECT_EQ(AbsolutePathOfUrl(MakeUrl("/a", true).Get()), "/a");
  EXPECT_EQ(AbsolutePathOfUrl(MakeUrl("/", true).Get()), "/");
}

// --- Other styles -----------------------------------------------------------------------------

TEST(CFURLHfsPath, BecomesAPathOnItsVolumeAndBack) {
  const auto file = MakeUrl("Data:Dir:a/b", false, kCFURLHFSPathStyle);
  EXPECT_EQ(TextOfUrl(file), "file:///mnt/data/Dir/a:b");
  EXPECT_EQ(PathIn(file, kCFURLHFSPathStyle), "Data:Dir:a/b");
}

TEST(CFURLHfsPath, FolderEndsInAColon) {
  const auto folder = MakeUrl("Data:Dir:", true, kCFURLHFSPathStyle);
  EXPECT_EQ(TextOfUrl(folder), "file:///mnt/data/Dir/");
  EXPECT_EQ(PathIn(folder, kCFURLHFSPathStyle), "Data:Dir:");
  EXPECT_EQ(TextOfUrl(MakeUrl("Data:Dir:", false, kCFURLHFSPathStyle)), "file:///mnt/data/Dir");
  EXPECT_EQ(TextOfUrl(MakeUrl("Data:Dir", true, kCFURLHFSPathStyle)), "file:///mnt/data/Dir/");
}

TEST(CFURLHfsPath, OfAVolumeThatIsNotMountedHasNoUrl) {
  EXPECT_FALSE(MakeUrl("Gone:Dir", false, kCFURLHFSPathStyle));
  SetVolumesAreMounted(false);
  const bool made = static_cast<bool>(MakeUrl("Data:Dir", false, kCFURLHFSPathStyle));
  SetVolumesAreMounted(true);
  EXPECT_FALSE(made);
}

TEST(CFURLHfsPath, BeginningWithAColonIsRelative) {
  const auto url = MakeUrl("::a:b", false, kCFURLHFSPathStyle);
  EXPECT_EQ(PathOf(url), "../a/b");
  EXPECT_EQ(PathIn(url, kCFURLHFSPathStyle), "::a:b");
}

TEST(CFURLWindowsPath, BecomesAPathAndBack) {
  const auto url = MakeUrl("C:\\a\\b", false, kCFURLWindowsPathStyle);
  EXPECT_EQ(TextOfUrl(url), "file:///C:/a/b");
  EXPECT_EQ(PathIn(url, kCFURLWindowsPathStyle), "C:\\a\\b");
  EXPECT_EQ(PathOf(MakeUrl("a\\b", false, kCFURLWindowsPathStyle)), "a/b");
  EXPECT_EQ(PathIn(MakeUrl("a/b", false), kCFURLWindowsPathStyle), "a\\b");
}

}  // namespace
}  // namespace tallowmere::foundation::test
