// Editing a reference: AddToPath, ReplaceName, SetToParent and ResolveAlias.
#include <gtest/gtest.h>
#include <pwd.h>
#include <rapidcheck/gtest.h>
#include <sys/stat.h>

#include "TestReferences.h"
#include "platform/foundation/TestGenerators.h"
#include "support/OldFormats.h"

namespace tallowmere::test {
namespace {

// An unpaired surrogate, which no file name and no URL can express.
CFOwned<CFStringRef> Unpaired() {
  return MakeString(u"a\xD800");
}

CFileRef FromUrlText(const char* text) {
  CFileRef reference;
  EXPECT_TRUE(reference.SetFromURLString(text));
  return reference;
}

// A reference whose URL has neither a path nor a containing folder.
CFileRef Pathless() {
  return FromUrlText("http://host");
}

std::string HomeOfCurrentUser() {
  const passwd* const entry = getpwuid(getuid());
  return entry != nullptr ? entry->pw_dir : "";
}

// --- AddToPath --------------------------------------------------------------------------------

TEST(AddToPath, AppendsAComponent) {
  CFileRef reference("/Users/a", false);
  EXPECT_TRUE(reference.AddToPath("b", false));
  EXPECT_STREQ(reference.GetPath(), "/Users/a/b");
  EXPECT_FALSE(IsMarkedAsFolder(reference));
  EXPECT_TRUE(reference.AddToPath(MakeString(u"c").Get(), true));
  EXPECT_STREQ(reference.GetPath(), "/Users/a/b/c");
  EXPECT_TRUE(IsMarkedAsFolder(reference));
}

TEST(AddToPath, AppendsSeveralLevels) {
  CFileRef reference("/Users/a", true);
  EXPECT_TRUE(reference.AddToPath("c/d", false));
  EXPECT_STREQ(reference.GetPath(), "/Users/a/c/d");
}

TEST(AddToPath, CollapsesNoSlash) {
  CFileRef reference("/", true);
  EXPECT_TRUE(reference.AddToPath("b", false));
  EXPECT_EQ(PathOf(reference), "//b");
}

TEST(AddToPath, ExpandsNoTildeAfterAPath) {
  CFileRef reference("/a", true);
  EXPECT_TRUE(reference.AddToPath("~", false));
  EXPECT_STREQ(reference.GetPath(), "/a/~");
}

TEST(AddToPath, DropsTheCaches) {
  CFileRef reference("/", true);
  reference.GetPath();
  reference.UpdateInternalFSRef();
  EXPECT_TRUE(reference.AddToPath("b", false));
  EXPECT_EQ(CachedPathOf(reference), nullptr);
  EXPECT_TRUE(IsZero(CachedFSRefOf(reference)));
}

TEST(AddToPath, MakesTheComponentThePathOfAnEmptyReference) {
  CFileRef reference;
  EXPECT_TRUE(reference.AddToPath("/a/b", true));
  EXPECT_STREQ(reference.GetPath(), "/a/b");
  EXPECT_TRUE(IsMarkedAsFolder(reference));
}

TEST(AddToPath, ExpandsATildeForAnEmptyReference) {
  const std::string home = HomeOfCurrentUser();
  if (home.empty()) GTEST_SKIP() << "the current user has no entry";
  CFileRef reference;
  EXPECT_TRUE(reference.AddToPath("~/x", false));
  EXPECT_EQ(PathOf(reference), home + "/x");
}

TEST(AddToPath, OfAReferenceAppendsItsLastComponentAndItsMark) {
  CFileRef reference("/a", true);
  EXPECT_TRUE(reference.AddToPath(CFileRef("/x/y", true)));
  EXPECT_STREQ(reference.GetPath(), "/a/y");
  EXPECT_TRUE(IsMarkedAsFolder(reference));
  EXPECT_TRUE(reference.AddToPath(CFileRef("z", false)));
  EXPECT_STREQ(reference.GetPath(), "/a/y/z");
  EXPECT_FALSE(IsMarkedAsFolder(reference));
}

TEST(AddToPath, OfItselfDoublesTheLastComponent) {
  CFileRef reference("/a/b", true);
  EXPECT_TRUE(reference.AddToPath(reference));
  EXPECT_STREQ(reference.GetPath(), "/a/b/b");
}

TEST(AddToPath, OfAReferenceIsRefusedByAnEmptyOne) {
  CFileRef reference;
  EXPECT_FALSE(reference.AddToPath(CFileRef("/a", false)));
  EXPECT_TRUE(IsEmpty(reference));
}

TEST(AddToPath, OfAnEmptyOrNamelessReferenceChangesNothing) {
  CFileRef reference("/a", true);
  EXPECT_FALSE(reference.AddToPath(CFileRef::None));
  EXPECT_FALSE(reference.AddToPath(Pathless()));
  EXPECT_STREQ(reference.GetPath(), "/a");
}

TEST(AddToPath, OfTextThatIsNullOrNotUtf8ChangesNothing) {
  CFileRef reference("/a", true);
  EXPECT_FALSE(reference.AddToPath(static_cast<char const*>(nullptr), false));
  EXPECT_FALSE(reference.AddToPath("\xFF", false));
  EXPECT_STREQ(reference.GetPath(), "/a");
}

TEST(AddToPath, ToAUrlWithoutAPathChangesNothing) {
  CFileRef reference = Pathless();
  const CFURLRef url = UrlOf(reference);
  EXPECT_FALSE(reference.AddToPath("b", false));
  EXPECT_EQ(UrlOf(reference), url);
}

TEST(AddToPath, ThatMakesNoUrlEmptiesTheReference) {
  CFileRef reference("/a", true);
  EXPECT_FALSE(reference.AddToPath(Unpaired().Get(), false));
  EXPECT_TRUE(IsEmpty(reference));
}

TEST(AddToPath, OfUnusableTextLeavesAnEmptyReferenceEmpty) {
  CFileRef reference;
  EXPECT_FALSE(reference.AddToPath(static_cast<CFStringRef>(nullptr), false));
  EXPECT_TRUE(IsEmpty(reference));
  EXPECT_FALSE(reference.AddToPath("", false));
  EXPECT_TRUE(IsEmpty(reference));
  EXPECT_FALSE(reference.AddToPath(Unpaired().Get(), true));
  EXPECT_TRUE(IsEmpty(reference));
}

TEST(AddToPath, KeepsNothingOfItsArgument) {
  const auto component = MakeString(u"b");
  const CFileRef other("/x/y", false);
  CFileRef reference("/a", true);
  EXPECT_TRUE(reference.AddToPath(component.Get(), false));
  EXPECT_TRUE(reference.AddToPath(other));
  EXPECT_EQ(CFGetRetainCount(component.Get()), 1);
  EXPECT_EQ(CFGetRetainCount(UrlOf(other)), 1);
}

// --- ReplaceName ------------------------------------------------------------------------------

TEST(ReplaceName, ReplacesTheLastComponent) {
  CFileRef reference("/Users/a/x.rtf", false);
  EXPECT_TRUE(reference.ReplaceName("b.txt", false));
  EXPECT_STREQ(reference.GetPath(), "/Users/a/b.txt");
  EXPECT_FALSE(IsMarkedAsFolder(reference));
  EXPECT_TRUE(reference.ReplaceName(MakeString(u"c").Get(), true));
  EXPECT_STREQ(reference.GetPath(), "/Users/a/c");
  EXPECT_TRUE(IsMarkedAsFolder(reference));
}

TEST(ReplaceName, MakesAPlainUrlOfThePath) {
  CFileRef reference = FromUrlText("http://host/a/b?query");
  EXPECT_TRUE(reference.ReplaceName("c", false));
  EXPECT_TRUE(CFEqual(UrlOf(reference), MakeUrl("/a/c", false).Get()));
}

TEST(ReplaceName, ExpandsNoTildeOfAPath) {
  CFileRef reference("/a/b", false);
  EXPECT_TRUE(reference.ReplaceName("~", false));
  EXPECT_STREQ(reference.GetPath(), "/a/~");
}

TEST(ReplaceName, OnAnEmptyReferenceMakesAFileOfTheName) {
  CFileRef reference;
  EXPECT_TRUE(reference.ReplaceName("b.txt", false));
  EXPECT_EQ(PathOf(reference), "b.txt");
}

TEST(ReplaceName, OnAnEmptyReferenceExpandsATilde) {
  const std::string home = HomeOfCurrentUser();
  if (home.empty()) GTEST_SKIP() << "the current user has no entry";
  CFileRef reference;
  EXPECT_TRUE(reference.ReplaceName("~/x", false));
  EXPECT_EQ(PathOf(reference), home + "/x");
}

TEST(ReplaceName, OnAnEmptyReferenceMakesNoFolder) {
  CFileRef reference;
  EXPECT_FALSE(reference.ReplaceName("b", true));
  EXPECT_TRUE(IsEmpty(reference));
  EXPECT_FALSE(reference.ReplaceName(CFileRef("/x", true)));
  EXPECT_TRUE(IsEmpty(reference));
}

TEST(ReplaceName, RefusedOnAnEmptyReferenceChangesNothingInIt) {
  CFileRef reference;
  CachedFSSpecOf(reference).vRefNum = 1;
  EXPECT_FALSE(reference.ReplaceName("b", true));
  EXPECT_EQ(CachedFSSpecOf(reference).vRefNum, 1);
  EXPECT_FALSE(reference.ReplaceName(static_cast<CFStringRef>(nullptr), false));
  EXPECT_TRUE(IsEmpty(reference));
}

TEST(ReplaceName, OnAnEmptyReferenceByUnusableTextLeavesItEmpty) {
  CFileRef reference;
  EXPECT_FALSE(reference.ReplaceName("", false));
  EXPECT_TRUE(IsEmpty(reference));
  EXPECT_FALSE(reference.ReplaceName(Unpaired().Get(), false));
  EXPECT_TRUE(IsEmpty(reference));
}

TEST(ReplaceName, ByAReferenceTakesItsNameAndItsMark) {
  CFileRef reference("/a/b", false);
  EXPECT_TRUE(reference.ReplaceName(CFileRef("/x/y", true)));
  EXPECT_STREQ(reference.GetPath(), "/a/y");
  EXPECT_TRUE(IsMarkedAsFolder(reference));
  CFileRef empty;
  EXPECT_TRUE(empty.ReplaceName(CFileRef("/x/y", false)));
  EXPECT_EQ(PathOf(empty), "y");
}

TEST(ReplaceName, ByAnEmptyOrNamelessReferenceChangesNothing) {
  CFileRef reference("/a/b", false);
  EXPECT_FALSE(reference.ReplaceName(CFileRef::None));
  EXPECT_FALSE(reference.ReplaceName(Pathless()));
  EXPECT_STREQ(reference.GetPath(), "/a/b");
}

TEST(ReplaceName, ByTextThatIsNullOrNotUtf8ChangesNothing) {
  CFileRef reference("/a/b", false);
  EXPECT_FALSE(reference.ReplaceName(static_cast<char const*>(nullptr), false));
  EXPECT_FALSE(reference.ReplaceName("\xFF", false));
  EXPECT_STREQ(reference.GetPath(), "/a/b");
}

TEST(ReplaceName, OfAUrlWithoutAFolderChangesNothing) {
  CFileRef reference = Pathless();
  const CFURLRef url = UrlOf(reference);
  EXPECT_FALSE(reference.ReplaceName("b", false));
  EXPECT_EQ(UrlOf(reference), url);
}

TEST(ReplaceName, ByWhatCannotBeAppendedChangesNothing) {
  CFileRef reference("/a/b", false);
  EXPECT_FALSE(reference.ReplaceName(static_cast<CFStringRef>(nullptr), false));
  EXPECT_FALSE(reference.ReplaceName(Unpaired().Get(), false));
  EXPECT_STREQ(reference.GetPath(), "/a/b");
}

TEST(ReplaceName, ThatLeavesNoPathEmptiesTheReference) {
  CFileRef reference("/a/b", false);
  EXPECT_FALSE(reference.ReplaceName(MakeString(std::u16string_view(u"x\0y", 3)).Get(), false));
  EXPECT_TRUE(IsEmpty(reference));
}

// --- SetToParent ------------------------------------------------------------------------------

TEST(SetToParent, NamesTheContainingFolder) {
  for (const bool isDirectory : {false, true}) {
    CFileRef reference("/Users/a/b", isDirectory);
    reference.SetToParent();
    EXPECT_STREQ(reference.GetPath(), "/Users/a");
    EXPECT_TRUE(IsMarkedAsFolder(reference));
  }
}

TEST(SetToParent, ReachesTheRootAndStaysThere) {
  CFileRef reference("/Users", true);
  for (int i = 0; i < 3; ++i) {
    reference.SetToParent();
    EXPECT_STREQ(reference.GetPath(), "/");
    EXPECT_TRUE(IsMarkedAsFolder(reference));
  }
}

TEST(SetToParent, OfARelativePathEmptiesTheReference) {
  for (const char* path : {"a", "a/b", ".", "..", "./a"}) {
    CFileRef reference(path, false);
    ASSERT_TRUE(reference.IsValid());
    reference.SetToParent();
    EXPECT_TRUE(IsEmpty(reference)) << path;
  }
}

TEST(SetToParent, OfAUrlWithoutAFolderOrAPathEmptiesTheReference) {
  for (const char* url : {"http://host", "file:///a%00/b"}) {
    CFileRef reference = FromUrlText(url);
    reference.SetToParent();
    EXPECT_TRUE(IsEmpty(reference)) << url;
  }
}

TEST(SetToParent, OfAnEmptyReferenceChangesNothing) {
  CFileRef reference;
  CachedFSSpecOf(reference).vRefNum = 1;
  reference.SetToParent();
  EXPECT_EQ(CachedFSSpecOf(reference).vRefNum, 1);
}

TEST(SetToParent, ReleasesTheFormerUrl) {
  const auto url = MakeUrl("/a/b", false);
  CFileRef reference(url.Get());
  reference.SetToParent();
  EXPECT_EQ(CFGetRetainCount(url.Get()), 1);
  EXPECT_EQ(CFGetRetainCount(UrlOf(reference)), 1);
}

RC_GTEST_PROP(SetToParent, UndoesAddToPath, ()) {
  const auto component = *rc::gen::suchThat(foundation::test::AnyName(), [](const std::string& x) {
    return !x.empty() && x != "." && x != "..";
  });
  CFileRef reference("/some/folder", true);
  RC_ASSERT(reference.AddToPath(MakeName(component).Get(), *rc::gen::arbitrary<bool>()));
  RC_ASSERT(std::string(reference.GetPath()) == "/some/folder/" + component);
  reference.SetToParent();
  RC_ASSERT(std::string(reference.GetPath()) == "/some/folder");
}

// --- ResolveAlias -----------------------------------------------------------------------------

class ResolveAlias : public testing::Test {
 protected:
  CFileRef At(const char* name) const { return CFileRef((mFolder.Path() / name).c_str(), false); }
  const TemporaryFolder mFolder;
};

TEST_F(ResolveAlias, OfAPlainItemChangesNothing) {
  mFolder.MakeFile("x");
  for (CFileRef reference : {At("x"), CFileRef(mFolder.Path().c_str(), true)}) {
    const CFURLRef url = UrlOf(reference);
    EXPECT_FALSE(reference.ResolveAlias(true));
    EXPECT_FALSE(reference.ResolveAlias(false));
    EXPECT_EQ(UrlOf(reference), url);
    EXPECT_FALSE(IsZero(CachedFSRefOf(reference)));
  }
}

TEST_F(ResolveAlias, OfALinkNamesItsTarget) {
  mFolder.MakeLink("file link", mFolder.MakeFile("x"));
  mFolder.MakeLink("folder link", mFolder.MakeFolder("folder"));
  CFileRef file = At("file link");
  EXPECT_TRUE(file.ResolveAlias(false));
  EXPECT_EQ(PathOf(file), mFolder.Path() / "x");
  EXPECT_FALSE(IsMarkedAsFolder(file));
  CFileRef folder = At("folder link");
  EXPECT_TRUE(folder.ResolveAlias(true));
  EXPECT_EQ(PathOf(folder), mFolder.Path() / "folder");
  EXPECT_TRUE(IsMarkedAsFolder(folder));
}

// Makes an alias file whose record leads to a name in the same folder.
void MakeAliasIn(const TemporaryFolder& folder, const std::string& name, const std::string& target,
                 bool isFolder = false) {
  RecordToWrite record;
  record.kind = isFolder ? 1 : 0;
  record.volumeName = "Elsewhere";
  record.name = target;
  record.levelsUp = record.levelsDown = 1;
  record.tags = {{18, target}};
  folder.MakeFile(name);
  folder.MakeFile("._" + name, WriteSidecarOfAlias(Write(record)));
}

TEST_F(ResolveAlias, OfAnAliasFileNamesItsTarget) {
  mFolder.MakeFile("x");
  mFolder.MakeFolder("folder");
  MakeAliasIn(mFolder, "file alias", "x");
  MakeAliasIn(mFolder, "folder alias", "folder", true);
  CFileRef file = At("file alias");
  EXPECT_TRUE(file.ResolveAlias(false));
  EXPECT_EQ(PathOf(file), mFolder.Path() / "x");
  EXPECT_FALSE(IsMarkedAsFolder(file));
  EXPECT_TRUE(IsZero(CachedFSRefOf(file)));
  CFileRef folder = At("folder alias");
  EXPECT_TRUE(folder.ResolveAlias(true));
  EXPECT_EQ(PathOf(folder), mFolder.Path() / "folder");
  EXPECT_TRUE(IsMarkedAsFolder(folder));
}

TEST_F(ResolveAlias, FollowsAChainOfAliasFilesToItsEnd) {
  mFolder.MakeFile("x");
  MakeAliasIn(mFolder, "first", "second");
  MakeAliasIn(mFolder, "second", "x");
  CFileRef reference = At("first");
  EXPECT_TRUE(reference.ResolveAlias(false));
  EXPECT_EQ(PathOf(reference), mFolder.Path() / "x");
}

TEST_F(ResolveAlias, OfAnAliasFileWithoutATargetChangesNothing) {
  MakeAliasIn(mFolder, "alias", "none");
  MakeAliasIn(mFolder, "ring", "ring");
  for (const char* const name : {"alias", "ring"}) {
    CFileRef reference = At(name);
    const CFURLRef url = UrlOf(reference);
    EXPECT_FALSE(reference.ResolveAlias(false));
    EXPECT_EQ(UrlOf(reference), url);
    EXPECT_FALSE(IsZero(CachedFSRefOf(reference)));
  }
}

TEST_F(ResolveAlias, OfALinkToAnAliasFileNamesTheAliasFile) {
  mFolder.MakeFile("x");
  MakeAliasIn(mFolder, "alias", "x");
  mFolder.MakeLink("link", mFolder.Path() / "alias");
  CFileRef reference = At("link");
  EXPECT_TRUE(reference.ResolveAlias(false));
  EXPECT_EQ(PathOf(reference), mFolder.Path() / "alias");
}

TEST_F(ResolveAlias, OfADanglingLinkNamesItsMissingTarget) {
  mFolder.MakeLink("link", "/Applications/Tool of Tallowmere");
  CFileRef reference = At("link");
  EXPECT_TRUE(reference.ResolveAlias(false));
  EXPECT_STREQ(reference.GetPath(), "/Applications/Tool of Tallowmere");
  EXPECT_FALSE(IsMarkedAsFolder(reference));
}

TEST_F(ResolveAlias, OfARelativeLinkLooksFromTheCurrentFolder) {
  mFolder.MakeFolder("target");
  mFolder.MakeLink("link", "target");
  CFileRef elsewhere = At("link");
  EXPECT_TRUE(elsewhere.ResolveAlias(false));
  EXPECT_EQ(PathOf(elsewhere), "target");
  EXPECT_FALSE(IsMarkedAsFolder(elsewhere));
  const CurrentFolder current(mFolder.Path());
  CFileRef here = At("link");
  EXPECT_TRUE(here.ResolveAlias(false));
  EXPECT_EQ(PathOf(here), "target");
  EXPECT_TRUE(IsMarkedAsFolder(here));
}

TEST_F(ResolveAlias, TakesOneStepOfAChain) {
  mFolder.MakeLink("second", mFolder.MakeFolder("folder"));
  mFolder.MakeLink("first", mFolder.Path() / "second");
  CFileRef reference = At("first");
  EXPECT_TRUE(reference.ResolveAlias(false));
  EXPECT_EQ(PathOf(reference), mFolder.Path() / "second");
  EXPECT_FALSE(IsMarkedAsFolder(reference));
}

TEST_F(ResolveAlias, ReadsTheWholeTextOfALongLink) {
  const std::string target = "/" + std::string(200, 'x') + "/" + std::string(200, 'y') + "/\xFFz";
  mFolder.MakeLink("link", target);
  CFileRef reference = At("link");
  EXPECT_TRUE(reference.ResolveAlias(false));
  EXPECT_EQ(std::string(reference), target);
}

TEST_F(ResolveAlias, ExpandsATildeInTheLinksText) {
  const std::string home = HomeOfCurrentUser();
  if (home.empty()) GTEST_SKIP() << "the current user has no entry";
  mFolder.MakeLink("link", "~/x");
  CFileRef reference = At("link");
  EXPECT_TRUE(reference.ResolveAlias(false));
  EXPECT_EQ(PathOf(reference), home + "/x");
}

TEST_F(ResolveAlias, OfALinkWhoseTextIsNoPathEmptiesTheReference) {
  mFolder.MakeLink("link", "~tallowmere no such user/x");
  CFileRef reference = At("link");
  EXPECT_FALSE(reference.ResolveAlias(false));
  EXPECT_TRUE(IsEmpty(reference));
}

TEST_F(ResolveAlias, OfAnEmptyReferenceChangesNothing) {
  CFileRef reference;
  EXPECT_FALSE(reference.ResolveAlias(true));
  EXPECT_TRUE(IsEmpty(reference));
}

TEST_F(ResolveAlias, OfAMissingItemZeroesOnlyTheFSRef) {
  const auto path = mFolder.MakeFile("x");
  CFileRef reference = At("x");
  ASSERT_TRUE(reference.UpdateInternalFSRef());
  const CFURLRef url = UrlOf(reference);
  std::filesystem::remove(path);
  EXPECT_FALSE(reference.ResolveAlias(true));
  EXPECT_EQ(UrlOf(reference), url);
  EXPECT_TRUE(IsZero(CachedFSRefOf(reference)));
}

TEST_F(ResolveAlias, OfALinkWithoutAnFSRefChangesNothing) {
  mFolder.MakeLink("link", "/target");
  CFileRef reference = FromUrlText(("http://host" + (mFolder.Path() / "link").string()).c_str());
  ASSERT_TRUE(reference.IsFile());
  const CFURLRef url = UrlOf(reference);
  EXPECT_FALSE(reference.ResolveAlias(true));
  EXPECT_EQ(UrlOf(reference), url);
}

TEST_F(ResolveAlias, OfALinkWhoseTextHasNoSizeChangesNothing) {
  CFileRef reference("/proc/self/exe", false);
  struct stat about = {};
  if (lstat("/proc/self/exe", &about) != 0 || about.st_size != 0) {
    GTEST_SKIP() << "no link without a size here";
  }
  const CFURLRef url = UrlOf(reference);
  EXPECT_FALSE(reference.ResolveAlias(true));
  EXPECT_EQ(UrlOf(reference), url);
}

TEST_F(ResolveAlias, OfARelativeReferenceChangesNothing) {
  mFolder.MakeLink("link", "/target");
  const CurrentFolder current(mFolder.Path());
  CFileRef reference("link", false);
  EXPECT_FALSE(reference.ResolveAlias(true));
  EXPECT_EQ(PathOf(reference), "link");
}

}  // namespace
}  // namespace tallowmere::test
