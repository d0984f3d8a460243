// Opening and resolving paths, on kernels with and without openat2.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <climits>
#include <optional>
#include <string>

#include "kernel/Paths.h"
#include "support/OtherKernel.h"
#include "support/Privileges.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::kernel {
namespace {

using test::TemporaryFolder;

TEST(ANormalizedPath, IsAbsoluteWithoutEmptyComponentsAndDots) {
  for (const char* path : {"/", "/a", "/a/b", "/.a", "/a.", "/...", "/..a/b"}) {
    EXPECT_TRUE(IsNormalized(path)) << path;
  }
  for (const char* path : {"", "a", "a/b", "//", "/a/", "//a", "/a//b", "/.", "/..", "/a/.",
                           "/a/..", "/./a", "/../a"}) {
    EXPECT_FALSE(IsNormalized(path)) << path;
  }
}

// The error of openat2, or 0 where it works: ENOSYS before Linux 5.6, EPERM in sandboxes.
class HeldPaths : public testing::TestWithParam<int> {
 protected:
  void SetUp() override {
    mFolder.MakeFolder("a/b");
    mFolder.MakeFile("a/b/x");
    mFolder.MakeLink("a/link", "b");
    mFolder.MakeLink("dangling", "nowhere");
    if (GetParam() != 0) mOther.emplace(GetParam());
  }
  std::string PathOf(const std::string& name) const { return mFolder.Path() / name; }

  static ino_t InodeOf(const Result<Descriptor>& held) {
    struct stat about {};
    EXPECT_TRUE(held);
    if (!held) return 0;
    EXPECT_EQ(fstatat(held->Get(), "", &about, AT_EMPTY_PATH | AT_SYMLINK_NOFOLLOW), 0);
    return about.st_ino;
  }
  ino_t InodeAt(const std::string& name) const {
    struct stat about {};
    EXPECT_EQ(lstat(PathOf(name).c_str(), &about), 0) << name;
    return about.st_ino;
  }
  static int ErrorOf(const Result<Descriptor>& held) { return held ? 0 : held.Error().number; }

  TemporaryFolder mFolder;
  std::optional<test::RefusedOpenat2> mOther;
};

TEST_P(HeldPaths, LeadToTheItemItself) {
  for (const char* name : {"a", "a/b", "a/b/x", "a/link", "dangling"}) {
    EXPECT_EQ(InodeOf(HoldWithoutLinks(PathOf(name))), InodeAt(name)) << name;
  }
  struct stat root {};
  ASSERT_EQ(stat("/", &root), 0);
  EXPECT_EQ(InodeOf(HoldWithoutLinks("/")), root.st_ino);
}

TEST_P(HeldPaths, LeadThroughNoLink) {
  const int error = ErrorOf(HoldWithoutLinks(PathOf("a/link/x")));
  EXPECT_TRUE(error == ELOOP || error == ENOTDIR) << error;
  const int ofFolder = ErrorOf(HoldFolderWithoutLinks(PathOf("a/link")));
  EXPECT_TRUE(ofFolder == ELOOP || ofFolder == ENOTDIR) << ofFolder;
}

TEST_P(HeldPaths, EndWhereNothingIs) {
  EXPECT_EQ(ErrorOf(HoldWithoutLinks(PathOf("missing"))), ENOENT);
  EXPECT_EQ(ErrorOf(HoldWithoutLinks(PathOf("missing/x"))), ENOENT);
  EXPECT_EQ(ErrorOf(HoldWithoutLinks(PathOf("a/b/x/y"))), ENOTDIR);
  EXPECT_EQ(ErrorOf(HoldWithoutLinks(PathOf(std::string(256, 'n')))), ENAMETOOLONG);
}

TEST_P(HeldPaths, LongerThanTheKernelAcceptsAreAnError) {
  std::string path = PathOf("a");
  while (path.size() < PATH_MAX) path += "/b";
  EXPECT_EQ(ErrorOf(HoldWithoutLinks(path)), ENAMETOOLONG);
}

TEST_P(HeldPaths, OfFoldersLeadToNothingElse) {
  EXPECT_EQ(InodeOf(HoldFolderWithoutLinks(PathOf("a/b"))), InodeAt("a/b"));
  EXPECT_EQ(ErrorOf(HoldFolderWithoutLinks(PathOf("a/b/x"))), ENOTDIR);
  EXPECT_EQ(ErrorOf(HoldFolderWithoutLinks(PathOf("missing"))), ENOENT);
}

TEST_P(HeldPaths, NeedNoPermissionToRead) {
  ASSERT_EQ(chmod(mFolder.Path().c_str(), 0755), 0);
  ASSERT_EQ(chmod(PathOf("a/b").c_str(), 0711), 0);
  EXPECT_TRUE(test::HoldsForNobody([&] {
    return !OpenForReading(AtPath(PathOf("a/b").c_str())) &&
           HoldFolderWithoutLinks(PathOf("a/b")) && HoldWithoutLinks(PathOf("a/b/x"));
  }));
}

INSTANTIATE_TEST_SUITE_P(ByEachKernel, HeldPaths, testing::Values(0, ENOSYS, EPERM),
                         [](const auto& error) {
                           return error.param == 0        ? "WithTheCall"
                                  : error.param == ENOSYS ? "WithoutTheCall"
                                                          : "WithTheCallForbidden";
                         });

class PathsOfLinks : public testing::Test {
 protected:
  void SetUp() override {
    mFolder.MakeFolder("a/b");
    mFolder.MakeFile("a/b/x");
    mFolder.MakeLink("link", "a");
    mFolder.MakeLink("a/dangling", "nowhere");
  }
  std::string PathOf(const std::string& name) const { return mFolder.Path() / name; }

