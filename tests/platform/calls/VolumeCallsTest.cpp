// The calls that list volumes.
#include <CoreServices/CoreServices.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <optional>
#include <string>
#include <vector>

#include "platform/HostCalls.h"
#include "support/OwnMountNamespace.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

TEST(VolumeCalls, EveryIndexedVolumeIsFoundByItsNumberUnderTheSameName) {
  SInt16 index = 1;
  for (;; ++index) {
    Str255 name = {};
    HParamBlockRec block{};
    block.volumeParam.ioNamePtr = name;
    block.volumeParam.ioVolIndex = index;
    const OSErr result = PBHGetVInfoSync(&block);
    if (result != noErr) {
      EXPECT_EQ(result, nsvErr);
      break;
    }
    EXPECT_LT(block.volumeParam.ioVRefNum, 0);
    Str255 again = {};
    HParamBlockRec byNumber{};
    byNumber.volumeParam.ioNamePtr = again;
    byNumber.volumeParam.ioVRefNum = block.volumeParam.ioVRefNum;
    ASSERT_EQ(PBHGetVInfoSync(&byNumber), noErr);
    EXPECT_EQ(0, std::memcmp(name, again, sizeof name));

    FSVolumeInfoParam info{};
    info.volumeIndex = static_cast<UInt32>(index);
    ASSERT_EQ(PBGetVolumeInfoSync(&info), noErr);
    EXPECT_EQ(info.ioVRefNum, block.volumeParam.ioVRefNum);
  }
  EXPECT_GT(index, 1);
}

TEST(VolumeCalls, PastTheLastIndexThereIsNoSuchVolume) {
  HParamBlockRec block{};
  block.volumeParam.ioVolIndex = 32767;
  EXPECT_EQ(PBHGetVInfoSync(&block), nsvErr);
  FSVolumeInfoParam info{};
  info.volumeIndex = 0xFFFFFFFF;
  EXPECT_EQ(PBGetVolumeInfoSync(&info), nsvErr);
}

TEST(VolumeCalls, AnIndexBelow0IsNoVolume) {
  HParamBlockRec block{};
  block.volumeParam.ioVolIndex = -1;
  EXPECT_EQ(PBHGetVInfoSync(&block), nsvErr);
}

TEST(VolumeCalls, AnUnknownNumberLeavesTheBlockAndTheNameUnchanged) {
  Str255 name = "\3old";
  HParamBlockRec block{};
  block.volumeParam.ioNamePtr = name;
  block.volumeParam.ioVRefNum = 32767;
  EXPECT_EQ(PBHGetVInfoSync(&block), nsvErr);
  EXPECT_EQ(block.volumeParam.ioVRefNum, 32767);
  EXPECT_EQ(0, std::memcmp(name, "\3old", 4));
}

TEST(VolumeCalls, ANameThatIsNotRequestedIsNotWritten) {
  HParamBlockRec block{};
  EXPECT_EQ(PBHGetVInfoSync(&block), noErr);
  EXPECT_LT(block.volumeParam.ioVRefNum, 0);
}

TEST(VolumeCalls, Number0IsTheVolumeAtIndex1) {
  FSVolumeInfoParam first{};
  first.volumeIndex = 1;
  ASSERT_EQ(PBGetVolumeInfoSync(&first), noErr);
  FSVolumeInfoParam root{};
  ASSERT_EQ(PBGetVolumeInfoSync(&root), noErr);
  EXPECT_EQ(root.ioVRefNum, first.ioVRefNum);
}

// --- A walk by index ----------------------------------------------------------------------------

using Numbers = std::vector<SInt16>;

// Returns the volumes at this index and all later ones. Indexes start at 1.
Numbers WalkFrom(SInt16 index) {
  Numbers numbers;
  for (SInt16 number; (number = VolumeAt(index).number) != 0; ++index) numbers.push_back(number);
  return numbers;
}

