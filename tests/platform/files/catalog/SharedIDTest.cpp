// Items whose numbers mix to one id.
#include <chrono>
#include <thread>
#include <unordered_map>

#include "CatalogFixture.h"
#include "platform/catalog/NumberedFileSystem.h"

namespace tallowmere::files {
namespace {

using test::EnterOwnMountNamespace;
using test::NumberedFileSystem;

class ASharedID : public testing::Test {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    mNumbered.emplace();
    if (!mNumbered->IsMounted()) GTEST_SKIP() << "no FUSE here";
    const std::string top = mNumbered->Path();
    mRoot = *ReadItem(AT_FDCWD, top.c_str());
    mVolume = MountTable::OfThisProcess().OfItem(mRoot, top);
    FindTwoNumbers();
  }

  // Among so many numbers two surely meet.
  void FindTwoNumbers() {
    std::unordered_map<std::uint32_t, std::uint64_t> seen;
    for (std::uint64_t number = 0x80000000; seen.size() < 1000000; ++number) {
      mID = NodeIDOf(number, mRoot.device, mRoot);
      const auto [other, isNew] = seen.emplace(mID, number);
      mFirst = other->second;
      mSecond = number;
      if (!isNew) return;
    }
    FAIL() << "no two numbers share an id";
  }
  std::string Find(bool folder = true) const {
    const auto place = FindItem(mVolume, mID, folder);
    return place ? place->path : "(none)";
  }

  std::optional<NumberedFileSystem> mNumbered;
  ItemReference mRoot{};
  VolumePointer mVolume;
  std::uint32_t mID = 0;
  std::uint64_t mFirst = 0;
  std::uint64_t mSecond = 0;
};

TEST_F(ASharedID, FindsTheOnlyItemThatHasIt) {
  const std::string path = mNumbered->MakeFolder("only", mFirst);
  ASSERT_EQ(IDOf(path), mID);
  EXPECT_EQ(Find(), path);
  EXPECT_EQ(Find(false), path);
}

TEST_F(ASharedID, OfTwoFoldersFindsNeither) {
  const std::string first = mNumbered->MakeFolder("first", mFirst);
  const std::string second = mNumbered->MakeFolder("second", mSecond);
  ASSERT_EQ(IDOf(first), IDOf(second));
  EXPECT_EQ(Find(), "(none)");
  EXPECT_EQ(Find(false), "(none)");
  EXPECT_EQ(ItemOf(MakeRecord(mVolume->Number(), mID, "x")), "(-120)");
}

TEST_F(ASharedID, OfAFolderAndAFileFindsTheFolderWhenOneIsWanted) {
  const std::string folder = mNumbered->MakeFolder("folder", mFirst);
  ASSERT_EQ(IDOf(mNumbered->MakeFile("file", mSecond)), mID);
  EXPECT_EQ(Find(), folder);
  EXPECT_EQ(Find(false), "(none)");
}

TEST_F(ASharedID, IsNotedWhenTheSecondItemComesLater) {
  const std::string holder = mNumbered->MakeFolder("holder", 100);
  const std::string first = mNumbered->MakeFolder("first", mFirst);
  std::this_thread::sleep_for(std::chrono::milliseconds(2100));
  EXPECT_EQ(Find(), first);
  EXPECT_EQ(Find(), first);
  const std::string second = mNumbered->MakeFolder("holder@100/second", mSecond);
  EXPECT_EQ(Find(), "(none)");
  std::filesystem::remove(first);
  EXPECT_EQ(Find(), second);
}

TEST_F(ASharedID, OfTwoItemsWithOneShortFormGivesNeitherARecord) {
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

TEST_F(ASharedID, DoesNotMakeAnItemOfAnotherNumberTheOneOfAReference) {
  const std::string first = mNumbered->MakeFolder("first", mFirst);
  mNumbered->MakeFolder("second", mSecond);
  const FSRef reference = ReferenceTo(first);
  EXPECT_EQ(PathOf(reference), first);
  std::filesystem::remove(first);
  EXPECT_EQ(PathOf(reference), "(none)");
}

}  // namespace
}  // namespace tallowmere::files
