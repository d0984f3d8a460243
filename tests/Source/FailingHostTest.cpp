// The reference and the bridge when calls of the host fail. The linker wraps the calls that a test
// makes fail; all others are the platform's.
#include <gtest/gtest.h>

#include <limits>

#include "HFSBridgeSupport.h"

namespace {

// How many more calls of each kind succeed.
constexpr int kAll = std::numeric_limits<int>::max();
int gCatalogCalls = kAll;
int gFolderCalls = kAll;
int gCallsForURLs = kAll;

bool Succeeds(int& calls) {
  return calls == kAll || calls-- > 0;
}

}  // namespace

extern "C" {
OSErr __real_FSGetCatalogInfo(const FSRef* item, FSCatalogInfoBitmap wanted, FSCatalogInfo* about,
                              HFSUniStr255* name, FSSpec* spec, FSRef* parent);
OSErr __wrap_FSGetCatalogInfo(const FSRef* item, FSCatalogInfoBitmap wanted, FSCatalogInfo* about,
                              HFSUniStr255* name, FSSpec* spec, FSRef* parent) {
  if (!Succeeds(gCatalogCalls)) return ioErr;
  return __real_FSGetCatalogInfo(item, wanted, about, name, spec, parent);
}

OSErr __real_PBGetCatInfoSync(CInfoPBRec* block);
OSErr __wrap_PBGetCatInfoSync(CInfoPBRec* block) {
  if (!Succeeds(gFolderCalls)) return ioErr;
  return __real_PBGetCatInfoSync(block);
}

CFURLRef __real_CFURLCreateFromFSRef(CFAllocatorRef allocator, const FSRef* item);
CFURLRef __wrap_CFURLCreateFromFSRef(CFAllocatorRef allocator, const FSRef* item) {
  return Succeeds(gCallsForURLs) ? __real_CFURLCreateFromFSRef(allocator, item) : nullptr;
}
}

namespace tallowmere::test {
namespace {

class AFailingHost : public DataVolumeTest {
 protected:
  ~AFailingHost() override { gCatalogCalls = gFolderCalls = gCallsForURLs = kAll; }

  CFileRef ExistingFile() const {
    mData->MakeFile("file");
    return mData->Ref("file");
  }
};

TEST_F(AFailingHost, ThatRefusesAnItemHasNoUnicodeNameOfIt) {
  const CFileRef file = ExistingFile();
  gCatalogCalls = 0;
  HFSUniStr255 name{};
  EXPECT_FALSE(file.UnicodeFileName(&name));
}

TEST_F(AFailingHost, ThatRefusesAnItemHasNoRecordOfIt) {
  const CFileRef file = ExistingFile();
  gCatalogCalls = 0;
  FSSpec spec = Untouched();
  EXPECT_FALSE(file.GetFSSpec(&spec));
  EXPECT_EQ(FieldsOf(spec), kEmptyFields);
}

TEST_F(AFailingHost, ThatRefusesAFolderLeavesOnlyTheNameInANewItemsRecord) {
  const CFileRef missing = mData->Ref("missing");
  gCatalogCalls = 0;
  FSSpec spec = Untouched();
  EXPECT_TRUE(missing.GetFSSpec(&spec));
  EXPECT_EQ(FieldsOf(spec), (Fields{kNoVolume, kNoFolder, "missing"}));
}

TEST_F(AFailingHost, ThatRefusesAnItemHasNoVolumeForIt) {
  const CFileRef file = ExistingFile();
  const CFileRef missing = mData->Ref("missing");
  gCatalogCalls = 0;
  EXPECT_EQ(file.GetVolumeRefNumber(), kNoVolume);
  EXPECT_EQ(missing.GetVolumeRefNumber(), kNoVolume);
}

TEST_F(AFailingHost, ThatEndsAClimbLosesNoFolderFoundSoFar) {
  const CFileRef folder(mData->MakeFolder("a/b/c").c_str(), true);
  for (const auto& [calls, expected] : std::vector<std::pair<int, std::string>>{
           {0, "Data:"}, {1, "Data:c:"}, {2, "Data:b:c:"}, {3, "Data:a:b:c:"}}) {
    gFolderCalls = calls;
    char path[100];
    EXPECT_EQ(CFileUtilMakeFullPath(folder, path, sizeof path, 1), expected.size());
    EXPECT_EQ(path, expected);
  }
}

TEST_F(AFailingHost, ThatHasNoURLForAnItemEmptiesTheReferenceItIsAddedTo) {
  ExistingFile();
  CFileRef ref = mData->Ref();
  gCallsForURLs = 0;
  EXPECT_FALSE(CFileUtilAddHFSName(&ref, "file", false));
  EXPECT_TRUE(IsEmpty(ref));
}

}  // namespace
}  // namespace tallowmere::test