// Mounts some volumes after the machine's own.
class AWalkOverTheVolumes : public testing::Test {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    for (auto [mount, name] : {std::pair(&mFirst, "first"), std::pair(&mSecond, "second"),
                               std::pair(&mThird, "third")}) {
      Mount(*mount, name);
    }
    mBefore = WalkFrom(1);
    ASSERT_GT(mBefore.size(), 3u);
  }
  void Mount(std::optional<ScopedMount>& mount, const std::string& name) const {
    mount.emplace("none", mFolder.MakeFolder(name), "tmpfs");
    ASSERT_TRUE(mount->IsMounted());
  }
  // These calls read the current mount table.
  void AskOtherCalls() const {
    const FSSpec spec = SpecOf(mFolder.Path());
    ItemOf(spec);
    InfoOf("/");
    VolumeOfNumber(spec.vRefNum);
    VolumeOfNumber(0);
  }
  static SInt16 VolumeOfNumber(SInt16 number) {
    FSVolumeInfoParam info{};
    info.ioVRefNum = number;
    return PBGetVolumeInfoSync(&info) == noErr ? info.ioVRefNum : static_cast<SInt16>(0);
  }
  SInt16 NumberOf(const std::string& name) const { return InfoOf(mFolder.Path() / name).volume; }

  const TemporaryFolder mFolder;
  std::optional<ScopedMount> mFirst;
  std::optional<ScopedMount> mSecond;
  std::optional<ScopedMount> mThird;
  Numbers mBefore;
};

// Returns the numbers of a walk during which `work` is done after the first step.
template <class Work>
Numbers WalkDuring(Work work) {
  Numbers numbers{VolumeAt(1).number};
  work();
  const Numbers others = WalkFrom(2);
  numbers.insert(numbers.end(), others.begin(), others.end());
  return numbers;
}

TEST_F(AWalkOverTheVolumes, SeesOneStateWhileAVolumeAppears) {
  std::optional<ScopedMount> appearing;
  EXPECT_EQ(WalkDuring([&] {
              Mount(appearing, "new");
              AskOtherCalls();
            }),
            mBefore);
  Numbers after = mBefore;
  after.push_back(NumberOf("new"));
  EXPECT_EQ(WalkFrom(1), after);
}

TEST_F(AWalkOverTheVolumes, SeesOneStateWhileAVolumeVanishes) {
  const SInt16 gone = NumberOf("first");
  EXPECT_EQ(WalkDuring([&] {
              mFirst->Unmount();
              AskOtherCalls();
            }),
            mBefore);
  Numbers after = mBefore;
  std::erase(after, gone);
  EXPECT_EQ(WalkFrom(1), after);
}

TEST_F(AWalkOverTheVolumes, SeesOneStateByEitherCallAtEachOfItsSteps) {
  std::optional<ScopedMount> comingAndGoing;
  Numbers during;
  for (UInt32 index = 1;; ++index) {
    FSVolumeInfoParam info{};
    info.volumeIndex = index;
    const bool isThere = index % 2 == 0 ? PBGetVolumeInfoSync(&info) == noErr
                                        : VolumeAt(static_cast<SInt16>(index)).number != 0;
    if (!isThere) break;
    during.push_back(index % 2 == 0 ? info.ioVRefNum : mBefore.at(index - 1));
    comingAndGoing ? comingAndGoing.reset() : Mount(comingAndGoing, "new");
    AskOtherCalls();
  }
  EXPECT_EQ(during, mBefore);
}

TEST_F(AWalkOverTheVolumes, AtAnotherIndexThanTheNextSeesTheCurrentVolumes) {
  const auto pastTheLast = static_cast<SInt16>(mBefore.size() + 1);
  VolumeAt(1);
  std::optional<ScopedMount> appearing;
  Mount(appearing, "new");
  EXPECT_EQ(VolumeAt(pastTheLast).number, NumberOf("new"));
}

TEST_F(AWalkOverTheVolumes, BeginsAnewAtTheFirst) {
  VolumeAt(1);
  VolumeAt(2);
  std::optional<ScopedMount> appearing;
  Mount(appearing, "new");
  EXPECT_EQ(WalkFrom(1).size(), mBefore.size() + 1);
}

}  // namespace
}  // namespace tallowmere::test
