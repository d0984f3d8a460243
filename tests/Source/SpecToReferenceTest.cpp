// References made from records and from HFS paths, and records made from references.
#include <gtest/gtest.h>

#include <vector>

#include "HFSBridgeSupport.h"

namespace tallowmere::test {
namespace {

using SpecToReference = DataVolumeTest;
using SpecDataToReference = DataVolumeTest;
using SpecOfPath = DataVolumeTest;
using AddingAnHFSName = DataVolumeTest;

bool SetFrom(CFileRef& ref, const FSSpec& spec, bool searchOtherVolumes = false) {
  return CFileUtilSetFileRefFromDeprecatedFSSpecThroughIPC(&ref, &spec, searchOtherVolumes, false);
}

// --- A record ---------------------------------------------------------------------------------

TEST_F(SpecToReference, OfAnExistingFileNamesItDirectly) {
  mData->MakeFolder("Work");
  mData->MakeFile("Work/file");
  const long folder = mData->Ref("Work").GetDirectoryID();
  CFileRef ref;
  EXPECT_TRUE(SetFrom(ref, Spec(mData->Number(), folder, "file")));
  EXPECT_EQ(PathOf(ref), mData->Path("Work/file"));
}

TEST_F(SpecToReference, OfAnExistingFolderIsMarkedAsAFolder) {
  mData->MakeFolder("Work");
  CFileRef ref;
  EXPECT_TRUE(SetFrom(ref, Spec(mData->Number(), 2, "Work")));
  EXPECT_TRUE(IsMarkedAsFolder(ref));
}

TEST_F(SpecToReference, OfARootIsTheVolumesTopFolder) {
  CFileRef ref;
  EXPECT_TRUE(SetFrom(ref, Spec(mData->Number(), 1, "Data")));
  EXPECT_EQ(PathOf(ref), mData->Path());
}

TEST_F(SpecToReference, OfAMissingFileIsItsNameInTheFolder) {
  mData->MakeFolder("Work");
  const long folder = mData->Ref("Work").GetDirectoryID();
  CFileRef ref;
  EXPECT_TRUE(SetFrom(ref, Spec(mData->Number(), folder, "new.txt")));
  EXPECT_EQ(PathOf(ref), mData->Path("Work/new.txt"));
  EXPECT_FALSE(IsMarkedAsFolder(ref));
}

TEST_F(SpecToReference, ASlashInAMissingFilesNameIsAColonInThePath) {
  CFileRef ref;
  EXPECT_TRUE(SetFrom(ref, Spec(mData->Number(), 2, "a/b\x8E")));
  EXPECT_EQ(PathOf(ref), mData->Path("a:b\xC3\xA9"));
}

TEST_F(SpecToReference, WithAnEmptyNameIsTheFolder) {
  mData->MakeFolder("Work");
  const long folder = mData->Ref("Work").GetDirectoryID();
  CFileRef ref;
  EXPECT_TRUE(SetFrom(ref, Spec(mData->Number(), folder, "")));
  EXPECT_STREQ(ref.GetPath(), mData->Path("Work").c_str());
}

TEST_F(SpecToReference, AStaleVolumeIsReplacedByOneThatHasTheFileWhereSearchIsOn) {
  const Volume second("Second");
  second.MakeFile("on Second alone");
  mData->MakeFile("on Data alone");
  const short stale = second.Number();
  CFileRef ref;
  EXPECT_TRUE(SetFrom(ref, Spec(stale, 2, "on Data alone"), true));
  EXPECT_EQ(PathOf(ref), mData->Path("on Data alone"));
  EXPECT_TRUE(SetFrom(ref, Spec(kUnknownVolume, 2, "on Second alone"), true));
  EXPECT_EQ(PathOf(ref), second.Path("on Second alone"));
}

TEST_F(SpecToReference, AStaleVolumeIsNotReplacedWhereSearchIsOff) {
  const Volume second("Second");
  mData->MakeFile("on Data alone");
  CFileRef ref;
  EXPECT_TRUE(SetFrom(ref, Spec(second.Number(), 2, "on Data alone")));
  EXPECT_EQ(PathOf(ref), second.Path("on Data alone"));
  EXPECT_FALSE(ref.Exists());
}

TEST_F(SpecToReference, OfAnItemOnNoVolumeIsANewOneOnItsOwnVolume) {
  const Volume second("Second");
  CFileRef ref;
  EXPECT_TRUE(SetFrom(ref, Spec(mData->Number(), 2, "on no volume at all"), true));
  EXPECT_EQ(PathOf(ref), mData->Path("on no volume at all"));
}

TEST_F(SpecToReference, WithAnUnknownFolderIsTheBareName) {
  for (const bool search : {false, true}) {
    CFileRef ref("/former", false);
    EXPECT_TRUE(SetFrom(ref, Spec(mData->Number(), kUnknownFolder, "a/name of none"), search));
    EXPECT_EQ(PathOf(ref), "a:name of none");
    EXPECT_FALSE(IsMarkedAsFolder(ref));
    EXPECT_EQ(ref.GetPath(), nullptr);
  }
}

TEST_F(SpecToReference, WithAnUnknownFolderAndAnEmptyNameLeavesTheReferenceEmpty) {
  CFileRef ref("/former", false);
  EXPECT_FALSE(SetFrom(ref, Spec(mData->Number(), kUnknownFolder, "")));
  EXPECT_TRUE(IsEmpty(ref));
}

TEST_F(SpecToReference, WithAFileForItsFolderIsTheBareName) {
  const CFileRef file(mData->MakeFile("file").c_str(), false);
  CFileRef ref;
  EXPECT_TRUE(SetFrom(ref, Spec(mData->Number(), static_cast<long>(file.GetNodeID()), "below")));
  EXPECT_EQ(PathOf(ref), "below");
}

TEST_F(SpecToReference, WithTheFolderOfAnotherVolumeIsNeverThatFoldersFile) {
  const Volume second("Second");
  const CFileRef folder(second.MakeFolder("a/b/c").c_str(), true);
  second.MakeFile("a/b/c/file");
  CFileRef ref;
  EXPECT_TRUE(SetFrom(ref, Spec(mData->Number(), folder.GetDirectoryID(), "file")));
  EXPECT_EQ(PathOf(ref), "file");
}

TEST_F(SpecToReference, WithUnknownFolderIdsIsTheBareName) {
  for (const long folder : {0L, 1L, -1L}) {
    CFileRef ref;
    EXPECT_TRUE(SetFrom(ref, Spec(mData->Number(), folder, "name"))) << folder;
    EXPECT_EQ(PathOf(ref), "name") << folder;
  }
}

TEST(SpecToAnyReference, OfTheEmptyRecordLeavesTheReferenceEmpty) {
  CFileRef ref("/former", false);
  EXPECT_FALSE(SetFrom(ref, CFileRef::None, true));
  EXPECT_TRUE(IsEmpty(ref));
}

TEST(SpecToAnyReference, NullsAreRefused) {
  CFileRef ref("/former", false);
  const FSSpec spec = Spec(0, 2, "name");
  EXPECT_FALSE(CFileUtilSetFileRefFromDeprecatedFSSpecThroughIPC(nullptr, &spec, true, true));
  EXPECT_FALSE(CFileUtilSetFileRefFromDeprecatedFSSpecThroughIPC(&ref, nullptr, true, true));
  EXPECT_TRUE(IsEmpty(ref));
}

TEST_F(SpecToReference, TheReferencesOwnRecordIsReadBeforeItIsReset) {
  CFileRef ref = mData->Ref("file");
  FSSpec const& own = ref;
  EXPECT_TRUE(SetFrom(ref, own));
  EXPECT_EQ(PathOf(ref), mData->Path("file"));
}

TEST_F(SpecToReference, ANameLengthBeyondTheRecordIsOf63Bytes) {
  mData->MakeFile(std::string(63, 'x'));
  for (int length = 63; length < 256; ++length) {
    // On the heap, where sanitizers notice a read beyond the record.
    auto spec = std::make_unique<FSSpec>(
        Spec(mData->Number(), 2, std::string(static_cast<std::size_t>(length), 'x')));
    CFileRef ref;
    EXPECT_TRUE(SetFrom(ref, *spec));
    EXPECT_EQ(PathOf(ref), mData->Path(std::string(63, 'x')));
    EXPECT_EQ(PathOf(CFileRef(spec.get(), true, true)), PathOf(ref));
    spec->parID = kUnknownFolder;
    EXPECT_TRUE(SetFrom(ref, *spec));
    EXPECT_EQ(PathOf(ref), std::string(63, 'x'));
  }
}

TEST_F(SpecToReference, EveryByteButNulNamesANewFileOfTheFolder) {
  for (int byte = 1; byte < 256; ++byte) {
    const std::string name = "x" + std::string(1, static_cast<char>(byte));
    CFileRef ref;
    EXPECT_TRUE(SetFrom(ref, Spec(mData->Number(), 2, name)));
    ASSERT_NE(ref.GetPath(), nullptr) << byte;
    EXPECT_EQ(std::filesystem::path(ref.GetPath()).parent_path(), mData->Path()) << byte;
  }
}

// A missing item's path survives the conversion to a record and back.
TEST_F(SpecToReference, AMissingFileSurvivesTheConversionToARecord) {
  for (int byte = 1; byte < 256; ++byte) {
    if (byte == '/') continue;
    const CFileRef file = mData->Ref("x" + std::string(1, static_cast<char>(byte)));
    CFileRef again;
    EXPECT_TRUE(SetFrom(again, file));
    if (byte < 0x80) {
      EXPECT_EQ(PathOf(again), PathOf(file)) << byte;
    } else {
      EXPECT_EQ(PathOf(again), mData->Path("x?")) << byte;
    }
  }
}

// --- Volume, folder and name ------------------------------------------------------------------

TEST_F(SpecDataToReference, AMissingFileInAnExistingFolderIsAccepted) {
  CFileRef ref;
  EXPECT_TRUE(CFileUtilSetFileRefFromFSSpecData(&ref, mData->Number(), 2, "a/b", true));
  EXPECT_EQ(PathOf(ref), mData->Path("a:b"));
}

TEST_F(SpecDataToReference, AnExistingItemIsNamed) {
  mData->MakeFolder("Work/Docs");
  CFileRef ref;
  EXPECT_TRUE(CFileUtilSetFileRefFromFSSpecData(&ref, mData->Number(), 2, ":Work:Docs", true));
  EXPECT_EQ(PathOf(ref), mData->Path("Work/Docs"));
}

TEST_F(SpecDataToReference, AFileOnAnotherVolumeIsFoundThere) {
  const Volume other("Other");
  ASSERT_TRUE(other.IsMounted());
  const std::string file = other.MakeFile("f");
  CFileRef ref;
  EXPECT_TRUE(CFileUtilSetFileRefFromFSSpecData(&ref, mData->Number(), 2, "f", false));
  EXPECT_EQ(PathOf(ref), file);
}

TEST_F(SpecDataToReference, AnotherVolumesRootIsFoundByItsName) {
  const Volume other("Other");
  ASSERT_TRUE(other.IsMounted());
  CFileRef ref;
  EXPECT_TRUE(CFileUtilSetFileRefFromFSSpecData(&ref, mData->Number(), 1, "Other", false));
  EXPECT_EQ(PathOf(ref), other.Path());
}

TEST_F(SpecDataToReference, ARootOfNoVolumeIsTheBareName) {
  CFileRef ref;
  EXPECT_TRUE(CFileUtilSetFileRefFromFSSpecData(&ref, mData->Number(), 1, "f", false));
  EXPECT_EQ(PathOf(ref), "f");
}

TEST_F(SpecDataToReference, AnItemWithoutARecordLeavesTheReferenceUnchanged) {
  CFileRef ref("/former", false);
  for (const long folder : {kUnknownFolder, -1L}) {
    EXPECT_FALSE(CFileUtilSetFileRefFromFSSpecData(&ref, mData->Number(), folder, "f", false));
  }
  EXPECT_FALSE(CFileUtilSetFileRefFromFSSpecData(&ref, mData->Number(), 1, "", false));
  EXPECT_FALSE(CFileUtilSetFileRefFromFSSpecData(&ref, mData->Number(), 2, ":missing:f", false));
  EXPECT_FALSE(CFileUtilSetFileRefFromFSSpecData(&ref, kUnknownVolume, 2, "f", false));
  EXPECT_FALSE(CFileUtilSetFileRefFromFSSpecData(&ref, kNoVolume, -1, "", false));
  EXPECT_FALSE(CFileUtilSetFileRefFromFSSpecData(&ref, mData->Number(), 2,
                                                 std::string(65535, 'x').c_str(), false));
  EXPECT_EQ(PathOf(ref), "/former");
}

// --- The record of a reference ----------------------------------------------------------------

TEST_F(SpecToReference, TheRecordOfANewFileIsUsable) {
  FSSpec spec = Untouched();
  EXPECT_TRUE(CFileUtilGetDeprecatedFSSpecThroughIPC(mData->Ref("file"), &spec));
  EXPECT_EQ(FieldsOf(spec), (Fields{mData->Number(), 2, "file"}));
}

TEST_F(SpecToReference, TheRecordOfAMissingFileInAMissingFolderIsNotUsable) {
  FSSpec spec = Untouched();
  EXPECT_FALSE(CFileUtilGetDeprecatedFSSpecThroughIPC(mData->Ref("missing/file"), &spec));
  EXPECT_EQ(FieldsOf(spec), (Fields{kNoVolume, kNoFolder, "file"}));
}

TEST(SpecToAnyReference, TheRecordOfAnEmptyReferenceIsEmpty) {
  FSSpec spec = Untouched();
  EXPECT_FALSE(CFileUtilGetDeprecatedFSSpecThroughIPC(CFileRef::None, &spec));
  EXPECT_EQ(FieldsOf(spec), kEmptyFields);
}

// --- Adding a name ----------------------------------------------------------------------------

TEST_F(AddingAnHFSName, ToAFolderNamesTheExistingItem) {
  mData->MakeFile("a:b\xC3\xA9");
  CFileRef ref = mData->Ref();
  EXPECT_TRUE(CFileUtilAddHFSName(&ref, "a/b\x8E", true));
  EXPECT_EQ(PathOf(ref), mData->Path("a:b\xC3\xA9"));
  EXPECT_FALSE(IsMarkedAsFolder(ref));
}

TEST_F(AddingAnHFSName, ToAFolderMakesColonsOfTheSlashesInANewName) {
  for (const bool flag : {false, true}) {
    CFileRef ref = mData->Ref();
    EXPECT_TRUE(CFileUtilAddHFSName(&ref, "a/b\x8E", flag));
    EXPECT_EQ(PathOf(ref), mData->Path("a:b\xC3\xA9"));
    EXPECT_EQ(IsMarkedAsFolder(ref), flag);
  }
}

TEST_F(AddingAnHFSName, BelowAnythingElseIsAddedUnconverted) {
  mData->MakeFile("file");
  for (const char* const item : {"file", "missing"}) {
    CFileRef ref = mData->Ref(item);
    EXPECT_TRUE(CFileUtilAddHFSName(&ref, "a/b:\xC3\xA9", true));
    EXPECT_EQ(PathOf(ref), mData->Path(std::string(item) + "/a/b:\xC3\xA9"));
    EXPECT_TRUE(IsMarkedAsFolder(ref));
  }
}

TEST_F(AddingAnHFSName, InMacRomanBelowAnythingElseIsNotUTF8) {
  CFileRef ref = mData->Ref("missing");
  EXPECT_FALSE(CFileUtilAddHFSName(&ref, "\x8E", true));
  EXPECT_EQ(PathOf(ref), mData->Path("missing"));
}

TEST_F(AddingAnHFSName, ToAnEmptyReferenceIsThePathItself) {
  CFileRef ref;
  EXPECT_TRUE(CFileUtilAddHFSName(&ref, "/a", false));
  EXPECT_EQ(PathOf(ref), "/a");
}

TEST_F(AddingAnHFSName, WithoutAReferenceOrANameIsRefused) {
  CFileRef ref = mData->Ref();
  EXPECT_FALSE(CFileUtilAddHFSName(nullptr, "name", false));
  EXPECT_FALSE(CFileUtilAddHFSName(&ref, nullptr, false));
  EXPECT_EQ(PathOf(ref), mData->Path());
}

TEST_F(AddingAnHFSName, Of65535BytesIsCutTo255) {
  CFileRef ref = mData->Ref();
  EXPECT_TRUE(CFileUtilAddHFSName(&ref, std::string(65535, 'x').c_str(), false));
  EXPECT_EQ(PathOf(ref), mData->Path(std::string(255, 'x')));
}

// --- A folder's path and a name ---------------------------------------------------------------

struct Made {
  OSErr result;
  Fields spec;

