// FSGetCatalogInfo, FSResolveNodeID, FSMakeFSRefUnicode, FSpMakeFSRef and PBGetCatInfoSync.
#include <gmock/gmock.h>
#include <sys/mount.h>
#include <sys/syscall.h>

#include <algorithm>
#include <cstring>
#include <optional>
#include <vector>

#include "platform/HostCalls.h"
#include "support/CountedCalls.h"
#include "support/OwnMountNamespace.h"
#include "support/Privileges.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

constexpr SInt16 kNoVolume = 32767;

// Fills a record, padding included. A call that fails must leave these bytes as they are.
constexpr unsigned char kFilling = 0xA5;
template <class Record>
void Fill(Record& record) {
  std::memset(&record, kFilling, sizeof record);
}
template <class Record>
bool IsUntouched(const Record& record) {
  const auto* const bytes = reinterpret_cast<const unsigned char*>(&record);
  return std::all_of(bytes, bytes + sizeof record, [](auto byte) { return byte == kFilling; });
}

std::u16string TextOf(const HFSUniStr255& name) {
  return std::u16string(name.unicode, name.unicode + name.length);
}

class ItemCalls : public testing::Test {
 protected:
  void SetUp() override {
    // Where permitted, uses a volume of its own, on which a search for a deleted item ends soon.
    if (EnterOwnMountNamespace()) mVolume.emplace("tmpfs", mFolder.Path(), "tmpfs");
    for (int i = 0; i < 20; ++i) std::filesystem::remove(mFolder.MakeFile("first"));
    mPath = mFolder.MakeFolder("folder");
    mFile = mFolder.MakeFile("folder/file");
    mInfo = InfoOf(mPath);
  }
  OSErr MakeReference(const FSRef& parent, std::u16string_view name, FSRef& reference) const {
    const std::vector<UniChar> units(name.begin(), name.end());
    return FSMakeFSRefUnicode(&parent, units.size(), units.data(), 0, &reference);
  }
  OSErr CatalogInfo(CInfoPBRec& block) const { return PBGetCatInfoSync(&block); }
  CInfoPBRec Block(std::uint32_t id, StringPtr name = nullptr) const {
    CInfoPBRec block{};
    block.dirInfo = {name, mInfo.volume, -1, static_cast<SInt32>(id), 0x5A5A5A5A};
    return block;
  }

  TemporaryFolder mFolder;
  std::optional<ScopedMount> mVolume;
  std::string mPath;
  std::string mFile;
  FSCatalogInfo mInfo{};
};

TEST_F(ItemCalls, CatalogInfoFillsOnlyRequestedFields) {
  const FSRef reference = ReferenceTo(mFile);
  FSCatalogInfo info;
  Fill(info);
  EXPECT_EQ(FSGetCatalogInfo(&reference, kFSCatInfoNone, &info, nullptr, nullptr, nullptr), noErr);
  EXPECT_TRUE(IsUntouched(info));
  FSCatalogInfo volumeAlone{};
  EXPECT_EQ(FSGetCatalogInfo(&reference, kFSCatInfoVolume, &volumeAlone, nullptr, nullptr, nullptr),
            noErr);
  EXPECT_EQ(volumeAlone.volume, mInfo.volume);
  EXPECT_EQ(volumeAlone.nodeID, 0u);
}

TEST_F(ItemCalls, CatalogInfoGivesNameRecordAndParentTogether) {
  const FSRef reference = ReferenceTo(mFile);
  HFSUniStr255 name{};
  FSSpec spec{};
  FSRef parent{};
  ASSERT_EQ(FSGetCatalogInfo(&reference, kFSCatInfoNone, nullptr, &name, &spec, &parent), noErr);
  EXPECT_EQ(TextOf(name), u"file");
  EXPECT_EQ(spec.vRefNum, mInfo.volume);
  EXPECT_EQ(ParentOf(spec), mInfo.nodeID);
  EXPECT_EQ(NameOf(spec), "file");
  EXPECT_EQ(PathOf(parent), mPath);
}

TEST_F(ItemCalls, CatalogInfoExchangesColonsAndSlashesInTheName) {
  const FSRef reference = ReferenceTo(mFolder.MakeFile("a:b"));
  HFSUniStr255 name{};
  ASSERT_EQ(FSGetCatalogInfo(&reference, 0, nullptr, &name, nullptr, nullptr), noErr);
  EXPECT_EQ(TextOf(name), u"a/b");
}

