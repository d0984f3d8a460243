// The identity of a reference's item: volume number, node id, folder ids and Unicode name.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>
#include <sys/stat.h>

#include <chrono>

#include "HFSBridgeSupport.h"

namespace tallowmere::test {
namespace {

std::u16string NameIn(const HFSUniStr255& name) {
  return {name.unicode, name.unicode + name.length};
}

std::optional<std::u16string> UnicodeNameOf(const CFileRef& ref) {
  HFSUniStr255 name{};
  return ref.UnicodeFileName(&name) ? std::optional(NameIn(name)) : std::nullopt;
}

CFileRef RefTo(const std::filesystem::path& path) {
  return CFileRef(path.c_str(), false);
}

// A temporary folder of this machine, on whichever volume that is.
class Identity : public testing::Test {
 protected:
  const TemporaryFolder mFolder;
  const CFileRef mFolderRef = RefTo(mFolder.Path());
};

TEST_F(Identity, OfAnEmptyReferenceIsNone) {
  const CFileRef empty;
  HFSUniStr255 name{3, {'o', 'l', 'd'}};
  EXPECT_EQ(empty.GetVolumeRefNumber(), 32767);
  EXPECT_EQ(empty.GetParentID(), -1);
  EXPECT_EQ(empty.GetDirectoryID(), -1);
  EXPECT_EQ(empty.GetNodeID(), static_cast<unsigned long>(-1));
  EXPECT_FALSE(empty.IsRoot());
  EXPECT_FALSE(empty.UnicodeFileName(&name));
  EXPECT_EQ(NameIn(name), u"old");
}

TEST_F(Identity, OfARelativePathIsNone) {
  const CurrentFolder current(mFolder.Path());
  mFolder.MakeFile("here");
  const CFileRef missing("missing", false);
  EXPECT_EQ(missing.GetVolumeRefNumber(), 32767);
  EXPECT_EQ(missing.GetParentID(), -1);
  EXPECT_EQ(missing.GetDirectoryID(), -1);
  EXPECT_FALSE(CFileRef("here", false).IsRoot());
}

TEST_F(Identity, OfARelativePathIsThatInTheFolderWhereItWasMade) {
  const CFileRef there = RefTo(mFolder.MakeFile("here"));
  const CurrentFolder former(mFolder.Path());
  const CFileRef relative("here", false);
  const CurrentFolder current("/");
  EXPECT_EQ(relative.GetNodeID(), there.GetNodeID());
  CFileRef anew;
  anew.Set(relative, true);
  EXPECT_EQ(anew.GetNodeID(), kNoNode);
}

TEST_F(Identity, OfANonFileUrlIsNoneEvenIfItsPathExists) {
  CFileRef reference;
  for (const std::string host : {"http://host", "file://host"}) {
    ASSERT_TRUE(reference.SetFromURLString(host + mFolder.MakeFile("here").string()));
    EXPECT_TRUE(reference.Exists());
    EXPECT_TRUE(reference.IsFile());
    EXPECT_FALSE(reference.UpdateInternalFSRef());
    EXPECT_EQ(reference.GetNodeID(), kNoNode);
  }
}

TEST_F(Identity, OfAMissingFileIsThatOfItsFolder) {
  const CFileRef missing = RefTo(mFolder.Path() / "missing");
  EXPECT_EQ(missing.GetNodeID(), kNoNode);
  EXPECT_EQ(static_cast<UInt32>(missing.GetParentID()), mFolderRef.GetNodeID());
  EXPECT_EQ(missing.GetDirectoryID(), missing.GetParentID());
  EXPECT_EQ(missing.GetVolumeRefNumber(), mFolderRef.GetVolumeRefNumber());
  EXPECT_NE(missing.GetVolumeRefNumber(), kNoVolume);
}

TEST_F(Identity, OfAMissingFileInAMissingFolderIsTheVolumeAlone) {
  const CFileRef missing = RefTo(mFolder.Path() / "missing/folders/file");
  EXPECT_EQ(missing.GetParentID(), kNoFolder);
  EXPECT_EQ(missing.GetDirectoryID(), kNoFolder);
  EXPECT_EQ(missing.GetNodeID(), kNoNode);
  EXPECT_EQ(missing.GetVolumeRefNumber(), mFolderRef.GetVolumeRefNumber());
}

TEST_F(Identity, OfAFileHasItsOwnNodeAndTheFolderThatHoldsIt) {
  const CFileRef file = RefTo(mFolder.MakeFile("file"));
  EXPECT_NE(file.GetNodeID(), kNoNode);
  EXPECT_NE(file.GetNodeID(), mFolderRef.GetNodeID());
  EXPECT_EQ(static_cast<UInt32>(file.GetDirectoryID()), mFolderRef.GetNodeID());
  EXPECT_EQ(file.GetDirectoryID(), file.GetParentID());
  EXPECT_FALSE(file.IsRoot());
}

TEST_F(Identity, OfAnOrdinaryFolderIsItsOwn) {
  const CFileRef inner = RefTo(mFolder.MakeFolder("inner"));
  EXPECT_FALSE(inner.IsRoot());
  EXPECT_EQ(static_cast<UInt32>(inner.GetDirectoryID()), inner.GetNodeID());
  EXPECT_EQ(inner.GetParentID(), mFolderRef.GetDirectoryID());
}

TEST_F(Identity, OfALinkToAFolderIsThatOfAFile) {
  mFolder.MakeLink("link", mFolder.MakeFolder("inner"));
  const CFileRef link = RefTo(mFolder.Path() / "link");
  EXPECT_EQ(link.GetDirectoryID(), mFolderRef.GetDirectoryID());
  EXPECT_NE(link.GetNodeID(), RefTo(mFolder.Path() / "inner").GetNodeID());
  EXPECT_EQ(RefTo(mFolder.Path() / "link/missing").GetParentID(), kNoFolder);
}

TEST_F(Identity, OfTheTopOfTheFileSystemIsRootFolder2) {
  const CFileRef root("/", true);
  EXPECT_TRUE(root.IsRoot());
  EXPECT_EQ(root.GetDirectoryID(), 2);
  EXPECT_EQ(root.GetNodeID(), 2u);
  EXPECT_NE(root.GetVolumeRefNumber(), kNoVolume);
  EXPECT_EQ(CFileRef("/missing of all names", false).GetParentID(), 2);
}

TEST_F(Identity, FailureEmptiesTheCachedFSRef) {
  const std::string path = mFolder.MakeFolder("inner").string();
  const CFileRef ref(path.c_str(), false);
  ref.GetNodeID();
  EXPECT_FALSE(IsZero(CachedFSRefOf(ref)));
  std::filesystem::remove(path);
  EXPECT_EQ(ref.GetNodeID(), kNoNode);
  EXPECT_TRUE(IsZero(CachedFSRefOf(ref)));
}

TEST_F(Identity, TheVolumesNumberLeavesTheCachedFSRefUnchanged) {
  mFolderRef.GetVolumeRefNumber();
  EXPECT_TRUE(IsZero(CachedFSRefOf(mFolderRef)));
}

TEST_F(Identity, IsAskedWithoutChangingTheReference) {
  const CFileRef missing = RefTo(mFolder.Path() / "missing/file");
  CFURLRef const url = UrlOf(missing);
  missing.GetVolumeRefNumber();
  missing.GetParentID();
  missing.IsRoot();
  EXPECT_EQ(UrlOf(missing), url);
  EXPECT_EQ(CFGetRetainCount(url), 1);
}

TEST_F(Identity, AMissingPathThatEndsInDotsIsOnNoVolume) {
  for (const char* const path :
       {"/missing of all names/..", "/missing of all names/.", "/missing of all names/../file",
        "/missing of all names/a/../../file"}) {
    EXPECT_EQ(CFileRef(path, false).GetVolumeRefNumber(), kNoVolume) << path;
  }
}

TEST_F(Identity, AMissingItemBelowDotsThatExistIsOnTheirVolume) {
  const CFileRef missing = RefTo(mFolder.MakeFolder("inner") / "../missing/file");
  EXPECT_EQ(missing.GetVolumeRefNumber(), mFolderRef.GetVolumeRefNumber());
}

TEST_F(Identity, OfANameWithANULIsTheVolumeOfItsFolder) {
  CFileRef ref;
  ASSERT_TRUE(ref.SetFromURLString("file://" + mFolder.Path().string() + "/a%00b"));
  EXPECT_EQ(ref.GetVolumeRefNumber(), mFolderRef.GetVolumeRefNumber());
  EXPECT_NE(ref.GetVolumeRefNumber(), kNoVolume);
}

TEST_F(Identity, BelowANameWithANULIsNone) {
  CFileRef ref;
  ASSERT_TRUE(ref.SetFromURLString("file://" + mFolder.Path().string() + "/a%00b/c"));
  EXPECT_EQ(ref.GetVolumeRefNumber(), kNoVolume);
}

TEST_F(Identity, OfPathsOf65535BytesIsFoundByClimbing) {
  std::string deep(65535, '/');
  for (std::size_t i = 1; i < deep.size(); i += 2) deep[i] = 'a';
  deep.back() = 'a';
  for (const std::string& path : {deep, "/" + std::string(65534, 'a')}) {
    const CFileRef ref(path.c_str(), false);
    EXPECT_EQ(ref.GetParentID(), path == deep ? kNoFolder : 2);
    EXPECT_EQ(ref.GetNodeID(), kNoNode);
    EXPECT_EQ(ref.GetVolumeRefNumber(), CFileRef("/", true).GetVolumeRefNumber());
  }
}

// The climb to an existing folder ends for every path.
RC_GTEST_PROP(IdentityOfAnyPath, ComesToAnEnd, ()) {
  const auto pieces = *rc::gen::container<std::vector<std::string>>(
      rc::gen::element<std::string>("/", "/", "..", ".", "tmp", "missing", ":", " ", "\xFF"));
  std::string path = "/";
  for (const std::string& piece : pieces) path += piece;
  const CFileRef ref(path.c_str(), false);
  RC_ASSERT(ref.GetVolumeRefNumber() != 0);
  RC_ASSERT(ref.GetNodeID() != 0u);
}

// --- The name in UTF-16 -----------------------------------------------------------------------

TEST_F(Identity, TheNameOfAnExistingItemComesFromTheCatalog) {
  EXPECT_EQ(UnicodeNameOf(RefTo(mFolder.MakeFile("a:b \xC3\xA9"))), u"a/b \u00E9");
}

TEST_F(Identity, TheNameOfAMissingItemIsItsLastComponentAsItStands) {
  const CFileRef missing = RefTo(mFolder.Path() / "a:b \xC3\xA9");
  EXPECT_EQ(UnicodeNameOf(missing), u"a:b \u00E9");
  EXPECT_TRUE(IsZero(CachedFSRefOf(missing)));
}

TEST_F(Identity, ANameOf255UnitsIsTheLongest) {
  const std::string longest(255, 'x');
  EXPECT_EQ(UnicodeNameOf(RefTo(mFolder.Path() / longest)), std::u16string(255, u'x'));
  EXPECT_EQ(UnicodeNameOf(RefTo(mFolder.Path() / (longest + "x"))), std::nullopt);
  EXPECT_EQ(UnicodeNameOf(RefTo(mFolder.MakeFile(longest))), std::u16string(255, u'x'));
}

// --- Volumes ----------------------------------------------------------------------------------

using IdentityOnAVolume = DataVolumeTest;

TEST_F(IdentityOnAVolume, TheTopFolderIsRootFolder2) {
  const CFileRef top = mData->Ref();
  EXPECT_TRUE(top.IsRoot());
  EXPECT_EQ(top.GetDirectoryID(), 2);
  EXPECT_EQ(top.GetNodeID(), 2u);
  EXPECT_EQ(top.GetVolumeRefNumber(), mData->Number());
  EXPECT_NE(mData->Number(), CFileRef("/", true).GetVolumeRefNumber());
}

TEST_F(IdentityOnAVolume, AnItemInTheTopFolderHasParent2) {
  EXPECT_EQ(CFileRef(mData->MakeFile("file").c_str(), false).GetParentID(), 2);
  EXPECT_EQ(mData->Ref("missing").GetParentID(), 2);
}

TEST_F(IdentityOnAVolume, AMissingItemIsOnTheVolumeAboveIt) {
  EXPECT_EQ(mData->Ref("missing/folders/file").GetVolumeRefNumber(), mData->Number());
}

// A new tmpfs numbers its inodes from 1. Inodes below 16 have ids in the upper half.
TEST_F(IdentityOnAVolume, AnIdInTheUpperHalfIsNegativeAsASignedNumber) {
  const CFileRef folder(mData->MakeFolder("folder").c_str(), true);
  const unsigned long id = folder.GetNodeID();
  ASSERT_GE(id, 0x80000000u);
  ASSERT_LE(id, 0xFFFFFFFEu);
  EXPECT_EQ(folder.GetDirectoryID(), static_cast<long>(id) - 0x100000000);
  EXPECT_EQ(mData->Ref("folder/missing").GetParentID(), folder.GetDirectoryID());
  FSSpec spec;
  ASSERT_TRUE(mData->Ref("folder/missing").GetFSSpec(&spec));
  EXPECT_EQ(FieldsOf(spec).folder, folder.GetDirectoryID());
  CFileRef again;
  EXPECT_TRUE(again.Set(mData->Number(), folder.GetDirectoryID(), 0, nullptr, false));
  EXPECT_EQ(again, folder);
  EXPECT_TRUE(again.Set(mData->Number(), static_cast<long>(id), 0, nullptr, false));
  EXPECT_EQ(again, folder);
}

}  // namespace
}  // namespace tallowmere::test
