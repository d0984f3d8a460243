// Names on file systems that pass for old volumes: they ignore letter case, give names as the
// disk's bytes, or once had short forms of long names.
#include <fcntl.h>
#include <sys/stat.h>

#include <chrono>
#include <filesystem>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "NumberedFileSystem.h"
#include "names/HFSNames.h"
#include "platform/HostCalls.h"
#include "support/MountNamespace.h"
#include "support/OtherKernel.h"
#include "support/OwnMountNamespace.h"

namespace tallowmere::test {
namespace {

// The types that statfs(2) reports on real volumes.
constexpr std::uint32_t kHFS = 0x4244;
constexpr std::uint32_t kHFSPlus = 0x482B;
constexpr std::uint32_t kVfat = 0x4D44;
constexpr std::uint32_t kExfat = 0x2011BAB0;
constexpr std::uint32_t kExt = 0xEF53;

class AnOldVolume : public testing::Test {
 protected:
  void Mount(std::uint32_t type) {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    mType.emplace(type);
    mVolume.emplace(NumberedFileSystem::On::kBlockDevice, NumberedFileSystem::Case::kIgnored,
                    NumberedFileSystem::Ticks::kKernels);
    if (!mVolume->IsMounted()) GTEST_SKIP() << "no FUSE here, or no block device for it";
    mNumber = InfoOf(Top()).volume;
  }

  std::string Top() const { return mVolume->Path(); }
  std::string MakeFolder(const std::string& name) const {
    EXPECT_EQ(mkdir((Top() + "/" + name).c_str(), 0755), 0) << name;
    return Top() + "/" + name;
  }
  std::string MakeFile(const std::string& name) const {
    EXPECT_EQ(mknod((Top() + "/" + name).c_str(), S_IFREG | 0644, 0), 0) << name;
    return Top() + "/" + name;
  }
  // Returns the path that a record finds, or the result code in brackets.
  std::string LookUp(const std::string& folder, std::string_view name) const {
    return ItemOf(MakeRecord(mNumber, IDOf(folder), name));
  }

  std::optional<FuseAsType> mType;
  std::optional<NumberedFileSystem> mVolume;
  SInt16 mNumber = 0;
};

class WithoutLetterCase : public AnOldVolume, public testing::WithParamInterface<std::uint32_t> {
 protected:
  void SetUp() override { Mount(GetParam()); }
};

TEST_P(WithoutLetterCase, ARecordInAnotherCaseFindsTheItemUnderItsStoredName) {
  const std::string path = MakeFile("Read Me");
  EXPECT_EQ(LookUp(Top(), "Read Me"), path);
  EXPECT_EQ(LookUp(Top(), "READ ME"), path);
  EXPECT_EQ(LookUp(Top(), "read me"), path);
}

TEST_P(WithoutLetterCase, EachPathToAnItemHasOneRecord) {
  MakeFolder("Folder");
  MakeFile("Folder/Read Me");
  const FSSpec record = SpecOf(Top() + "/Folder/Read Me");
  for (const char* const path : {"/Folder/READ ME", "/FOLDER/read me", "/folder/Read Me"}) {
    const FSSpec other = SpecOf(Top() + path);
    EXPECT_EQ(NameOf(other), "Read Me") << path;
    EXPECT_EQ(ParentOf(other), ParentOf(record)) << path;
  }
}

TEST_P(WithoutLetterCase, AFolderOnTheWayHasItsStoredNameToo) {
  MakeFolder("Folder");
  const std::string inner = MakeFolder("Folder/Inner");
  const std::string path = MakeFile("Folder/Inner/Read Me");
  // The platform remembers the folders as they were spelled.
  SpecOf(Top() + "/FOLDER/INNER/READ ME");
  EXPECT_EQ(LookUp(inner, "read me"), path);
  EXPECT_EQ(FolderWithID(mNumber, IDOf(Top() + "/FOLDER/INNER")), inner);
  EXPECT_EQ(PathOf(ReferenceTo(Top() + "/folder/inner/read me")), path);
}

TEST_P(WithoutLetterCase, CatalogInformationHasTheStoredName) {
  MakeFile("Read Me");
  const FSRef reference = ReferenceTo(Top() + "/READ ME");
  HFSUniStr255 name{};
  ASSERT_EQ(FSGetCatalogInfo(&reference, kFSCatInfoNone, nullptr, &name, nullptr, nullptr), noErr);
  EXPECT_EQ(std::u16string(name.unicode, name.unicode + name.length), u"Read Me");
}

TEST_P(WithoutLetterCase, ARecordMadeOfAnHFSNameHasTheStoredName) {
  MakeFolder("Folder");
  MakeFile("Folder/Read Me");
  FSSpec record{};
  ASSERT_EQ(FSMakeFSSpec(mNumber, 0, Str255Of(":FOLDER:READ ME").bytes, &record), noErr);
  EXPECT_EQ(NameOf(record), "Read Me");
  EXPECT_EQ(ItemOf(record), Top() + "/Folder/Read Me");
}

TEST_P(WithoutLetterCase, AFullPathHasTheStoredNames) {
  MakeFolder("Folder");
  MakeFolder("Folder/Inner");
  Str255 name = {};
  CInfoPBRec block = {};
  block.dirInfo.ioNamePtr = name;
  block.dirInfo.ioVRefNum = mNumber;
  block.dirInfo.ioFDirIndex = -1;
  block.dirInfo.ioDrDirID = static_cast<SInt32>(IDOf(Top() + "/FOLDER/INNER"));
  ASSERT_EQ(PBGetCatInfoSync(&block), noErr);
  EXPECT_EQ(names::TextOfPascal(name), "Inner");
  block.dirInfo.ioDrDirID = block.dirInfo.ioDrParID;
  ASSERT_EQ(PBGetCatInfoSync(&block), noErr);
  EXPECT_EQ(names::TextOfPascal(name), "Folder");
}

TEST_P(WithoutLetterCase, ARenameOfLetterCaseOnlyIsSeen) {
  const std::string before = MakeFile("Read Me");
  const FSRef reference = ReferenceTo(before);
  const std::string after = Top() + "/READ ME";
  // Renaming directly would have no effect: to the kernel both are names of the same item.
  std::filesystem::rename(before, Top() + "/other");
  std::filesystem::rename(Top() + "/other", after);
  EXPECT_EQ(PathOf(reference), after);
  EXPECT_EQ(LookUp(Top(), "read me"), after);
}

INSTANTIATE_TEST_SUITE_P(OnEachKind, WithoutLetterCase,
                         testing::Values(kHFS, kHFSPlus, kVfat, kExfat), [](const auto& type) {
                           return type.param == kHFS       ? "hfs"
                                  : type.param == kHFSPlus ? "hfsplus"
                                  : type.param == kVfat    ? "vfat"
                                                           : "exfat";
                         });

// Keeps its items' numbers, so that a change time is proof; an hour later, any change is old.
class AnOldVolumeAnHourLater : public AnOldVolume {
 protected:
  void SetUp() override {
    Mount(kHFSPlus);
    mLater.emplace(std::chrono::hours(1));  // for this process, not for the volume's server
  }

