// The record of a reference, and references set from a record, a folder id or an HFS path.
#include <gtest/gtest.h>

#include <cstring>
#include <fstream>
#include <vector>

#include "HFSBridgeSupport.h"
#include "support/OldFormats.h"

namespace tallowmere::test {
namespace {

using SpecOfReference = DataVolumeTest;
using SettingByFolder = DataVolumeTest;
using SettingFromHFSPath = DataVolumeTest;
using ReferenceOfSpec = DataVolumeTest;

// --- Record of a reference --------------------------------------------------------------------

TEST_F(SpecOfReference, AnExistingFileHasTheFileManagersRecord) {
  mData->MakeFolder("Work");
  const CFileRef file(mData->MakeFile("Work/a:b").c_str(), false);
  FSSpec spec = Untouched();
  EXPECT_TRUE(file.GetFSSpec(&spec));
  EXPECT_EQ(FieldsOf(spec), (Fields{mData->Number(), mData->Ref("Work").GetDirectoryID(), "a/b"}));
  FSSpec platform;
  ASSERT_EQ(FSMakeFSSpec(spec.vRefNum, spec.parID, spec.name, &platform), noErr);
  EXPECT_EQ(FieldsOf(spec), FieldsOf(platform));
}

TEST_F(SpecOfReference, ALongNameOfAnExistingFileIsTheFileManagersShortForm) {
  const CFileRef file(mData->MakeFile(std::string(70, 'n') + ".text").c_str(), false);
  FSSpec spec = Untouched();
  EXPECT_TRUE(file.GetFSSpec(&spec));
  EXPECT_EQ(spec.name[0], 31);
  EXPECT_EQ(CFileRef(spec, false, false), file);
}

TEST_F(SpecOfReference, AMissingFileHasItsFoldersVolumeAndId) {
  mData->MakeFolder("Work");
  FSSpec spec = Untouched();
  EXPECT_TRUE(mData->Ref("Work/new.txt").GetFSSpec(&spec));
  EXPECT_EQ(FieldsOf(spec),
            (Fields{mData->Number(), mData->Ref("Work").GetDirectoryID(), "new.txt"}));
}

TEST_F(SpecOfReference, AMissingFileBelowAFileOrALinkHasTheIdOfThat) {
  mData->MakeFile("file");
  std::filesystem::create_symlink(mData->MakeFolder("Work"), mData->Path("link"));
  for (const char* const holder : {"file", "link"}) {
    FSSpec spec = Untouched();
    EXPECT_TRUE(mData->Ref(std::string(holder) + "/new.txt").GetFSSpec(&spec));
    EXPECT_EQ(
        FieldsOf(spec),
        (Fields{mData->Number(), static_cast<SInt32>(mData->Ref(holder).GetNodeID()), "new.txt"}));
  }
}

TEST_F(SpecOfReference, AMissingFilesNameIsInHFSForm) {
  FSSpec spec = Untouched();
  EXPECT_TRUE(mData->Ref("a:b\xC3\xA9").GetFSSpec(&spec));
  EXPECT_EQ(FieldsOf(spec), (Fields{mData->Number(), 2, "a/b\x8E"}));
}

TEST_F(SpecOfReference, AMissingFilesNameIsCutTo63Bytes) {
  for (const std::size_t length : {63u, 64u, 70u, 255u}) {
    const std::string name(length, 'n');
    FSSpec spec = Untouched();
    EXPECT_TRUE(mData->Ref(name).GetFSSpec(&spec));
    EXPECT_EQ(FieldsOf(spec), (Fields{mData->Number(), 2, name.substr(0, 63)}));
  }
}

TEST_F(SpecOfReference, AMissingFilesNameThatMacRomanLacksIsConvertedWithLoss) {
  FSSpec spec = Untouched();
  EXPECT_TRUE(mData->Ref("a:\xE6\x97\xA5").GetFSSpec(&spec));
  EXPECT_EQ(FieldsOf(spec), (Fields{mData->Number(), 2, "a:?"}));
}

TEST_F(SpecOfReference, AMissingFileInAMissingFolderHasItsNameAlone) {
  const CFileRef missing = mData->Ref("missing/file");
  FSSpec spec = Untouched();
  EXPECT_TRUE(missing.GetFSSpec(&spec));
  EXPECT_EQ(FieldsOf(spec), (Fields{kNoVolume, kNoFolder, "file"}));
  EXPECT_TRUE(IsZero(CachedFSRefOf(missing)));
}

TEST_F(SpecOfReference, ANonFileURLHasTheRecordOfAMissingItemAtItsPath) {
  mData->MakeFolder("Work/folder");
  mData->MakeFile("Work/file");
  for (const std::string start : {"http://elsewhere", "file://elsewhere", "http:"}) {
    for (const std::string name : {"file", "folder", "missing"}) {
      CFileRef item;
      ASSERT_TRUE(item.SetFromURLString(start + mData->Path("Work/" + name)));
      FSSpec spec = Untouched();
      EXPECT_TRUE(item.GetFSSpec(&spec)) << start << " " << name;
      EXPECT_EQ(FieldsOf(spec),
                (Fields{mData->Number(), mData->Ref("Work").GetDirectoryID(), name}));
    }
  }
}

TEST_F(SpecOfReference, ARootIsItsVolumesNameInFolder1) {
  FSSpec spec = Untouched();
  EXPECT_TRUE(mData->Ref().GetFSSpec(&spec));
  EXPECT_EQ(FieldsOf(spec), (Fields{mData->Number(), 1, "Data"}));
}

TEST_F(SpecOfReference, TheConversionsFollowTheItem) {
  CFileRef ref = mData->Ref("file");
  FSSpec const& spec = ref;
  FSSpec const* const pointer = ref;
  EXPECT_EQ(&spec, pointer);
  EXPECT_EQ(&spec, &CachedFSSpecOf(ref));
  EXPECT_EQ(FieldsOf(spec), (Fields{mData->Number(), 2, "file"}));
  ref.AddToPath("below", false);
  EXPECT_EQ(FieldsOf(ref), (Fields{kNoVolume, kNoFolder, "below"}));
  ref.Invalidate();
  EXPECT_EQ(FieldsOf(ref), kEmptyFields);
}

TEST_F(SpecOfReference, TheConversionIsNeverStale) {
  CFileRef ref;
  CachedFSSpecOf(ref) = Untouched();
  EXPECT_EQ(FieldsOf(ref), kEmptyFields);
}

TEST(SpecOfAnyReference, AnEmptyReferenceLeavesTheRecordUntouched) {
  FSSpec spec = Untouched();
  EXPECT_FALSE(CFileRef().GetFSSpec(&spec));
  EXPECT_EQ(FieldsOf(spec), FieldsOf(Untouched()));
  EXPECT_EQ(FieldsOf(CFileRef()), kEmptyFields);
}

TEST(SpecOfAnyReference, ARelativePathHasItsNameAlone) {
  FSSpec spec = Untouched();
  EXPECT_TRUE(CFileRef("missing", false).GetFSSpec(&spec));
  EXPECT_EQ(FieldsOf(spec), (Fields{kNoVolume, kNoFolder, "missing"}));
}

TEST(SpecOfAnyReference, AURLWithoutAPathHasNoRecord) {
  CFileRef ref;
  ASSERT_TRUE(ref.SetFromURLString("http://host"));
  FSSpec spec = Untouched();
  EXPECT_FALSE(ref.GetFSSpec(&spec));
  EXPECT_EQ(FieldsOf(spec), kEmptyFields);
}

TEST(SpecOfAnyReference, APathOf65535BytesIsCutLikeAnyOther) {
  FSSpec spec = Untouched();
  EXPECT_TRUE(CFileRef(("/" + std::string(65534, 'x')).c_str(), false).GetFSSpec(&spec));
  EXPECT_EQ(TextOfPascal(spec.name), std::string(63, 'x'));
}

// --- By volume, folder and name ---------------------------------------------------------------

bool SetByName(CFileRef& ref, short volume, long folder, const std::u16string& name) {
  const std::basic_string<unsigned short> units(name.begin(), name.end());
  return ref.Set(volume, folder, units.size(), units.data(), true);
}

TEST_F(SettingByFolder, WithoutANameIsTheFolderItself) {
  const CFileRef folder(mData->MakeFolder("Work").c_str(), true);
  const CFileRef ref(mData->Number(), folder.GetDirectoryID(), 0, nullptr, false);
  EXPECT_EQ(PathOf(ref), mData->Path("Work"));
  EXPECT_TRUE(IsMarkedAsFolder(ref));
}

TEST_F(SettingByFolder, Folder2IsTheTopFolder) {
  EXPECT_EQ(PathOf(CFileRef(mData->Number(), 2, 0, nullptr, false)), mData->Path());
}

TEST_F(SettingByFolder, WithTheIdOfAFileLeavesTheReferenceEmpty) {
  const CFileRef file(mData->MakeFile("file").c_str(), false);
  CFileRef ref("/former", false);
  EXPECT_FALSE(ref.Set(mData->Number(), static_cast<long>(file.GetNodeID()), 0, nullptr, false));
  EXPECT_TRUE(IsEmpty(ref));
}

TEST_F(SettingByFolder, WithANameIsTheExistingItem) {
  mData->MakeFile("a:b");
  CFileRef ref;
  EXPECT_TRUE(SetByName(ref, mData->Number(), 2, u"a/b"));
  EXPECT_EQ(PathOf(ref), mData->Path("a:b"));
}

TEST_F(SettingByFolder, AnUnknownItemLeavesTheReferenceUnchanged) {
  const CFileRef file(mData->MakeFile("file").c_str(), false);
  const auto fileID = static_cast<long>(file.GetNodeID());
  const Volume other("Other");
  const CFileRef elsewhere(other.MakeFolder("a/b/c").c_str(), true);
  CFileRef ref("/former", false);
  EXPECT_FALSE(SetByName(ref, mData->Number(), 2, u"missing"));
  EXPECT_FALSE(SetByName(ref, mData->Number(), fileID, u"below a file"));
  EXPECT_FALSE(SetByName(ref, mData->Number(), 2, std::u16string(65535, u'x')));
  for (const long folder : {0L, 1L, -1L, kUnknownFolder, elsewhere.GetDirectoryID()}) {
    EXPECT_FALSE(ref.Set(mData->Number(), folder, 0, nullptr, false)) << folder;
    EXPECT_FALSE(SetByName(ref, mData->Number(), folder, u"file")) << folder;
  }
  for (const short volume : {kUnknownVolume, kNoVolume}) {
    EXPECT_FALSE(ref.Set(volume, 2, 0, nullptr, false)) << volume;
    EXPECT_FALSE(SetByName(ref, volume, 2, u"file")) << volume;
  }
  EXPECT_EQ(PathOf(ref), "/former");
}

// --- By HFS path ------------------------------------------------------------------------------

TEST_F(SettingFromHFSPath, AFolderWithAClosingColonIsThePOSIXFolder) {
  CFileRef ref;
  EXPECT_TRUE(ref.SetFromHFSPath("Data:Work:", true));
  EXPECT_EQ(PathOf(ref), mData->Path("Work"));
  EXPECT_TRUE(IsMarkedAsFolder(ref));
}

TEST_F(SettingFromHFSPath, NamesAreInMacRomanWithSlashesForColons) {
  CFileRef ref;
  EXPECT_TRUE(ref.SetFromHFSPath("Data:a/b\x8E", false));
  EXPECT_EQ(PathOf(ref), mData->Path("a:b\xC3\xA9"));
}

TEST_F(SettingFromHFSPath, NamesTheLocalEncodingLacksAreInTheSystemEncoding) {
  CFileRef::mLocalEncoding = kCFStringEncodingASCII;
  CFileRef ref;
  ref.SetFromHFSPath("Data:\x8E", false);
  CFileRef::mLocalEncoding = kCFStringEncodingMacRoman;
  EXPECT_EQ(PathOf(ref), mData->Path("\xC3\xA9"));
}

TEST_F(SettingFromHFSPath, NamesAreInTheLocalEncodingFirst) {
  CFileRef::mLocalEncoding = kCFStringEncodingISOLatin1;
  CFileRef ref;
  ref.SetFromHFSPath("Data:\xE9", false);
  CFileRef::mLocalEncoding = kCFStringEncodingMacRoman;
  EXPECT_EQ(PathOf(ref), mData->Path("\xC3\xA9"));
}

TEST_F(SettingFromHFSPath, TheReferencesOwnPathIsReadBeforeItIsReleased) {
  CFileRef ref("/Data:Work", false);
  EXPECT_FALSE(ref.SetFromHFSPath(ref.GetPath(), false));  // volume names have no '/'
  EXPECT_TRUE(IsEmpty(ref));
}

TEST_F(SettingFromHFSPath, FailureLeavesTheReferenceEmpty) {
  for (const char* const path : {static_cast<const char*>(nullptr), "", "No such volume:a"}) {
    CFileRef ref("/former", false);
    EXPECT_FALSE(ref.SetFromHFSPath(path, false));
    EXPECT_TRUE(IsEmpty(ref));
  }
}

// --- Reference of a record --------------------------------------------------------------------

// Makes references of the record in all four ways.
std::vector<CFileRef> AllRefsOf(FSSpec spec, bool searchOtherVolumes = false) {
  FSSpec const& constant = spec;
  CFileRef set;
  set.SetFromFSSpec(&spec, searchOtherVolumes, false);
  return {CFileRef(&spec, searchOtherVolumes, false),
          CFileRef(&constant, searchOtherVolumes, false),
          CFileRef(constant, searchOtherVolumes, false), set};
}

TEST_F(ReferenceOfSpec, AnExistingItemIsNamedInEveryWay) {
  mData->MakeFile("file");
  for (const CFileRef& ref : AllRefsOf(Spec(mData->Number(), 2, "file"))) {
    EXPECT_EQ(PathOf(ref), mData->Path("file"));
  }
}

TEST_F(ReferenceOfSpec, AMissingItemIsNamedInEveryWay) {
  for (const CFileRef& ref : AllRefsOf(Spec(mData->Number(), 2, "new"))) {
    EXPECT_EQ(PathOf(ref), mData->Path("new"));
  }
}

TEST_F(ReferenceOfSpec, OtherVolumesAreSearchedInEveryWay) {
  mData->MakeFile("on Data alone");
  for (const CFileRef& ref : AllRefsOf(Spec(kUnknownVolume, 2, "on Data alone"), true)) {
    EXPECT_EQ(PathOf(ref), mData->Path("on Data alone"));
  }
}

TEST(ReferenceOfAnySpec, NullIsAnEmptyReferenceInEveryWay) {
  EXPECT_TRUE(IsEmpty(CFileRef(static_cast<FSSpec*>(nullptr), true, true)));
  EXPECT_TRUE(IsEmpty(CFileRef(static_cast<FSSpec const*>(nullptr), true, true)));
  CFileRef ref("/former", false);
  EXPECT_FALSE(ref.SetFromFSSpec(nullptr, true, true));
  EXPECT_TRUE(IsEmpty(ref));
}

// A link is not an alias file, so it is not followed.
TEST_F(ReferenceOfSpec, ALinkIsNamedItselfInEveryWay) {
  std::filesystem::create_symlink(mData->MakeFile("file"), mData->Path("link"));
  for (const CFileRef& ref : AllRefsOf(Spec(mData->Number(), 2, "link"))) {
    EXPECT_EQ(PathOf(ref), mData->Path("link"));
  }
}

// Makes an alias file in the same folder as the target of its record.
void MakeAlias(const std::string& path, const std::string& target) {
  RecordToWrite record;
  record.volumeName = "Elsewhere";
  record.name = target;
  record.levelsUp = record.levelsDown = 1;
  record.tags = {{18, target}};
  const std::size_t name = path.rfind('/') + 1;
  std::ofstream(path).flush();
  std::ofstream(path.substr(0, name) + "._" + path.substr(name), std::ios::binary)
      << WriteSidecarOfAlias(Write(record));
}

TEST_F(ReferenceOfSpec, AnAliasFileIsNamedItselfExceptByAWritablePointer) {
  mData->MakeFile("file");
  MakeAlias(mData->Path("alias"), "file");
  const auto refs = AllRefsOf(Spec(mData->Number(), 2, "alias"));
  EXPECT_EQ(PathOf(refs[0]), mData->Path("file"));
  for (std::size_t i = 1; i < refs.size(); ++i) EXPECT_EQ(PathOf(refs[i]), mData->Path("alias"));
}

TEST_F(ReferenceOfSpec, AChainOfAliasFilesIsNamedByItsEnd) {
  mData->MakeFile("file");
  MakeAlias(mData->Path("first"), "second");
  MakeAlias(mData->Path("second"), "file");
  EXPECT_EQ(PathOf(AllRefsOf(Spec(mData->Number(), 2, "first"))[0]), mData->Path("file"));
}

TEST_F(ReferenceOfSpec, AnAliasFileWithoutATargetIsNamedItself) {
  MakeAlias(mData->Path("alias"), "none");
  for (const CFileRef& ref : AllRefsOf(Spec(mData->Number(), 2, "alias"))) {
    EXPECT_EQ(PathOf(ref), mData->Path("alias"));
  }
}

TEST_F(ReferenceOfSpec, TheRecordIsNotWritten) {
  mData->MakeFile("file");
  FSSpec spec = Spec(mData->Number(), 2, "file");
  const FSSpec before = spec;
  const CFileRef ref(&spec, true, true);
  EXPECT_EQ(0, std::memcmp(&spec, &before, sizeof spec));
}

}  // namespace
}  // namespace tallowmere::test
