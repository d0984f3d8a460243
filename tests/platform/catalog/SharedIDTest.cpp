// Items whose inode numbers are mixed to the same id, on a file system whose numbers identify items
// and on one whose numbers are not trusted.
#include <Tallowmere/Process.h>

#include <chrono>
#include <filesystem>
#include <optional>
#include <unordered_map>

#include "NumberedFileSystem.h"
#include "names/NodeIDs.h"
#include "platform/HostCalls.h"
#include "support/MountNamespace.h"
#include "support/OtherKernel.h"
#include "support/OwnMountNamespace.h"

namespace tallowmere::test {
namespace {

class ASharedID : public testing::TestWithParam<NumberedFileSystem::On> {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    mNumbered.emplace(GetParam());
    if (!mNumbered->IsMounted()) GTEST_SKIP() << "no FUSE here, or no block device for it";
    struct stat root {};
    ASSERT_EQ(stat(mNumbered->Path().c_str(), &root), 0);
    mRule = {{root.st_ino, root.st_dev, 0}, names::UpperIDs::kMixed};
    mVolume = InfoOf(mNumbered->Path()).volume;
    FindTwoNumbers();
  }

  // Among a million numbers, two certainly share an id.
  void FindTwoNumbers() {
    std::unordered_map<std::uint32_t, std::uint64_t> seen;
    for (std::uint64_t number = 0x80000000; seen.size() < 1000000; ++number) {
      mID = names::NodeIDOf({number, mRule.root.device, 0}, mRule);
      const auto [other, isNew] = seen.emplace(mID, number);
      mFirst = other->second;
      mSecond = number;
      if (!isNew) return;
    }
    FAIL() << "no two numbers share an id";
  }
  std::string FindFolder() const { return FolderWithID(mVolume, mID); }
  std::string FindItem() const { return ItemWithID(mVolume, mID); }

  std::optional<NumberedFileSystem> mNumbered;
  names::NodeIDRule mRule{};
  SInt16 mVolume = 0;
  std::uint32_t mID = 0;
  std::uint64_t mFirst = 0;
  std::uint64_t mSecond = 0;
};

TEST_P(ASharedID, FindsTheOnlyItemThatHasIt) {
  const std::string path = mNumbered->MakeFolder("only", mFirst);
  ASSERT_EQ(IDOf(path), mID);
  EXPECT_EQ(FindFolder(), path);
  EXPECT_EQ(FindItem(), path);
}

TEST_P(ASharedID, SharedByTwoFoldersFindsNeither) {
  const std::string first = mNumbered->MakeFolder("first", mFirst);
  const std::string second = mNumbered->MakeFolder("second", mSecond);
  ASSERT_EQ(IDOf(first), IDOf(second));
  EXPECT_EQ(FindFolder(), "(-120)");
  EXPECT_EQ(FindItem(), "(-43)");
  EXPECT_EQ(ItemOf(MakeRecord(mVolume, mID, "x")), "(-120)");
}

TEST_P(ASharedID, SharedWithAFileFindsTheFolderWhenOneIsWanted) {
  const std::string folder = mNumbered->MakeFolder("folder", mFirst);
  ASSERT_EQ(IDOf(mNumbered->MakeFile("file", mSecond)), mID);
  EXPECT_EQ(FindFolder(), folder);
  EXPECT_EQ(FindItem(), "(-43)");
}

TEST_P(ASharedID, IsNotedWhenTheSecondItemComesLater) {
  const std::string holder = mNumbered->MakeFolder("holder", 100);
  const std::string first = mNumbered->MakeFolder("first", mFirst);
  const OtherTime later(std::chrono::seconds(3));
  EXPECT_EQ(FindFolder(), first);
  EXPECT_EQ(FindFolder(), first);
  const std::string second = mNumbered->MakeFolder("holder@100/second", mSecond);
  EXPECT_EQ(FindFolder(), "(-120)");
  std::filesystem::remove(first);
  EXPECT_EQ(FindFolder(), second);
}

TEST_P(ASharedID, SharedByTwoItemsWithOneShortFormGivesNeitherARecord) {
  const std::string name(70, 'n');
  const std::string first = mNumbered->MakeFolder(name + "1", mFirst);
  const std::string second = mNumbered->MakeFolder(name + "2", mSecond);
  for (const std::string& path : {first, second}) {
    const FSRef reference = ReferenceTo(path);
    FSSpec spec{};
    EXPECT_EQ(FSGetCatalogInfo(&reference, kFSCatInfoNone, nullptr, nullptr, &spec, nullptr),
              fnfErr);
  }
}

TEST_P(ASharedID, DoesNotLeadAReferenceToAnItemOfAnotherNumber) {
  const std::string first = mNumbered->MakeFolder("first", mFirst);
  mNumbered->MakeFolder("second", mSecond);
  const FSRef reference = ReferenceTo(first);
  EXPECT_EQ(PathOf(reference), first);
  std::filesystem::remove(first);
  EXPECT_EQ(PathOf(reference), "(none)");
}

INSTANTIATE_TEST_SUITE_P(OnEachKind, ASharedID,
                         testing::Values(NumberedFileSystem::On::kBlockDevice,
                                         NumberedFileSystem::On::kNothing),
                         [](const auto& on) {
                           const bool isOnDisk = on.param == NumberedFileSystem::On::kBlockDevice;
                           return isOnDisk ? "WithTrustedNumbers" : "WithOthers";
                         });

// The platform looks up each requested folder instead of taking a known item with its number.
TEST(FoldersWithTheSameNumbers, EachHaveARecord) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const NumberedFileSystem numbered;
  if (!numbered.IsMounted()) GTEST_SKIP() << "no FUSE here";
  constexpr std::uint64_t kNumber = 500;
  const std::string first = numbered.MakeFolder("first", kNumber);
  const std::string second = numbered.MakeFolder("second", kNumber);
  for (const auto& [path, name] :
       {std::pair(first, "first@500"), std::pair(second, "second@500")}) {
    const process::MomentScope moment;
    FSRef item{};
    ASSERT_TRUE(CFURLGetFSRef(foundation::test::MakeUrl(path, true).Get(), &item));
    FSSpec spec{};
    EXPECT_EQ(FSGetCatalogInfo(&item, kFSCatInfoNone, nullptr, nullptr, &spec, nullptr), noErr);
    EXPECT_EQ(NameOf(spec), name);
  }
}

}  // namespace
}  // namespace tallowmere::test