TEST_F(ItemCalls, CatalogInfoOfARootIsThatOfTheVolume) {
  const FSRef root = ReferenceTo("/");
  FSCatalogInfo info{};
  HFSUniStr255 name{};
  FSSpec spec{};
  FSRef parent;
  Fill(parent);
  ASSERT_EQ(FSGetCatalogInfo(&root, kFSCatInfoNodeID, &info, &name, &spec, &parent), noErr);
  EXPECT_EQ(info.nodeID, 2u);
  EXPECT_EQ(ParentOf(spec), 1U);
  EXPECT_EQ(TextOf(name).size(), spec.name[0]);
  EXPECT_EQ(0, std::memcmp(&parent, std::string(sizeof parent, '\0').data(), sizeof parent));
  EXPECT_EQ(ItemOf(spec), "/");
}

TEST_F(ItemCalls, CatalogInfoOfADeletedItemWritesNothing) {
  const FSRef reference = ReferenceTo(mFile);
  std::filesystem::remove(mFile);
  FSCatalogInfo info;
  Fill(info);
  HFSUniStr255 name;
  Fill(name);
  FSSpec spec;
  Fill(spec);
  FSRef parent;
  Fill(parent);
  EXPECT_EQ(FSGetCatalogInfo(&reference, kFSCatInfoNodeID, &info, &name, &spec, &parent), fnfErr);
  EXPECT_TRUE(IsUntouched(info) && IsUntouched(name) && IsUntouched(spec) && IsUntouched(parent));
}

TEST_F(ItemCalls, AnEmptyReferenceIsNoItem) {
  const FSRef none{};
  FSRef reference{};
  EXPECT_EQ(FSGetCatalogInfo(&none, 0, nullptr, nullptr, nullptr, nullptr), fnfErr);
  EXPECT_EQ(FSGetCatalogInfo(nullptr, 0, nullptr, nullptr, nullptr, nullptr), fnfErr);
  EXPECT_EQ(MakeReference(none, u"x", reference), fnfErr);
}

TEST_F(ItemCalls, AnItemFollowsItsRename) {
  const FSRef reference = ReferenceTo(mFile);
  const std::string moved = mFolder.Path() / "folder/moved";
  std::filesystem::rename(mFile, moved);
  FSSpec spec{};
  ASSERT_EQ(FSGetCatalogInfo(&reference, 0, nullptr, nullptr, &spec, nullptr), noErr);
  EXPECT_EQ(NameOf(spec), "moved");
  EXPECT_EQ(ItemOf(spec), moved);
}

TEST_F(ItemCalls, ANodeIDFindsFilesFoldersAndTheRoot) {
  FSRef found{};
  ASSERT_EQ(FSResolveNodeID(mInfo.volume, mInfo.nodeID, &found), noErr);
  EXPECT_EQ(PathOf(found), mPath);
  ASSERT_EQ(FSResolveNodeID(mInfo.volume, IDOf(mFile), &found), noErr);
  EXPECT_EQ(PathOf(found), mFile);
  ASSERT_EQ(FSResolveNodeID(0, 2, &found), noErr);
  EXPECT_EQ(PathOf(found), "/");
}

TEST_F(ItemCalls, UnknownIDsAreNotFound) {
  for (const std::uint32_t id : {0u, 1u, 3u, 15u, 0xFFFFFFFFu}) {
    FSRef reference;
    Fill(reference);
    EXPECT_EQ(FSResolveNodeID(mInfo.volume, id, &reference), fnfErr) << id;
    EXPECT_TRUE(IsUntouched(reference));
    auto block = Block(id);
    EXPECT_EQ(CatalogInfo(block), dirNFErr) << id;
    EXPECT_EQ(block.dirInfo.ioDrParID, 0x5A5A5A5A);
    const std::string result = id == 1 ? "(-43)" : "(-120)";
    EXPECT_EQ(ItemOf(MakeRecord(mInfo.volume, id, "x")), result) << id;
  }
}

TEST_F(ItemCalls, AnUnknownVolumeIsReportedFirst) {
  FSRef reference{};
  EXPECT_EQ(FSResolveNodeID(kNoVolume, 2, &reference), nsvErr);
  EXPECT_EQ(ItemOf(MakeRecord(kNoVolume, 2, "x")), "(-35)");
  EXPECT_EQ(ItemOf(MakeRecord(kNoVolume, 1, "x")), "(-35)");
  auto block = Block(2);
  block.dirInfo.ioVRefNum = kNoVolume;
  EXPECT_EQ(CatalogInfo(block), nsvErr);
}

TEST_F(ItemCalls, ARecordOfARootNeedsTheVolumesName) {
  FSSpec root = SpecOf("/");
  EXPECT_EQ(ItemOf(root), "/");
  root.name[1] ^= 0x20;
  EXPECT_EQ(ItemOf(root), "(-43)");
  EXPECT_EQ(ItemOf(FSSpec{}), "(-120)");
}

