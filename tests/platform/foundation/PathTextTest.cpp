// Operations on the text of paths.
#include <gtest/gtest.h>

#include "foundation/PathText.h"

namespace tallowmere::foundation {
namespace {

TEST(PathText, FolderMarkIsAddedOnce) {
  EXPECT_EQ(WithFolderMark("a", true), "a/");
  EXPECT_EQ(WithFolderMark("a//", true), "a//");
}

TEST(PathText, FolderMarkIsRemovedWholly) {
  EXPECT_EQ(WithFolderMark("/a//", false), "/a");
  EXPECT_EQ(WithFolderMark("///", false), "/");
}

TEST(PathText, LastComponentFollowsTheLastSlash) {
  EXPECT_EQ(LastComponent("/a/b"), "b");
  EXPECT_EQ(LastComponent("/a/b//"), "b");
  EXPECT_EQ(LastComponent("b"), "b");
  EXPECT_EQ(LastComponent("//"), "/");
  EXPECT_EQ(LastComponent(""), std::nullopt);
}

TEST(PathText, ParentKeepsDoubledSlashes) {
  EXPECT_EQ(ParentPath("/a//b"), "/a//");
  EXPECT_EQ(ParentPath("//"), "/");
}

TEST(PathText, TheFolderOfAnItemPrecedesItsName) {
  EXPECT_EQ(FolderOf("/a/b"), "/a");
  EXPECT_EQ(FolderOf("/a"), "/");
  EXPECT_EQ(FolderOf("/a/%2E"), "/a");
  EXPECT_EQ(FolderOf("/%2e%2E"), "/");
}

TEST(PathText, JoinNeedsNoSlashAtTheStart) {
  EXPECT_EQ(JoinPath("", "a"), "a");
  EXPECT_EQ(JoinPath("/", "a"), "/a");
  EXPECT_EQ(JoinPath("a", "b"), "a/b");
  EXPECT_EQ(JoinPath("a", ""), "a/");
}

TEST(PathText, ExtensionNeedsADotAfterTheFirstCharacter) {
  EXPECT_EQ(Extension("a.b"), "b");
  EXPECT_EQ(Extension("..b"), "b");
  EXPECT_EQ(Extension(".b"), std::nullopt);
  EXPECT_EQ(Extension("a."), std::nullopt);
  EXPECT_EQ(Extension("."), std::nullopt);
  EXPECT_EQ(Extension(""), std::nullopt);
}

}  // namespace
}  // namespace tallowmere::foundation
