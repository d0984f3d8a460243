// Full HFS paths and how they are shortened, the names of volumes, and the HFS names of items.
#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <cstring>
#include <vector>

#include "HFSBridgeSupport.h"

namespace tallowmere::test {
namespace {

constexpr unsigned short kEnough = 1024;

struct FullPath {
  unsigned length;
  std::string text;

  bool operator==(const FullPath&) const = default;
  friend std::ostream& operator<<(std::ostream& out, const FullPath& path) {
    return out << path.length << " \"" << path.text << '"';
  }
};

// Uses a buffer of exactly `maxLength` bytes, so that sanitizers notice an access beyond it.
FullPath FullPathOf(const CFileRef& ref, unsigned short maxLength = kEnough,
                    bool keepFolders = true) {
  const auto buffer = std::make_unique<char[]>(maxLength);
  const unsigned length =
      CFileUtilMakeFullPath(ref, buffer.get(), maxLength, keepFolders ? 0x80 : 0);
  return {length, buffer.get()};
}

class FullPaths : public DataVolumeTest {
 protected:
  void SetUp() override {
    DataVolumeTest::SetUp();
    if (mData) mData->MakeFolder("Work/Docs");
  }
};

TEST_F(FullPaths, OfAFileInTheTopFolderIsTheVolumeAlone) {
  mData->MakeFile("file");
  EXPECT_EQ(FullPathOf(mData->Ref("file")), (FullPath{5, "Data:"}));
  EXPECT_EQ(FullPathOf(mData->Ref()), (FullPath{5, "Data:"}));
}

TEST_F(FullPaths, OfAFolderHasTheFolderItself) {
  EXPECT_EQ(FullPathOf(mData->Ref("Work/Docs")), (FullPath{15, "Data:Work:Docs:"}));
}

TEST_F(FullPaths, OfAFileHasItsFolderAndNotItsName) {
  mData->MakeFile("Work/Docs/file");
  EXPECT_EQ(FullPathOf(mData->Ref("Work/Docs/file")), (FullPath{15, "Data:Work:Docs:"}));
  EXPECT_EQ(FullPathOf(mData->Ref("Work/Docs/missing")), (FullPath{15, "Data:Work:Docs:"}));
}

TEST_F(FullPaths, NamesAreInHFSForm) {
  mData->MakeFolder("a:b\xC3\xA9");
  EXPECT_EQ(FullPathOf(mData->Ref("a:b\xC3\xA9")), (FullPath{10, "Data:a/b\x8E:"}));
}

TEST_F(FullPaths, InAMissingFolderAreTheVolumeAlone) {
  EXPECT_EQ(FullPathOf(mData->Ref("missing/file")), (FullPath{5, "Data:"}));
}

TEST_F(FullPaths, OnAnUnknownVolumeAreAColon) {
  EXPECT_EQ(FullPathOf(CFileRef()), (FullPath{1, ":"}));
  EXPECT_EQ(FullPathOf(CFileRef("relative", false), 2), (FullPath{1, ":"}));
}

TEST_F(FullPaths, WithoutABufferAreCounted) {
  EXPECT_EQ(CFileUtilMakeFullPath(mData->Ref("Work/Docs"), nullptr, 0, 1), 15);
  EXPECT_EQ(CFileUtilMakeFullPath(mData->Ref("Work/Docs"), nullptr, 0, 0), 15);
}

TEST_F(FullPaths, ThatAreTooLongLoseTheirOuterFolders) {
  EXPECT_EQ(FullPathOf(mData->Ref("Work/Docs"), 12), (FullPath{15, "Data:...:"}));
  EXPECT_EQ(FullPathOf(mData->Ref("Work/Docs"), 15), (FullPath{15, "Data:...:Docs:"}));
  EXPECT_EQ(FullPathOf(mData->Ref("Work/Docs"), 16), (FullPath{15, "Data:Work:Docs:"}));
}

TEST_F(FullPaths, ThatAreTooLongKeepFoldersOfUpToThreeBytesWithTheNextOne) {
  mData->MakeFolder("a/bc/def/ghij");
  EXPECT_EQ(FullPathOf(mData->Ref("a/bc/def/ghij")), (FullPath{19, "Data:a:bc:def:ghij:"}));
  EXPECT_EQ(FullPathOf(mData->Ref("a/bc/def/ghij"), 19), (FullPath{19, "Data:...:def:ghij:"}));
  EXPECT_EQ(FullPathOf(mData->Ref("a/bc/def/ghij"), 18), (FullPath{19, "Data:...:ghij:"}));
}

TEST_F(FullPaths, FitIntoAnyRoomAboveTheVolumesNameAndTheMarker) {
  EXPECT_EQ(FullPathOf(mData->Ref("Work/Docs"), 10), (FullPath{15, "Data:...:"}));
}

TEST_F(FullPaths, WithoutTheirFoldersAreTheVolumesNameAndCountTheWholePath) {
  EXPECT_EQ(FullPathOf(mData->Ref("Work/Docs"), kEnough, false), (FullPath{15, "Data"}));
  EXPECT_EQ(FullPathOf(mData->Ref("Work/Docs"), 12, false), (FullPath{15, "Data"}));
  EXPECT_EQ(FullPathOf(CFileRef(), kEnough, false), (FullPath{1, ""}));
}

TEST_F(FullPaths, KeepTheFoldersAfterTheNulThatHidesThem) {
  char buffer[kEnough];
  CFileUtilMakeFullPath(mData->Ref("Work/Docs"), buffer, sizeof buffer, 0);
  EXPECT_EQ(std::string(buffer, 16), std::string("Data\0Work:Docs:\0", 16));
}

TEST_F(FullPaths, OfMoreThan511BytesOfFoldersLoseTheTopmostOnes) {
  std::string path;
  std::string innermost;
  for (int level = 0; level < 20; ++level) {
    const std::string name = std::string(28, 'n') + std::to_string(level + 10);
    path += name + "/";
    if (level >= 4) innermost += name + ":";
  }
  mData->MakeFolder(path);
  ASSERT_EQ(innermost.size(), 496u);
  EXPECT_EQ(FullPathOf(mData->Ref(path)), (FullPath{501, "Data:" + innermost}));
}

TEST_F(FullPaths, HaveUpTo511BytesOfFolders) {
  const std::string inner(255, 'i');
  const std::string longest(254, 'o');
  mData->MakeFolder(longest + "/" + inner);
  mData->MakeFolder(longest + "o/" + inner);
  EXPECT_EQ(FullPathOf(mData->Ref(longest + "/" + inner)),
            (FullPath{5 + 511, "Data:" + longest + ":" + inner + ":"}));
  EXPECT_EQ(FullPathOf(mData->Ref(longest + "o/" + inner)),
            (FullPath{5 + 256, "Data:" + inner + ":"}));
}

TEST_F(FullPaths, OfAPath200FoldersDeepKeepTheInnermostFolders) {
  std::string path;
  for (int level = 0; level < 200; ++level) path += "abcd/";
  mData->MakeFolder(path);
  const FullPath full = FullPathOf(mData->Ref(path));
  EXPECT_EQ(full.length, 5u + 510u);
  EXPECT_EQ(full.text.substr(0, 15), "Data:abcd:abcd:");
}

TEST_F(FullPaths, OfPathsOf65535BytesAreTheVolumeAboveThem) {
  const std::string path =
      mData->Path() + "/" + std::string(65000, 'x') + "/" + std::string(400, 'y');
  EXPECT_EQ(FullPathOf(CFileRef(path.c_str(), false)), (FullPath{5, "Data:"}));
}

// For any folders and any room: the result is shorter than the room, keeps the volume and the
// innermost folders, and states the length of the whole path.
TEST_F(FullPaths, OfAnyFoldersFitIntoAnyRoom) {
  rc::check([this] {
    const auto names = *rc::gen::resize(
        8, rc::gen::container<std::vector<std::string>>(
               rc::gen::nonEmpty(rc::gen::container<std::string>(rc::gen::inRange('a', 'z')))));
    std::string path = ".";
    std::string full = "Data:";
    for (const std::string& name : names) {
      path += "/" + name;
      full += name + ":";
    }
    mData->MakeFolder(path);
    const auto room = *rc::gen::inRange<unsigned short>(10, 100);
    const FullPath result = FullPathOf(CFileRef(mData->Path(path).c_str(), false), room);
    RC_ASSERT(result.length == full.size());
    RC_ASSERT(result.text.size() < room);
    if (full.size() < room) {
      RC_ASSERT(result.text == full);
    } else {
      RC_ASSERT(result.text.starts_with("Data:...:"));
      RC_ASSERT(full.ends_with(result.text.substr(8)));
    }
  });
}

// --- Volumes ----------------------------------------------------------------------------------

using VolumeNames = DataVolumeTest;

TEST_F(VolumeNames, AMountedVolumeHasItsNumberAndItsName) {
  const short number = CFileUtilGetVolRefnumByHFSName("Data");
  EXPECT_EQ(number, mData->Number());
  char name[256] = "old";
  EXPECT_TRUE(CFileUtilGetHFSVolumeName(number, name));
  EXPECT_STREQ(name, "Data");
}

TEST_F(VolumeNames, LetterCaseAndLengthCount) {
  for (const char* const name : {"data", "DATA", "Dat", "Data ", "Data:", ""}) {
    EXPECT_EQ(CFileUtilGetVolRefnumByHFSName(name), kNoVolume) << name;
  }
  EXPECT_EQ(CFileUtilGetVolRefnumByHFSName(std::string(65535, 'x').c_str()), kNoVolume);
}

TEST_F(VolumeNames, AnUnmountedVolumeHasNone) {
  const short number = mData->Number();
  mData->Unmount();
  EXPECT_EQ(CFileUtilGetVolRefnumByHFSName("Data"), kNoVolume);
  char name[256] = "old";
  EXPECT_FALSE(CFileUtilGetHFSVolumeName(number, name));
  EXPECT_STREQ(name, "");
  EXPECT_STREQ(name + 1, "ld");
}

// --- Names ------------------------------------------------------------------------------------

using HFSNamesOfItems = DataVolumeTest;

TEST_F(HFSNamesOfItems, AnExistingItemHasTheNameOfItsRecord) {
  const CFileRef file(mData->MakeFile("a:b\xC3\xA9").c_str(), false);
  char name[64];
  EXPECT_TRUE(CFileUtilGetHFSName(file, name, sizeof name));
  EXPECT_STREQ(name, "a/b\x8E");
}

TEST_F(HFSNamesOfItems, ALongNameIsShort) {
  const CFileRef file(mData->MakeFile(std::string(100, 'n')).c_str(), false);
  char name[64];
  EXPECT_TRUE(CFileUtilGetHFSName(file, name, sizeof name));
  EXPECT_EQ(std::strlen(name), 31u);
}

TEST_F(HFSNamesOfItems, ANameNeedsRoomForItsNul) {
  const CFileRef file(mData->MakeFile("1234567").c_str(), false);
  char name[8] = "old old";
  EXPECT_FALSE(CFileUtilGetHFSName(file, name, 7));
  EXPECT_STREQ(name, "");
  EXPECT_STREQ(name + 1, "ld old");
  EXPECT_TRUE(CFileUtilGetHFSName(file, name, 8));
  EXPECT_STREQ(name, "1234567");
}

TEST_F(HFSNamesOfItems, WithoutItemBufferOrRoomNothingIsWritten) {
  const CFileRef file(mData->MakeFile("file").c_str(), false);
  char name[64] = "old";
  EXPECT_FALSE(CFileUtilGetHFSName(file, name, 0));
  EXPECT_FALSE(CFileUtilGetHFSName(file, nullptr, sizeof name));
  EXPECT_FALSE(CFileUtilGetHFSName(mData->Ref("missing"), name, sizeof name));
  EXPECT_FALSE(CFileUtilGetHFSName(CFileRef(), name, sizeof name));
  std::filesystem::create_symlink("missing", mData->Path("dangling"));
  EXPECT_FALSE(CFileUtilGetHFSName(mData->Ref("dangling"), name, sizeof name));
  EXPECT_STREQ(name, "old");
}

}  // namespace
}  // namespace tallowmere::test