TEST_F(ItemCalls, ARecordWithANameLongerThanItsFieldIsNoItem) {
  FSSpec spec = SpecOf(mFile);
  spec.name[0] = 64;
  EXPECT_EQ(ItemOf(spec), "(-43)");
  spec.name[0] = 255;
  EXPECT_EQ(ItemOf(spec), "(-43)");
}

TEST_F(ItemCalls, ARecordInAFileIsInNoFolder) {
  EXPECT_EQ(ItemOf(MakeRecord(mInfo.volume, IDOf(mFile), "x")), "(-120)");
}

TEST_F(ItemCalls, AUnicodeNameFindsItsItem) {
  const FSRef parent = ReferenceTo(mPath);
  FSRef found{};
  ASSERT_EQ(MakeReference(parent, u"file", found), noErr);
  EXPECT_EQ(PathOf(found), mFile);
  const std::string accented = mFolder.MakeFile("folder/a:\xC3\xA9\xFF");
  ASSERT_EQ(MakeReference(parent, u"a/\u00E9\xDCFF", found), noErr);
  EXPECT_EQ(PathOf(found), accented);
}

TEST_F(ItemCalls, AnUnknownUnicodeNameIsNotFound) {
  const FSRef parent = ReferenceTo(mPath);
  const std::vector<std::u16string> names{u"",
                                          u".",
                                          u"..",
                                          u"missing",
                                          u"a:b",
                                          u"FILE",
                                          std::u16string(u"fi\0le", 5),
                                          u"\xD800",
                                          u"\xDC00",
                                          std::u16string(256, u'x'),
                                          std::u16string(255, u'\u00E9')};
  for (const auto& name : names) {
    FSRef found;
    Fill(found);
    EXPECT_EQ(MakeReference(parent, name, found), fnfErr);
    EXPECT_TRUE(IsUntouched(found));
  }
}

TEST_F(ItemCalls, AUnicodeNameInAFileOrLinkIsAnError) {
  FSRef found{};
  EXPECT_EQ(MakeReference(ReferenceTo(mFile), u"x", found), errFSNotAFolder);
  const std::string link = mFolder.Path() / "link";
  ASSERT_EQ(symlink(mPath.c_str(), link.c_str()), 0);
  EXPECT_EQ(MakeReference(ReferenceTo(link), u"file", found), errFSNotAFolder);
}

TEST_F(ItemCalls, AUnicodeNameInADeletedFolderIsNotFound) {
  const FSRef parent = ReferenceTo(mPath);
  std::filesystem::remove_all(mPath);
  FSRef found{};
  EXPECT_EQ(MakeReference(parent, u"file", found), fnfErr);
}

TEST_F(ItemCalls, AFoldersNameAndParentAreThoseOfTheCatalog) {
  Str255 name;
  auto block = Block(mInfo.nodeID, name);
  ASSERT_EQ(CatalogInfo(block), noErr);
  EXPECT_EQ(names::TextOfPascal(name), "folder");
  EXPECT_EQ(static_cast<std::uint32_t>(block.dirInfo.ioDrParID), IDOf(mFolder.Path()));
}

TEST_F(ItemCalls, AFoldersNameIsNotWrittenUnlessRequested) {
  auto block = Block(mInfo.nodeID);
  EXPECT_EQ(CatalogInfo(block), noErr);
}

TEST_F(ItemCalls, AFoldersNameCanHave255Bytes) {
  const std::string longName(255, 'n');
  const std::string path = mFolder.MakeFolder(longName);
  Str255 name;
  auto block = Block(IDOf(path), name);
  ASSERT_EQ(CatalogInfo(block), noErr);
  EXPECT_EQ(names::TextOfPascal(name), longName);
}

TEST_F(ItemCalls, ClimbingEndsAtTheRootWithParent1) {
  std::uint32_t id = mInfo.nodeID;
  std::string path;
  for (int steps = 0; id != 2 && steps < 100; ++steps) {
    Str255 name;
    auto block = Block(id, name);
    ASSERT_EQ(CatalogInfo(block), noErr);
    path = "/" + std::string(names::TextOfPascal(name)) + path;
    id = static_cast<std::uint32_t>(block.dirInfo.ioDrParID);
  }
  FSRef root{};
  ASSERT_EQ(FSResolveNodeID(mInfo.volume, 2, &root), noErr);
  EXPECT_EQ(PathOf(root) == "/" ? path : PathOf(root) + path, mPath);
  auto block = Block(2);
  ASSERT_EQ(CatalogInfo(block), noErr);
  EXPECT_EQ(block.dirInfo.ioDrParID, 1);
}

TEST_F(ItemCalls, AFileHasNoFolderInfo) {
  auto block = Block(IDOf(mFile));
  EXPECT_EQ(CatalogInfo(block), dirNFErr);
}

