// What a reference says about its path and item: existence, kind, equality and containment.
#include <gtest/gtest.h>
#include <linux/seccomp.h>
#include <sys/prctl.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/wait.h>

#include <cstring>
#include <functional>
#include <iostream>
#include <sstream>
#include <stdexcept>

#include "TestReferences.h"

namespace tallowmere::test {
namespace {

// What `trace` writes to std::cout, and whether it leaves the stream failed.
struct Output {
  std::string text;
  bool failed;
};
Output TraceOf(const CFileRef& reference) {
  std::ostringstream captured;
  std::streambuf* const former = std::cout.rdbuf(captured.rdbuf());
  std::cout.clear();
  reference.Trace();
  const bool failed = std::cout.fail();
  std::cout.rdbuf(former);
  std::cout.clear();
  return {captured.str(), failed};
}

// --- No path ----------------------------------------------------------------------------------

TEST(AnEmptyReference, AnswersNoToEverything) {
  const CFileRef empty;
  char buffer[] = "former";
  EXPECT_EQ(empty.GetPath(), nullptr);
  EXPECT_EQ(static_cast<char const*>(empty), nullptr);
  EXPECT_FALSE(empty.GetPath(buffer, sizeof buffer));
  EXPECT_EQ(buffer[0], '\0');
  EXPECT_EQ(empty.CopyFileSystemPath(kPathStylePOSIX), nullptr);
  EXPECT_FALSE(empty.Exists());
  EXPECT_FALSE(empty.IsFolder());
  EXPECT_FALSE(empty.IsFile());
  EXPECT_FALSE(empty.IsExistingPackage());
  EXPECT_FALSE(empty.PathContains(CFileRef("/a", false)));
  EXPECT_FALSE(CFileRef("/", true).PathContains(empty));
}

TEST(AnEmptyReference, IsTracedAsInvalid) {
  const Output output = TraceOf(CFileRef());
  EXPECT_EQ(output.text, "(invalid)");
  EXPECT_FALSE(output.failed);
}

TEST(ARelativeReference, HasNoPath) {
  const CFileRef relative("a/b", false);
  char buffer[] = "former";
  EXPECT_TRUE(relative.IsValid());
  EXPECT_EQ(relative.GetPath(), nullptr);
  EXPECT_EQ(CachedPathOf(relative), nullptr);
  EXPECT_FALSE(relative.GetPath(buffer, sizeof buffer));
  EXPECT_EQ(buffer[0], '\0');
  EXPECT_FALSE(relative.PathContains(relative));
}

TEST(ARelativeReference, DoesNotExistEvenIfItsItemDoes) {
  const TemporaryFolder folder;
  const CurrentFolder current(folder.Path());
  folder.MakeFile("x");
  const CFileRef relative("x", false);
  EXPECT_FALSE(relative.Exists());
  EXPECT_FALSE(relative.IsFile());
  EXPECT_TRUE(relative.UpdateInternalFSRef());
}

TEST(ARelativeReference, LeavesTheTraceStreamFailed) {
  const Output output = TraceOf(CFileRef("a", false));
  EXPECT_EQ(output.text, "");
  EXPECT_TRUE(output.failed);
}

TEST(AReferenceWithoutAPath, IsNoStdString) {
  for (const CFileRef& reference : {CFileRef(), CFileRef("a", false)}) {
    EXPECT_THROW({ const std::string text = reference; }, std::logic_error);
  }
}

TEST(AReferenceWithoutAPath, IsOneOfAUrlWithoutAPath) {
  CFileRef reference;
  for (const char* url : {"http://host", "file:///a%00b"}) {
    ASSERT_TRUE(reference.SetFromURLString(url));
    EXPECT_EQ(reference.GetPath(), nullptr);
    EXPECT_EQ(reference.CopyFileSystemPath(kPathStylePOSIX), nullptr);
    EXPECT_FALSE(reference.Exists());
    EXPECT_FALSE(reference.IsExistingPackage());
  }
}

// --- Path -------------------------------------------------------------------------------------

TEST(ThePathOfAReference, HasNoSlashAtItsEnd) {
  for (const char* path : {"/tmp/x", "/tmp/x/", "/tmp/x//"}) {
    EXPECT_STREQ(CFileRef(path, false).GetPath(), "/tmp/x");
    EXPECT_STREQ(CFileRef(path, true).GetPath(), "/tmp/x");
  }
  CFileRef reference;
  ASSERT_TRUE(reference.SetFromURLString("file:///a/b//"));
  EXPECT_STREQ(reference.GetPath(), "/a/b");
}

TEST(ThePathOfAReference, OfTheRootIsASlash) {
  EXPECT_STREQ(CFileRef("/", true).GetPath(), "/");
  EXPECT_STREQ(CFileRef("//", true).GetPath(), "/");
}

TEST(ThePathOfAReference, IsTheSameByEveryQuery) {
  const CFileRef reference("/a/b", true);
  const char* const path = reference.GetPath();
  const std::string text = reference;
  EXPECT_EQ(static_cast<char const*>(reference), path);
  EXPECT_EQ(reference.GetPath(), path);
  EXPECT_EQ(text, "/a/b");
}

TEST(ThePathOfAReference, MayBeOfAnyLength) {
  for (const std::size_t length : {1022U, 1023U, 1024U, 1025U, 4095U, 4097U, 100000U}) {
    const std::string path = "/" + std::string(length - 1, 'x');
    EXPECT_EQ(std::string(CFileRef(path.c_str(), false).GetPath()), path) << length;
  }
}

TEST(ThePathOfAReference, LongerThanTheSystemAcceptsDoesNotExist) {
  const CFileRef longPath(("/" + std::string(5000, 'x')).c_str(), false);
  const CFileRef longName(("/" + std::string(256, 'x')).c_str(), false);
  for (const CFileRef* reference : {&longPath, &longName}) {
    EXPECT_FALSE(reference->Exists());
    EXPECT_FALSE(reference->IsFile());
    EXPECT_FALSE(reference->UpdateInternalFSRef());
    EXPECT_FALSE(reference->IsExistingPackage());
  }
}

TEST(ThePathOfAReference, FitsABufferWithRoomForItsNul) {
  const CFileRef reference("/abc", false);
  char buffer[6] = "xxxxx";
  EXPECT_TRUE(reference.GetPath(buffer, 5));
  EXPECT_STREQ(buffer, "/abc");
}

TEST(ThePathOfAReference, IsCutToABufferThatIsTooSmall) {
  const CFileRef reference("/abc", false);
  char buffer[6] = "xxxxx";
  EXPECT_FALSE(reference.GetPath(buffer, 4));
  EXPECT_STREQ(buffer, "/ab");
  EXPECT_FALSE(reference.GetPath(buffer, 1));
  EXPECT_STREQ(buffer, "");
}

TEST(ThePathOfAReference, EndsABufferOfSizeZero) {
  const CFileRef reference("/abc", false);
  char buffer[3] = "xx";
  EXPECT_FALSE(reference.GetPath(buffer, 0));
  EXPECT_EQ(buffer[0], '\0');
  EXPECT_EQ(buffer[1], 'x');
}

TEST(ThePathOfAReference, IsCopiedInEachStyle) {
  const CFileRef reference("/mnt/data/a:b", true);
  const auto inStyle = [&reference](int style) {
    return NameOf(CFOwned(reference.CopyFileSystemPath(static_cast<tPathStyle>(style))).Get());
  };
  EXPECT_EQ(inStyle(kPathStylePOSIX), "/mnt/data/a:b");
  EXPECT_EQ(inStyle(kPathStyleHFS), "Data:a/b:");
  EXPECT_EQ(inStyle(kPathStyleWindows), "\\mnt\\data\\a:b");
  EXPECT_EQ(inStyle(5), inStyle(kPathStyleWindows));
}

// Runs `body` in a child that the kernel kills at its first system call. Returns nullopt where
// strict seccomp is not permitted.
std::optional<bool> MakesNoSystemCall(const std::function<void()>& body) {
  constexpr int kNotPermitted = 2;
  const pid_t child = fork();
  if (child == 0) {
    if (prctl(PR_SET_SECCOMP, SECCOMP_MODE_STRICT) != 0) _exit(kNotPermitted);
    body();
    syscall(SYS_exit, 0);
  }
  int status = 0;
  waitpid(child, &status, 0);
  if (WIFEXITED(status) && WEXITSTATUS(status) == kNotPermitted) return std::nullopt;
  return WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

TEST(ThePathOfAReference, OnceAskedForCostsNoSystemCall) {
  const CFileRef reference("/a/b", false);
  const char* const path = reference.GetPath();
  const auto isSilent = MakesNoSystemCall([&] {
    char buffer[10];
    if (reference.GetPath() != path) abort();
    if (!reference.GetPath(buffer, sizeof buffer)) abort();
  });
  const auto existsIsSilent = MakesNoSystemCall([&] { reference.Exists(); });
  if (!isSilent || !existsIsSilent) GTEST_SKIP() << "no seccomp here";
  EXPECT_TRUE(*isSilent);
  EXPECT_FALSE(*existsIsSilent);  // shows that the measurement notices calls
}

// --- Existence and kind -----------------------------------------------------------------------

class AnItem : public testing::Test {
 protected:
  CFileRef At(const char* name) const { return CFileRef((mFolder.Path() / name).c_str(), false); }
  const TemporaryFolder mFolder;
};

TEST_F(AnItem, ThatIsAFileExistsAsAFile) {
  mFolder.MakeFile("x");
  EXPECT_TRUE(At("x").Exists());
  EXPECT_TRUE(At("x").IsFile());
  EXPECT_FALSE(At("x").IsFolder());
}

TEST_F(AnItem, ThatIsAFolderExistsAsAFolder) {
  mFolder.MakeFolder("x");
  EXPECT_TRUE(At("x").Exists());
  EXPECT_FALSE(At("x").IsFile());
  EXPECT_TRUE(At("x").IsFolder());
}

TEST_F(AnItem, ThatIsMissingIsNeither) {
  EXPECT_FALSE(At("x").Exists());
  EXPECT_FALSE(At("x").IsFile());
  EXPECT_FALSE(At("x").IsFolder());
}

TEST_F(AnItem, ThatIsAPipeIsAFile) {
  ASSERT_EQ(mkfifo((mFolder.Path() / "x").c_str(), 0600), 0);
  EXPECT_TRUE(At("x").Exists());
  EXPECT_TRUE(At("x").IsFile());
}

TEST_F(AnItem, ThatIsADanglingLinkIsAFileThatDoesNotExist) {
  mFolder.MakeLink("x", "nowhere");
  EXPECT_FALSE(At("x").Exists());
  EXPECT_TRUE(At("x").IsFile());
  EXPECT_FALSE(At("x").IsFolder());
  EXPECT_EQ(TraceOf(At("x")).text, (mFolder.Path() / "x").string() + " (state: not existing)");
}

TEST_F(AnItem, ThatIsALinkToAFolderIsAFile) {
  mFolder.MakeLink("x", mFolder.MakeFolder("folder"));
  EXPECT_TRUE(At("x").Exists());
  EXPECT_TRUE(At("x").IsFile());
  EXPECT_FALSE(At("x").IsFolder());
}

TEST_F(AnItem, IsTracedWithItsPathAndItsState) {
  mFolder.MakeFile("x");
  EXPECT_EQ(TraceOf(At("x")).text, (mFolder.Path() / "x").string() + " (state: existing)");
  EXPECT_EQ(TraceOf(At("y")).text, (mFolder.Path() / "y").string() + " (state: not existing)");
}

TEST_F(AnItem, KeepsItsPathWhenTheDiskChanges) {
  const auto path = mFolder.MakeFile("x");
  const CFileRef reference = At("x");
  const char* const text = reference.GetPath();
  std::filesystem::remove(path);
  EXPECT_EQ(reference.GetPath(), text);
  EXPECT_FALSE(reference.Exists());
}

TEST_F(AnItem, IsAPackageWhenTheWorkspaceSaysSo) {
  mFolder.MakeFolder("x.app");
  mFolder.MakeFolder("x");
  mFolder.MakeFile("y.app");
  EXPECT_TRUE(At("x.app").IsExistingPackage());
  EXPECT_FALSE(At("x").IsExistingPackage());
  EXPECT_FALSE(At("y.app").IsExistingPackage());
  EXPECT_FALSE(At("z.app").IsExistingPackage());
}

TEST_F(AnItem, IsAPackageByARelativePathToo) {
  const CurrentFolder current(mFolder.Path());
  mFolder.MakeFolder("x.app");
  EXPECT_TRUE(CFileRef("x.app", true).IsExistingPackage());
  EXPECT_FALSE(CFileRef("missing.app", true).IsExistingPackage());
}

// --- Equality ---------------------------------------------------------------------------------

TEST(EqualReferences, AreTwoEmptyOnes) {
  EXPECT_TRUE(CFileRef() == CFileRef::None);
  EXPECT_FALSE(CFileRef() != CFileRef::None);
}

TEST(EqualReferences, AreNotAnEmptyOneAndAnother) {
  const CFileRef root("/", true);
  EXPECT_FALSE(CFileRef() == root);
  EXPECT_FALSE(root == CFileRef());
  EXPECT_TRUE(root != CFileRef());
}

TEST_F(AnItem, IsEqualToItselfByAnotherSpelling) {
  const auto folder = mFolder.MakeFolder("folder");
  mFolder.MakeFile("folder/x");
  mFolder.MakeLink("link", folder);
  EXPECT_TRUE(At("folder/x") == At("link/x"));
  EXPECT_TRUE(At("folder/x") == At("folder/../folder/x"));
  EXPECT_FALSE(At("folder/x") != At("link/x"));
}

TEST_F(AnItem, IsNotEqualToAnother) {
  mFolder.MakeFile("x");
  mFolder.MakeFile("y");
  EXPECT_FALSE(At("x") == At("y"));
  EXPECT_TRUE(At("x") != At("y"));
}

TEST_F(AnItem, IsNotEqualToALinkToIt) {
  mFolder.MakeFile("x");
  mFolder.MakeLink("link", "x");
  EXPECT_FALSE(At("x") == At("link"));
}

TEST_F(AnItem, ThatIsMissingIsEqualByItsUrlAlone) {
  const auto folder = mFolder.MakeFolder("folder");
  mFolder.MakeLink("link", folder);
  mFolder.MakeFile("there");
  EXPECT_TRUE(At("folder/x") == At("folder/x"));
  EXPECT_FALSE(At("folder/x") == At("link/x"));
  EXPECT_FALSE(At("there") == At("missing"));
  EXPECT_FALSE(At("missing") == At("there"));
}

TEST_F(AnItem, RefreshesTheFSRefsOfBothWhenCompared) {
  mFolder.MakeFile("x");
  const CFileRef first = At("x");
  const CFileRef second = At("x");
  ASSERT_TRUE(first == second);
  EXPECT_FALSE(IsZero(CachedFSRefOf(first)));
  EXPECT_FALSE(IsZero(CachedFSRefOf(second)));
  std::filesystem::remove(mFolder.Path() / "x");
  EXPECT_TRUE(first == second);
  EXPECT_TRUE(IsZero(CachedFSRefOf(first)));
}

// --- Containment ------------------------------------------------------------------------------

bool Contains(const char* path, const char* other) {
  return CFileRef(path, true).PathContains(CFileRef(other, false));
}

TEST(PathContainment, IsOfThePathItselfAndItsDescendants) {
  EXPECT_TRUE(Contains("/Users/a", "/Users/a"));
  EXPECT_TRUE(Contains("/Users/a", "/Users/a/b"));
  EXPECT_TRUE(Contains("/Users/a", "/Users/a/b/c"));
  EXPECT_FALSE(Contains("/Users/a", "/Users/b/a"));
  EXPECT_FALSE(Contains("/Users/a/b", "/Users/a"));
}

TEST(PathContainment, IgnoresLetterCase) {
  EXPECT_TRUE(Contains("/Users/a", "/Users/A/b"));
  EXPECT_TRUE(Contains("/Users/a", "/USERS/A"));
}

TEST(PathContainment, IsNotOfALongerName) {
  EXPECT_FALSE(Contains("/Users/a", "/Users/ab"));
  EXPECT_FALSE(Contains("/Users/a", "/Users/ab/c"));
}

TEST(PathContainment, OfTheRootIsOfItselfAlone) {
  EXPECT_TRUE(Contains("/", "/"));
  EXPECT_FALSE(Contains("/", "/Volumes/Disk"));
  EXPECT_FALSE(Contains("/", "/volumes/disk"));
  EXPECT_FALSE(Contains("/", "/usr"));
  EXPECT_TRUE(Contains("/", "//usr"));
}

}  // namespace
}  // namespace tallowmere::test