  bool operator==(const Made&) const = default;
  friend std::ostream& operator<<(std::ostream& out, const Made& made) {
    return out << made.result << " " << made.spec;
  }
};

Made MakeSpec(const char* folderPath, const char* name, bool joinSecond = false) {
  FSSpec spec = Untouched();
  const OSErr result = CFileUtilMakeFSSpecFromPath(&spec, folderPath, name, joinSecond ? 0x80 : 0);
  return {result, FieldsOf(spec)};
}

class SpecOfPathInDir : public DataVolumeTest {
 protected:
  void SetUp() override {
    DataVolumeTest::SetUp();
    if (!mData) return;
    mData->MakeFolder("Dir");
    mDir = mData->Ref("Dir").GetDirectoryID();
  }
  // The result for all spellings of Data:Dir:f while f is missing.
  Made MissingFile() const { return {fnfErr, {mData->Number(), mDir, "f"}}; }

  long mDir = 0;
};

TEST_F(SpecOfPathInDir, AColonIsPutBetweenFolderAndName) {
  EXPECT_EQ(MakeSpec("Data:Dir", "f"), MissingFile());
}

TEST_F(SpecOfPathInDir, ATrailingColonOfTheFolderIsEnough) {
  EXPECT_EQ(MakeSpec("Data:Dir:", "f"), MissingFile());
}

TEST_F(SpecOfPathInDir, AnEmptyFolderGetsNoColon) {
  EXPECT_EQ(MakeSpec("", "Data:f"), (Made{fnfErr, {mData->Number(), 2, "f"}}));
  EXPECT_EQ(MakeSpec(nullptr, "Data:f"), (Made{fnfErr, {mData->Number(), 2, "f"}}));
}

TEST_F(SpecOfPathInDir, TheSecondStringIsJoinedToTheFirst) {
  EXPECT_EQ(MakeSpec("Data\0Dir", "f", true), MissingFile());
  EXPECT_EQ(MakeSpec("Data\0Dir:", "f", true), MissingFile());
  EXPECT_EQ(MakeSpec("Data\0", "f", true), (Made{fnfErr, {mData->Number(), 2, "f"}}));
  EXPECT_EQ(MakeSpec("Data:\0Dir", "f", true), (Made{dirNFErr, FieldsOf(Untouched())}));
}

TEST_F(SpecOfPathInDir, AnEmptyFirstStringGetsNoColonAfterTheSecond) {
  const CurrentFolder current(mData->Path());
  EXPECT_EQ(MakeSpec("\0Dir:", "f", true), MissingFile());
  EXPECT_EQ(MakeSpec("\0Dir", "f", true), (Made{fnfErr, {mData->Number(), 2, "Dirf"}}));
}

TEST_F(SpecOfPathInDir, OfALengthOf255IsTakenWhole) {
  const std::string first(124, 'a');
  const std::string second(125, 'b');
  mData->MakeFolder(first + "/" + second);
  const Made made = MakeSpec(("Data:" + first).c_str(), second.c_str());
  EXPECT_EQ(made.result, noErr);
  EXPECT_EQ(made.spec, FieldsOf(mData->Ref(first + "/" + second)));
}

TEST_F(SpecOfPathInDir, WithoutANameIsTheFolder) {
  EXPECT_EQ(MakeSpec("Data:Dir", nullptr), (Made{noErr, {mData->Number(), 2, "Dir"}}));
  EXPECT_EQ(MakeSpec("Data", nullptr), (Made{noErr, {mData->Number(), 1, "Data"}}));
}

TEST_F(SpecOfPathInDir, TheLengthIsTakenModulo256) {
  const CurrentFolder current(mData->Path());
  const std::string folder = "Data:Dir:";
  for (const std::size_t length : {256u, 512u, 1024u, 1280u, 65280u}) {
    const std::string name(length - folder.size(), 'x');
    // Nothing is left of the path, which then means the current folder.
    EXPECT_EQ(MakeSpec(folder.c_str(), name.c_str()), (Made{noErr, {mData->Number(), 1, "Data"}}));
    EXPECT_EQ(MakeSpec(folder.c_str(), ("f" + name + folder).c_str()), MakeSpec("Data:Dir:", "f"));
  }
}

TEST_F(SpecOfPathInDir, PathsOf65535BytesAreCut) {
  const CurrentFolder current(mData->Path());
  const std::string text(65535, 'x');
  const std::string two = text + '\0' + text;
  EXPECT_EQ(MakeSpec(nullptr, text.c_str()).result, bdNamErr);
  EXPECT_EQ(MakeSpec(text.c_str(), nullptr).result, noErr);                 // as if it were empty
  EXPECT_EQ(MakeSpec(text.c_str(), text.c_str()).result, bdNamErr);         // 255 bytes
  EXPECT_EQ(MakeSpec(two.c_str(), text.c_str(), true).result, bdNamErr);    // 255 bytes
  EXPECT_EQ(MakeSpec("Data:Dir", text.c_str()), MakeSpec("Data:", "Dir"));  // 8 bytes
}

TEST_F(SpecOfPathInDir, AnItemWithoutARecordGivesTheFileManagersError) {
  EXPECT_EQ(MakeSpec("No such volume:", "f").result, nsvErr);
  EXPECT_EQ(MakeSpec("Data:Missing", "f").result, dirNFErr);
  EXPECT_EQ(MakeSpec("Data:", std::string(64, 'x').c_str()).result, bdNamErr);
}

TEST_F(SpecOfPathInDir, AReferenceIsMadeOfAnExistingItem) {
  CFileRef ref("/former", false);
  EXPECT_EQ(CFileUtilMakeFileRefFromPath(&ref, "Data", "Dir", 0), noErr);
  EXPECT_EQ(PathOf(ref), mData->Path("Dir"));
  mData->MakeFile("Dir/a:b");
  EXPECT_EQ(CFileUtilMakeFileRefFromPath(&ref, "Data\0Dir", "a/b", 1), noErr);
  EXPECT_EQ(PathOf(ref), mData->Path("Dir/a:b"));
}

TEST_F(SpecOfPathInDir, AMissingItemLeavesTheReferenceUnchanged) {
  CFileRef ref("/former", false);
  EXPECT_EQ(CFileUtilMakeFileRefFromPath(&ref, "Data:Dir", "missing", 0), fnfErr);
  EXPECT_EQ(CFileUtilMakeFileRefFromPath(&ref, "Data:Missing", "f", 0), dirNFErr);
  EXPECT_EQ(CFileUtilMakeFileRefFromPath(&ref, "No such volume:", "f", 0), nsvErr);
  EXPECT_EQ(PathOf(ref), "/former");
}

}  // namespace
}  // namespace tallowmere::test