TEST_F(ItemCalls, OnlyIndexMinus1IsAccepted) {
  for (const SInt16 index : std::vector<SInt16>{0, 1, -2, 32767, -32768}) {
    auto block = Block(mInfo.nodeID);
    block.dirInfo.ioFDirIndex = index;
    EXPECT_EQ(CatalogInfo(block), paramErr) << index;
  }
}

// On a shared volume, another process can reuse the inode number of a deleted item.
class ItemCallsOnAVolumeOfTheirOwn : public ItemCalls {
 protected:
  void SetUp() override {
    ItemCalls::SetUp();
    if (!mVolume || !mVolume->IsMounted()) GTEST_SKIP() << "mounting is not permitted here";
  }
};

TEST_F(ItemCallsOnAVolumeOfTheirOwn, ADeletedItemHasNoFolderInfoAndNoItems) {
  const std::string path = mFolder.MakeFolder("x");
  const FSCatalogInfo info = InfoOf(path);
  std::filesystem::remove(path);
  auto block = Block(info.nodeID);
  EXPECT_EQ(CatalogInfo(block), dirNFErr);
  EXPECT_EQ(ItemOf(MakeRecord(info.volume, info.nodeID, "y")), "(-120)");
  FSRef found{};
  EXPECT_EQ(FSResolveNodeID(info.volume, info.nodeID, &found), fnfErr);
}

TEST_F(ItemCalls, TheRootOfAnotherVolumeHasParent1AndItsOwnName) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const ScopedMount volume("tmpfs", mFolder.MakeFolder("My Disk"), "tmpfs");
  const std::string path = mFolder.Path() / "My Disk";
  const FSSpec spec = SpecOf(path);
  EXPECT_EQ(ParentOf(spec), 1U);
  EXPECT_NE(spec.vRefNum, mInfo.volume);
  EXPECT_EQ(NameOf(spec), "My Disk");
  EXPECT_EQ(ItemOf(spec), path);
  EXPECT_EQ(IDOf(path), 2u);
}

// --- Items on no volume -------------------------------------------------------------------------

TEST_F(ItemCalls, TheFolderOfAKernelInterfaceHasAnIDThatLeadsNowhere) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const ScopedMount interface("none", mFolder.MakeFolder("interface"), "proc");
  if (!interface.IsMounted()) GTEST_SKIP() << "proc cannot be mounted here";
  const FSCatalogInfo info = InfoOf(mFolder.Path() / "interface");
  EXPECT_EQ(info.volume, mInfo.volume);
  EXPECT_EQ(info.nodeID, 3u);
  EXPECT_EQ(ItemOf(MakeRecord(info.volume, info.nodeID, "version")), "(-120)");
  EXPECT_EQ(ItemWithID(info.volume, info.nodeID), "(-43)");
}

TEST_F(ItemCalls, ItemsOfAKernelInterfaceAreOnNoVolume) {
  const FSRef reference = ReferenceTo("/proc/version");
  FSCatalogInfo info{};
  EXPECT_EQ(FSGetCatalogInfo(&reference, kFSCatInfoVolume, &info, nullptr, nullptr, nullptr),
            nsvErr);
  EXPECT_EQ(PathOf(reference), "/proc/version");
}

TEST_F(ItemCalls, AnIDOnNoVolumeIsNotSearchedFor) {
  const auto calls = CallsOf([] {},
                             [&] {
                               ItemOf(MakeRecord(mInfo.volume, 3, "x"));
                               ItemWithID(mInfo.volume, 3);
                             });
  if (!calls) GTEST_SKIP() << "nothing can be traced here";
  EXPECT_THAT(*calls, testing::Not(testing::Contains(SYS_getdents64)));
}

TEST_F(ItemCalls, AFileMountedAloneSurvivesARoundTrip) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const ScopedMount tmpfs("tmpfs", mFolder.MakeFolder("volume"), "tmpfs");
  const std::string source = mFolder.MakeFile("volume/source");
  const ScopedMount alone(source, mFile, "", MS_BIND);
  ASSERT_TRUE(alone.IsMounted());
  EXPECT_EQ(ItemOf(SpecOf(mFile)), mFile);
}

TEST_F(ItemCalls, RefusedPermissionIsReported) {
  std::filesystem::permissions(mFolder.Path(), std::filesystem::perms(0755));
  const FSRef closed = ReferenceTo(mPath);
  chmod(mPath.c_str(), 0600);
  EXPECT_TRUE(HoldsForNobody([&] {
    FSRef found{};
    return MakeReference(closed, u"file", found) == afpAccessDenied;
  }));
  EXPECT_TRUE(HoldsForNobody([&] {
    FSRef found{};
    const FSSpec spec = MakeRecord(mInfo.volume, mInfo.nodeID, "file");
    return FSpMakeFSRef(&spec, &found) == afpAccessDenied;
  }));
}

}  // namespace
}  // namespace tallowmere::test