  TemporaryFolder mFolder;
};

TEST_F(PathsOfLinks, AreFollowedToTheirEndsByTheRealPath) {
  EXPECT_EQ(*RealPath(PathOf("link")), PathOf("a"));
  EXPECT_EQ(*RealPath(PathOf("link/b/../b/./x")), PathOf("a/b/x"));
  EXPECT_EQ(RealPath(PathOf("link/dangling")).Error(), kNotThere);
}

TEST_F(PathsOfLinks, AreNotFollowedAsTheLastNameByTheCanonicalPath) {
  EXPECT_EQ(*CanonicalPath(PathOf("link")), PathOf("link"));
  EXPECT_EQ(*CanonicalPath(PathOf("link/dangling")), PathOf("a/dangling"));
  EXPECT_EQ(*CanonicalPath(PathOf("link/.")), PathOf("a"));
  EXPECT_EQ(*CanonicalPath(PathOf("link/b/..")), PathOf("a"));
  EXPECT_EQ(*CanonicalPath("/"), "/");
  EXPECT_EQ(CanonicalPath(PathOf("missing/x")).Error(), kNotThere);
}

TEST_F(PathsOfLinks, AreFollowedToAFolderThatIsHeld) {
  const auto held = HoldFollowing(AtPath(PathOf("link").c_str()));
  ASSERT_TRUE(held);
  EXPECT_TRUE(HoldFolderIn({held->Get(), "b"}));
  const auto link = HoldFolderIn(AtPath(PathOf("link").c_str()));
  EXPECT_FALSE(link);
  EXPECT_FALSE(OpenForReading(AtPath(PathOf("link").c_str())));
  EXPECT_TRUE(OpenForReading({held->Get(), "b"}));
}

TEST_F(PathsOfLinks, AreReadFromAnOpenItem) {
  const auto held = HoldWithoutLinks(PathOf("a/b/x"));
  ASSERT_TRUE(held);
  EXPECT_EQ(*PathOfDescriptor(*held), PathOf("a/b/x"));
  std::filesystem::rename(PathOf("a"), PathOf("c"));
  EXPECT_EQ(*PathOfDescriptor(*held), PathOf("c/b/x"));
  std::filesystem::remove(PathOf("c/b/x"));
  EXPECT_EQ(*PathOfDescriptor(*held), PathOf("c/b/x") + " (deleted)");
  int ends[2];
  ASSERT_EQ(pipe2(ends, O_CLOEXEC), 0);
  const Descriptor first(ends[0]);
  const Descriptor second(ends[1]);
  EXPECT_EQ(PathOfDescriptor(first).Error(), kNotThere);
}

}  // namespace
}  // namespace tallowmere::kernel
