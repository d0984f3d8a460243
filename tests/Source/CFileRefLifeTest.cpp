// The life of a reference: creation, copying, clearing and destruction, and its cached FSRef.
#include <gtest/gtest.h>

#include <cstring>
#include <new>
#include <utility>

#include "TestReferences.h"

namespace tallowmere::test {
namespace {

const CFileRef& Itself(const CFileRef& reference) {
  return reference;
}

TEST(FileReference, ANewOneIsEmpty) {
  const CFileRef reference;
  FSRef item;
  EXPECT_TRUE(IsEmpty(reference));
  EXPECT_FALSE(reference.IsValid());
  EXPECT_FALSE(reference.GetFSRef(&item));
  EXPECT_FALSE(reference.UpdateInternalFSRef());
  EXPECT_TRUE(IsZero(static_cast<FSRef const&>(reference)));
  EXPECT_TRUE(IsZero(*static_cast<FSRef const*>(reference)));
}

TEST(FileReference, NoneIsEmpty) {
  FSRef item;
  EXPECT_TRUE(IsEmpty(CFileRef::None));
  EXPECT_FALSE(CFileRef::None.IsValid());
  EXPECT_FALSE(CFileRef::None.GetFSRef(&item));
  EXPECT_TRUE(IsZero(static_cast<FSRef const&>(CFileRef::None)));
}

TEST(FileReference, TheLocalEncodingIsMacRomanAtTheStart) {
  EXPECT_EQ(CFileRef::mLocalEncoding, 0U);
}

TEST(FileReference, CopyOfAnEmptyReferenceIsEmpty) {
  const CFileRef empty;
  CFileRef copy(empty);
  EXPECT_TRUE(IsEmpty(copy));
  EXPECT_TRUE(copy.AddToPath("/a", false));  // changes the copy only
  EXPECT_TRUE(IsEmpty(empty));
}

TEST(FileReference, CopySharesTheUrl) {
  const auto url = MakeUrl("/a/b", false);
  const CFileRef source(url.Get());
  EXPECT_EQ(CFGetRetainCount(url.Get()), 2);
  {
    CFileRef copy(source);
    EXPECT_TRUE(copy.IsValid());
    EXPECT_EQ(UrlOf(copy), url.Get());
    EXPECT_EQ(CFGetRetainCount(url.Get()), 3);
    copy.Invalidate();
    EXPECT_EQ(CFGetRetainCount(url.Get()), 2);
  }
  EXPECT_EQ(CFGetRetainCount(url.Get()), 2);
}

TEST(FileReference, CopyStartsWithoutCaches) {
  const CFileRef source("/", true);
  ASSERT_NE(source.GetPath(), nullptr);
  ASSERT_TRUE(source.UpdateInternalFSRef());
  CFileRef copy(source);
  EXPECT_EQ(CachedPathOf(copy), nullptr);
  EXPECT_TRUE(IsZero(CachedFSRefOf(copy)));
  EXPECT_EQ(CachedFSSpecOf(copy).vRefNum, 32767);
}

TEST(FileReference, AssignmentReplacesTheUrlAndTheCaches) {
  const auto first = MakeUrl("/a", false);
  const auto second = MakeUrl("/b", false);
  CFileRef reference(first.Get());
  const CFileRef source(second.Get());
  ASSERT_STREQ(reference.GetPath(), "/a");
  EXPECT_EQ(&(reference = source), &reference);
  EXPECT_EQ(CFGetRetainCount(first.Get()), 1);
  EXPECT_EQ(CFGetRetainCount(second.Get()), 3);
  EXPECT_EQ(CachedPathOf(reference), nullptr);
  EXPECT_STREQ(reference.GetPath(), "/b");
}

TEST(FileReference, AssignmentOfAnEmptyOneEmpties) {
  const auto url = MakeUrl("/a", false);
  CFileRef reference(url.Get());
  reference = CFileRef::None;
  EXPECT_TRUE(IsEmpty(reference));
  EXPECT_EQ(CFGetRetainCount(url.Get()), 1);
}

TEST(FileReference, AssignmentToItselfChangesNothing) {
  const auto url = MakeUrl("/a", false);
  CFileRef reference(url.Get());
  const char* const path = reference.GetPath();
  reference = Itself(reference);
  EXPECT_EQ(UrlOf(reference), url.Get());
  EXPECT_EQ(CFGetRetainCount(url.Get()), 2);
  EXPECT_EQ(CachedPathOf(reference), path);
}

TEST(FileReference, EndsWithItsUrl) {
  const auto url = MakeUrl("/a", false);
  {
    const CFileRef reference(url.Get());
    reference.GetPath();
    EXPECT_EQ(CFGetRetainCount(url.Get()), 2);
  }
  EXPECT_EQ(CFGetRetainCount(url.Get()), 1);
}

TEST(FileReference, InvalidateAndReInitReleaseWhatIsHeld) {
  const auto url = MakeUrl("/", true);
  for (void (CFileRef::*clear)() : {&CFileRef::Invalidate, &CFileRef::ReInit}) {
    CFileRef reference(url.Get());
    reference.GetPath();
    reference.UpdateInternalFSRef();
    (reference.*clear)();
    EXPECT_TRUE(IsEmpty(reference));
    EXPECT_FALSE(reference.IsValid());
    EXPECT_EQ(CFGetRetainCount(url.Get()), 1);
  }
}

TEST(FileReference, ClearingLeavesTheTextOfTheFSSpecsNameAfterItsLength) {
  CFileRef reference("/a", false);
  FSSpec& spec = CachedFSSpecOf(reference);
  std::memcpy(spec.name, "\003abc", 4);
  spec.vRefNum = 1;
  spec.parID = 2;
  reference.ReInit();
  EXPECT_TRUE(IsEmpty(reference));
  EXPECT_EQ(std::memcmp(spec.name, "\0abc", 4), 0);
}

TEST(FileReference, InitReleasesNothing) {
  const auto url = MakeUrl("/a", false);
  CFRetain(url.Get());
  CFileRef reference(url.Get());
  reference.Init();
  EXPECT_TRUE(IsEmpty(reference));
  EXPECT_EQ(CFGetRetainCount(url.Get()), 3);
  CFRelease(url.Get());
  CFRelease(url.Get());
}

TEST(FileReference, ReadsOnlyTheLowestBitOfItsValidity) {
  CFileRef reference;
  reference.*MemberOf(ValidField()) = 2;
  EXPECT_FALSE(reference.IsValid());
  reference.*MemberOf(ValidField()) = 0;
}

// --- FSRefs -----------------------------------------------------------------------------------

TEST(FileReferenceFSRef, IsThatOfTheCurrentItem) {
  const TemporaryFolder folder;
  const CFileRef reference((folder.Path() / "x").c_str(), false);
  EXPECT_TRUE(IsZero(static_cast<FSRef const&>(reference)));
  folder.MakeFile("x");
  const FSRef& item = reference;
  EXPECT_FALSE(IsZero(item));
  EXPECT_EQ(&item, &CachedFSRefOf(reference));
  EXPECT_EQ(static_cast<FSRef const*>(reference), &item);
}

TEST(FileReferenceFSRef, IsZeroedWhenTheItemIsGone) {
  const TemporaryFolder folder;
  const auto path = folder.MakeFile("x");
  const CFileRef reference(path.c_str(), false);
  ASSERT_TRUE(reference.UpdateInternalFSRef());
  ASSERT_FALSE(IsZero(CachedFSRefOf(reference)));
  std::filesystem::remove(path);
  EXPECT_FALSE(reference.UpdateInternalFSRef());
  EXPECT_TRUE(IsZero(CachedFSRefOf(reference)));
}

TEST(FileReferenceFSRef, ConversionZeroesItWhenTheItemIsGone) {
  const TemporaryFolder folder;
  const auto path = folder.MakeFile("x");
  const CFileRef reference(path.c_str(), false);
  ASSERT_TRUE(reference.UpdateInternalFSRef());
  std::filesystem::remove(path);
  EXPECT_TRUE(IsZero(static_cast<FSRef const&>(reference)));
}

TEST(FileReferenceFSRef, OfAnEmptyReferenceStaysAsItIs) {
  CFileRef reference;
  (reference.*MemberOf(FSRefField())).hidden[0] = 1;
  EXPECT_FALSE(reference.UpdateInternalFSRef());
  EXPECT_EQ(static_cast<FSRef const&>(reference).hidden[0], 1);
}

TEST(FileReferenceFSRef, GetFSRefFillsOnlyTheCallersFSRef) {
  const CFileRef reference("/", true);
  FSRef item = {};
  EXPECT_TRUE(reference.GetFSRef(&item));
  EXPECT_FALSE(IsZero(item));
  EXPECT_TRUE(IsZero(CachedFSRefOf(reference)));
  EXPECT_STREQ(CachedPathOf(reference), "/");
}

TEST(FileReferenceFSRef, GetFSRefRefusesWhatDoesNotExist) {
  const TemporaryFolder folder;
  FSRef item = {};
  EXPECT_FALSE(CFileRef((folder.Path() / "x").c_str(), false).GetFSRef(&item));
}

TEST(FileReferenceFSRef, GetFSRefRefusesPathsThatBeginWithADot) {
  const TemporaryFolder folder;
  const CurrentFolder current(folder.Path());
  folder.MakeFile("x");
  folder.MakeFile(".x");
  FSRef item = {};
  for (const char* path : {"./x", ".x", ".", "../x"}) {
    EXPECT_FALSE(CFileRef(path, false).GetFSRef(&item)) << path;
  }
}

// Caches a path by hand: a reference makes no path of its own that begins with a dot.
TEST(FileReferenceFSRef, GetFSRefTestsOnlyTheFirstCharacterOfThePath) {
  CFileRef reference("/", true);
  auto* const path = new char[2]{'.', '\0'};
  reference.*MemberOf(PathField()) = path;
  FSRef item = {};
  EXPECT_FALSE(reference.GetFSRef(&item));
  path[0] = '/';
  EXPECT_TRUE(reference.GetFSRef(&item));
}

}  // namespace
}  // namespace tallowmere::test
