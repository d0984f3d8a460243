// Runs every operation of the bridge with the n-th allocation failing, for n = 0, 1, 2, … and last
// with none failing. It must give the right result or fail, keep the reference whole, leak nothing
// and free nothing twice.
#include <gtest/gtest.h>

#include <functional>

#include "HFSBridgeSupport.h"
#include "platform/foundation/FailingAllocator.h"

namespace tallowmere::test {
namespace {

using foundation::test::FailAllocationsAfter;
using foundation::test::FailNoAllocation;
using foundation::test::FailOneAllocationAfter;
using foundation::test::LiveAllocations;

// At least the number of allocations of each operation.
constexpr long kEnough = 400;

// Allocations that the platform below may cache meanwhile.
constexpr long kLearned = 20;

class BridgeWithoutMemory : public DataVolumeTest {
 protected:
  void SetUp() override {
    DataVolumeTest::SetUp();
    if (!mData) return;
    mData->MakeFolder("a folder with a long name/and another folder");
    mData->MakeFile(kExisting);
  }

  // Runs `operation` on a reference to an item of the volume as described at the top. `check` gets
  // the reference afterwards and whether there was enough memory.
  void FailEach(const std::string& item, const std::function<void(CFileRef&)>& operation,
                const std::function<void(const CFileRef&, bool)>& check) {
    const CFileRef source = mData->Ref(item);
    {
      CFileRef warm(source);
      operation(warm);
    }
    const long liveBefore = LiveAllocations();
    for (long n = 0; n <= kEnough; ++n) {
      CFileRef ref(source);
      if (n < kEnough) FailAllocationsAfter(n);
      operation(ref);
      FailNoAllocation();
      check(ref, n == kEnough);
      const bool shared = UrlOf(ref) == UrlOf(source);
      EXPECT_EQ(CFGetRetainCount(UrlOf(source)), shared ? 2 : 1) << n;
      if (!shared && ref.IsValid()) {
        EXPECT_EQ(CFGetRetainCount(UrlOf(ref)), 1) << n;
      }
    }
    EXPECT_LE(LiveAllocations(), liveBefore + kLearned);
  }

  static constexpr char kExisting[] = "a folder with a long name/and another folder/existing";
  static constexpr char kMissing[] = "a folder with a long name/and another folder/a:missing one";
  static constexpr char kFolder[] = "a folder with a long name/and another folder";
};

TEST_F(BridgeWithoutMemory, KnowsAnItemsIdentityOrNone) {
  for (const char* const item : {kExisting, kMissing, "missing/folders/file"}) {
    const short volume = mData->Ref(item).GetVolumeRefNumber();
    const long folder = mData->Ref(item).GetDirectoryID();
    short foundVolume = 0;
    long foundFolder = 0;
    FailEach(
        item,
        [&](CFileRef& ref) {
          foundVolume = ref.GetVolumeRefNumber();
          foundFolder = ref.GetDirectoryID();
        },
        [&](const CFileRef&, bool complete) {
          EXPECT_TRUE(foundVolume == volume || (foundVolume == kNoVolume && !complete));
          EXPECT_TRUE(foundFolder == folder || (foundFolder == kNoFolder && !complete));
        });
  }
}

TEST_F(BridgeWithoutMemory, MakesAnItemsRecordOrNone) {
  for (const char* const item : {kExisting, kMissing}) {
    FSSpec whole;
    ASSERT_TRUE(mData->Ref(item).GetFSSpec(&whole));
    FSSpec spec;
    bool made = false;
    FailEach(
        item, [&](CFileRef& ref) { made = CFileUtilGetDeprecatedFSSpecThroughIPC(ref, &spec); },
        [&](const CFileRef&, bool complete) {
          EXPECT_TRUE(made || !complete);
          if (made) {
            EXPECT_EQ(FieldsOf(spec), FieldsOf(whole));
          }
        });
  }
}

// The item's name is too long for a record, so a new item's record would have it cut.
TEST_F(BridgeWithoutMemory, MakesNoNewItemsRecordForAnExistingItem) {
  const std::string name(70, 'n');
  mData->MakeFile(name);
  const CFileRef item = mData->Ref(name);
  FSSpec whole;
  ASSERT_TRUE(item.GetFSSpec(&whole));
  for (long n = 0; n <= kEnough; ++n) {
    const CFileRef ref(item);
    FSSpec spec;
    FailOneAllocationAfter(n);
    const bool made = ref.GetFSSpec(&spec);
    FailNoAllocation();
    EXPECT_TRUE(made || n < kEnough);
    if (made) {
      EXPECT_EQ(FieldsOf(spec), FieldsOf(whole)) << n;
    }
  }
}

// Accepts a path on which no item exists, or the folder that the item would be in.
TEST_F(BridgeWithoutMemory, NamesTheItemOfARecordOrNoOther) {
  for (const char* const item : {kExisting, kMissing}) {
    FSSpec spec;
    ASSERT_TRUE(mData->Ref(item).GetFSSpec(&spec));
    FailEach(
        "", [&](CFileRef& ref) { ref.SetFromFSSpec(&spec, false, true); },
        [&](const CFileRef& ref, bool complete) {
          const char* const path = ref.GetPath();
          EXPECT_TRUE(path != nullptr || !complete);
          if (path == nullptr) return;
          EXPECT_TRUE(path == mData->Path(item) || (path == mData->Path(kFolder) && !complete))
              << path;
        });
  }
}

TEST_F(BridgeWithoutMemory, AddsANameOrNone) {
  FailEach(
      kFolder, [](CFileRef& ref) { CFileUtilAddHFSName(&ref, "a/missing one", false); },
      [&](const CFileRef& ref, bool complete) {
        const char* const path = ref.GetPath();
        EXPECT_TRUE(path != nullptr || !complete);
        if (path == nullptr) return;
        // The name is added unconverted when there was no memory to see that the folder exists.
        EXPECT_TRUE(path == mData->Path(kMissing) ||
                    (!complete && (path == mData->Path(kFolder) ||
                                   path == mData->Path(kFolder) + "/a/missing one")))
            << path;
      });
}

TEST_F(BridgeWithoutMemory, MakesAFullPathOrTheBeginningOfIt) {
  std::string text;
  FailEach(
      kExisting,
      [&](CFileRef& ref) {
        char buffer[1024];
        CFileUtilMakeFullPath(ref, buffer, sizeof buffer, 1);
        FailNoAllocation();
        text = buffer;
      },
      [&](const CFileRef&, bool complete) {
        const std::string whole = "Data:a folder with a long name:and another folder:";
        EXPECT_TRUE(!complete || text == whole) << text;
      });
}

TEST_F(BridgeWithoutMemory, ReadsANameWithoutSlashesOrNone) {
  const Pascal name("a/name/that/is/too/long/for/a/short/string");
  CFOwned warm(CreateCFStringFromPascalString(name.Get()));
  const long liveBefore = LiveAllocations();
  for (long n = 0; n < 10; ++n) {
    FailAllocationsAfter(n);
    const CFOwned read(CreateCFStringFromPascalString(name.Get()));
    FailNoAllocation();
    if (read) {
      EXPECT_TRUE(CFEqual(read.Get(), warm.Get())) << n;
    }
    EXPECT_TRUE(read || n < 9);
  }
  EXPECT_EQ(LiveAllocations(), liveBefore);
}

}  // namespace
}  // namespace tallowmere::test
