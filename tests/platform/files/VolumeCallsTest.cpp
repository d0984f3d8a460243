#include <CoreServices/CoreServices.h>
#include <gtest/gtest.h>

#include <cstring>

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

TEST(VolumeCalls, ANameThatIsNotWantedIsNotWritten) {
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

}  // namespace
