// Codes 5, 7, 8 and 9: the HFS name and the record of an item, and the path of a record.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <filesystem>

#include "support/TemporaryFolder.h"
#include "support/TracedService.h"
#include "support/Wire.h"

namespace tallowmere::test {
namespace {

class FileSpecCommands : public testing::Test {
 protected:
  void SetUp() override {
    mFile = mFolder.MakeFile("file");
    const std::string response = mService.Ask(RecordRequest(mFile), 75);
    ASSERT_EQ(response.size(), 75u);
    ASSERT_EQ(response[0], 1);
    mRecord = response.substr(1, 70);
    std::memcpy(&mVolume, mRecord.data(), sizeof mVolume);
    std::memcpy(&mParent, mRecord.data() + 2, sizeof mParent);
  }

  std::string PathTo(const std::string& name) const { return mFolder.Path() / name; }

  Service mService;
  TemporaryFolder mFolder;
  std::string mFile;
  std::string mRecord;  // of the file
  std::int16_t mVolume = 0;
  std::int32_t mParent = 0;
};

// --- Code 5 -------------------------------------------------------------------------------------

TEST_F(FileSpecCommands, ANameHasToFitWithItsNUL) {
  const std::string name(31, 'n');
  const std::string path = mFolder.MakeFile(name);
  EXPECT_TRUE(mService.Answers(HFSNameRequest(path, 32), NameResponse(1, name)));
  EXPECT_TRUE(mService.Answers(HFSNameRequest(path, 65535), NameResponse(1, name)));
  EXPECT_TRUE(mService.Answers(HFSNameRequest(path, 31), NameResponse(0, "")));
  EXPECT_TRUE(mService.Answers(HFSNameRequest(path, 1), NameResponse(0, "")));
}

TEST_F(FileSpecCommands, AMaximumOf0GivesNoName) {
  EXPECT_TRUE(mService.Answers(HFSNameRequest(mFile, 0), NameResponse(0, "")));
}

// Making a record always reads the mount table.
TEST_F(FileSpecCommands, AMaximumOf0LooksUpNoRecord) {
  const auto readsTheMountTable = [](const TracedRun& run) {
    return std::any_of(run.calls.begin(), run.calls.end(), [](const std::string& call) {
      return call.find("mountinfo") != std::string::npos;
    });
  };
  const auto without = RunTraced("openat", HFSNameRequest(mFile, 0));
  const auto with = RunTraced("openat", HFSNameRequest(mFile, 64));
  if (!without || !with) GTEST_SKIP() << "strace cannot trace here";
  EXPECT_EQ(without->responses, NameResponse(0, ""));
  EXPECT_FALSE(readsTheMountTable(*without));
  EXPECT_TRUE(readsTheMountTable(*with));
}

TEST_F(FileSpecCommands, AMissingItemHasNoName) {
  EXPECT_TRUE(mService.Answers(HFSNameRequest(mFile, 64), NameResponse(1, "file")));
  EXPECT_TRUE(mService.Answers(HFSNameRequest(PathTo("missing"), 64), NameResponse(0, "")));
}

// --- Code 7 -------------------------------------------------------------------------------------

TEST_F(FileSpecCommands, TheRecordOfAFileIsItsFoldersAndItsName) {
  EXPECT_EQ(mRecord, Record(mVolume, mParent, "file"));
  EXPECT_LT(mVolume, 0);
}

TEST_F(FileSpecCommands, TheRecordOfAMissingFileIsThatOfItsFolderAndItsName) {
  EXPECT_TRUE(mService.Answers(RecordRequest(PathTo("new")),
                               RecordResponse(1, Record(mVolume, mParent, "new"))));
}

TEST_F(FileSpecCommands, TheRecordOfAMissingFileHasNothingOfAnEarlierOne) {
  const std::string longest(63, 'x');
  for (std::size_t length = 1; length < longest.size(); ++length) {
    const std::string name(length, 'y');
    EXPECT_TRUE(mService.Answers(RecordRequest(PathTo(longest)),
                                 RecordResponse(1, Record(mVolume, mParent, longest))));
    EXPECT_TRUE(mService.Answers(RecordRequest(PathTo(name)),
                                 RecordResponse(1, Record(mVolume, mParent, name))));
  }
}

TEST_F(FileSpecCommands, TheRecordOfAMissingFileInAMissingFolderIsNotUsable) {
  EXPECT_TRUE(mService.Answers(RecordRequest(PathTo("missing/new")),
                               RecordResponse(0, Record(32767, -1, "new"))));
}

TEST_F(FileSpecCommands, TheRecordOfNoPathIsTheEmptyOne) {
  EXPECT_TRUE(mService.Answers(RecordRequest(""), RecordResponse(0, kEmptyRecord)));
  EXPECT_TRUE(mService.Answers(U16(7) + U16(0), RecordResponse(0, kEmptyRecord)));
}

// --- Code 8 -------------------------------------------------------------------------------------

TEST_F(FileSpecCommands, ThePartsOfARecordGiveThePath) {
  for (const unsigned flag : {0u, 1u, 2u, 255u}) {
    EXPECT_TRUE(
        mService.Answers(PathOfPartsRequest(mVolume, mParent, "file", flag), PathResponse(mFile)));
  }
}

TEST_F(FileSpecCommands, ThePartsOfAMissingItemGiveThePathThatItWillHave) {
  EXPECT_TRUE(mService.Answers(PathOfPartsRequest(mVolume, mParent, "new", 0),
                               PathResponse(PathTo("new"))));
}

TEST_F(FileSpecCommands, AFolderIdThatDoesNotExistGivesNoPath) {
  for (const std::int32_t id : {0x7FFFFFFF, -1, 3}) {
    EXPECT_TRUE(mService.Answers(PathOfPartsRequest(mVolume, id, "file", 0), kNoPathResponse))
        << id;
  }
}

TEST_F(FileSpecCommands, AnUnknownVolumeGivesNoPath) {
  EXPECT_TRUE(mService.Answers(PathOfPartsRequest(32767, 2, "file", 0), kNoPathResponse));
}

TEST_F(FileSpecCommands, ANameInPartsAbove1024BytesEndsTheService) {
  const std::string longest(1024, 'x');
  EXPECT_TRUE(mService.Answers(U16(8) + I16(mVolume) + Bytes(mParent) + Counted(longest) + Flag(0),
                               kNoPathResponse));
  Service service;
  service.Write(U16(8) + I16(mVolume) + Bytes(mParent) + U16(1025));
  EXPECT_EQ(service.Wait(), 0);
  EXPECT_EQ(service.ReadToEnd(), "");
}

// --- Code 9 -------------------------------------------------------------------------------------

TEST_F(FileSpecCommands, ARecordGivesThePath) {
  for (const unsigned flag : {0u, 1u, 2u, 255u}) {
    EXPECT_TRUE(
        mService.Answers(PathOfRecordRequest(mRecord, flag, 255u - flag), PathResponse(mFile)));
  }
}

TEST_F(FileSpecCommands, TheRecordOfAnotherVolumeIsSearchedForOnAllIfRequested) {
  const std::string elsewhere = Record(-32768, mParent, "file");
  for (const unsigned search : {1u, 2u, 255u}) {
    EXPECT_TRUE(mService.Answers(PathOfRecordRequest(elsewhere, search, 0), PathResponse(mFile)));
  }
  // The bare name does not become a path.
  EXPECT_TRUE(mService.Answers(PathOfRecordRequest(elsewhere, 0, 0), kNoItemResponse));
}

TEST_F(FileSpecCommands, TheEmptyRecordGivesNoPath) {
  EXPECT_TRUE(mService.Answers(PathOfRecordRequest(kEmptyRecord, 0, 0), kNoPathResponse));
  EXPECT_TRUE(mService.Answers(PathOfRecordRequest(kEmptyRecord, 1, 1), kNoPathResponse));
}

TEST_F(FileSpecCommands, ANameLengthBeyondTheRecordIsTakenForTheWholeField) {
  const std::string name(63, 'n');
  std::string record = Record(mVolume, mParent, name);
  record[6] = '\xFF';
  EXPECT_TRUE(mService.Answers(PathOfRecordRequest(record, 0, 0), PathResponse(PathTo(name))));
}

// A plain name is looked up without reading its folder, whether the item exists or not.
TEST_F(FileSpecCommands, APlainNameWithANumberSignTakesNoReadingOfItsFolder) {
  const std::string request =
      RecordRequest(mFile) + PathOfRecordRequest(Record(mVolume, mParent, "Track #12.mp3"), 0, 0);
  const auto run = RunTraced("getdents64", request);
  if (!run) GTEST_SKIP() << "strace cannot trace here";
  EXPECT_EQ(run->responses, RecordResponse(1, mRecord) + PathResponse(PathTo("Track #12.mp3")));
  for (const std::string& call : run->calls) EXPECT_FALSE(call.starts_with("getdents64")) << call;
}

}  // namespace
}  // namespace tallowmere::test