  // How often folders are read while an action lasts.
  static int ReadingsDuring(const std::function<void()>& action) {
    int readings = 0;
    const BeforeEntries counted([&](int) { ++readings; });
    action();
    return readings;
  }

  std::optional<OtherTime> mLater;
};

TEST_F(AnOldVolumeAnHourLater, ReadsAFolderOnceForAllNames) {
  const std::string folder = MakeFolder("Folder");
  std::vector<std::string> paths;
  for (const char* const name : {"Folder/one", "Folder/two", "Folder/three"}) {
    paths.push_back(MakeFile(name));
  }
  EXPECT_EQ(LookUp(folder, "ONE"), paths[0]);
  EXPECT_EQ(ReadingsDuring([&] {
              EXPECT_EQ(LookUp(folder, "one"), paths[0]);
              EXPECT_EQ(LookUp(folder, "two"), paths[1]);
              EXPECT_EQ(LookUp(folder, "THREE"), paths[2]);
            }),
            0);
}

TEST_F(AnOldVolumeAnHourLater, ReadsAFolderAgainWhenItHasChanged) {
  const std::string folder = MakeFolder("Folder");
  const std::string before = MakeFile("Folder/Read Me");
  EXPECT_EQ(LookUp(folder, "read me"), before);
  WaitForTheNextTick();
  const std::string after = folder + "/READ ME";
  std::filesystem::rename(before, folder + "/other");
  std::filesystem::rename(folder + "/other", after);
  EXPECT_EQ(LookUp(folder, "read me"), after);
  EXPECT_EQ(ReadingsDuring([&] { EXPECT_EQ(LookUp(folder, "Read Me"), after); }), 0);
}

TEST_F(AnOldVolumeAnHourLater, FindsNamesInAFolderTooLargeToBeKept) {
  const std::string folder = MakeFolder("Folder");
  const std::string filler(200, 'n');
  for (int i = 0; i < 6000; ++i) MakeFile("Folder/" + filler + std::to_string(i));
  const std::string path = MakeFile("Folder/Read Me");
  for (int i = 0; i < 2; ++i) EXPECT_EQ(LookUp(folder, "READ ME"), path);
}

TEST_F(AnOldVolume, OfRecentChangesReadsTheFolderEachTime) {
  ASSERT_NO_FATAL_FAILURE(Mount(kHFSPlus));
  if (IsSkipped()) return;
  // Some of the changes have the same time as the one before.
  for (int i = 0; i < 50; ++i) {
    const std::string number = std::to_string(i);
    const std::string lower = MakeFile("read me " + number);
    EXPECT_EQ(LookUp(Top(), "Read Me " + number), lower);
    const std::string upper = Top() + "/READ ME " + number;
    std::filesystem::rename(lower, Top() + "/other");
    std::filesystem::rename(Top() + "/other", upper);
    ASSERT_EQ(LookUp(Top(), "Read Me " + number), upper);
  }
}

TEST_F(AnOldVolume, NamesInBytesAreFoundByTheSameBytes) {
  ASSERT_NO_FATAL_FAILURE(Mount(kHFS));
  if (IsSkipped()) return;
  const std::string path = MakeFile("caf\x8E");
  EXPECT_EQ(LookUp(Top(), "caf\x8E"), path);
  EXPECT_EQ(LookUp(Top(), "caf\x8F"), "(-43)");
}

TEST_F(AnOldVolume, ANameInUtf8CountsBeforeTheOneInBytes) {
  ASSERT_NO_FATAL_FAILURE(Mount(kHFS));
  if (IsSkipped()) return;
  MakeFile("caf\x8E");
  const std::string text = MakeFile("caf\xC3\xA9");
  EXPECT_EQ(LookUp(Top(), "caf\x8E"), text);
}

// "√©" in Mac Roman has the bytes of "é" in UTF-8.
TEST_F(AnOldVolume, BytesThatAreUtf8AreNotANameInBytes) {
  ASSERT_NO_FATAL_FAILURE(Mount(kHFS));
  if (IsSkipped()) return;
  MakeFile("caf\xC3\xA9");
  EXPECT_EQ(LookUp(Top(), "caf\xC3\xA9"), "(-43)");
}

TEST_F(AnOldVolume, ColonsAndSlashesAreExchangedInNamesInBytes) {
  ASSERT_NO_FATAL_FAILURE(Mount(kHFS));
  if (IsSkipped()) return;
  const std::string path = MakeFile("a:\x8E");
  EXPECT_EQ(LookUp(Top(), "a/\x8E"), path);
  EXPECT_EQ(LookUp(Top(), "a:\x8E"), "(-43)");
}

TEST_F(AnOldVolume, NamesInBytesAreLookedForOnlyOnClassicVolumes) {
  ASSERT_NO_FATAL_FAILURE(Mount(kHFSPlus));
  if (IsSkipped()) return;
  MakeFile("caf\x8E");
  EXPECT_EQ(LookUp(Top(), "caf\x8E"), "(-43)");
}

const std::string kLongName = "A name of more than 31 characters.aif";

TEST_F(AnOldVolume, AShortFormOnRecordFindsTheItemWithItsNumber) {
  ASSERT_NO_FATAL_FAILURE(Mount(kHFSPlus));
  if (IsSkipped()) return;
  const std::string path = MakeFile(kLongName);
  EXPECT_EQ(NameOf(SpecOf(path)), kLongName);
  EXPECT_EQ(LookUp(Top(), names::ShortHFSName(kLongName, IDOf(path))), path);
}

TEST_F(AnOldVolume, AShortFormWithAnotherNumberFindsNothing) {
  ASSERT_NO_FATAL_FAILURE(Mount(kHFSPlus));
  if (IsSkipped()) return;
  const std::string path = MakeFile(kLongName);
  const std::string other = MakeFile("other");
  EXPECT_EQ(LookUp(Top(), names::ShortHFSName(kLongName, IDOf(other))), "(-43)");
  EXPECT_EQ(LookUp(Top(), names::ShortHFSName("B" + kLongName, IDOf(path))), "(-43)");
}

TEST_F(AnOldVolume, AnItemOfThatNameCountsBeforeTheShortForm) {
  ASSERT_NO_FATAL_FAILURE(Mount(kHFSPlus));
  if (IsSkipped()) return;
  const std::string path = MakeFile(kLongName);
  const std::string shortForm = names::ShortHFSName(kLongName, IDOf(path));
  const std::string literal = MakeFile(shortForm);
  EXPECT_EQ(LookUp(Top(), shortForm), literal);
}

TEST_F(AnOldVolume, ANameOf31CharactersHadNoShortForm) {
  ASSERT_NO_FATAL_FAILURE(Mount(kHFSPlus));
  if (IsSkipped()) return;
  const std::string name(31, 'n');
  const std::string path = MakeFile(name);
  EXPECT_EQ(LookUp(Top(), names::ShortHFSName(name, IDOf(path))), "(-43)");
}

TEST_F(AnOldVolume, OnOtherVolumesALongNameHasNoShortForm) {
  ASSERT_NO_FATAL_FAILURE(Mount(kExt));
  if (IsSkipped()) return;
  const std::string path = MakeFile(kLongName);
  EXPECT_EQ(LookUp(Top(), names::ShortHFSName(kLongName, IDOf(path))), "(-43)");
}

}  // namespace
}  // namespace tallowmere::test
