// Codes 1, 2 and 6: HFS paths of items, items of HFS paths, and names appended to paths.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <filesystem>

#include "support/TemporaryFolder.h"
#include "support/Wire.h"

namespace tallowmere::test {
namespace {

using std::string_literals::operator""s;

// A folder "Work" that holds a folder "Docs" and a file "f"; mHFSPath is its full HFS path.
class HFSPathCommands : public testing::Test {
 protected:
  void SetUp() override {
    mFolder.MakeFolder("Work/Docs");
    mFolder.MakeFile("Work/f");
    mWork = mFolder.Path() / "Work";
    const std::string response = mService.Ask(FullPathRequest(mWork, 1024, 1), 2 + 1024 + 4);
    ASSERT_EQ(response.size(), 2 + 1024 + 4u);
    mHFSPath = response.substr(2).c_str();
    // The sizes below need a path that is long enough to be shortened and fits one length byte.
    ASSERT_GT(mHFSPath.size(), 20u);
    ASSERT_LT(mHFSPath.size(), 200u);
  }

  Service mService;
  TemporaryFolder mFolder;
  std::string mWork;
  std::string mHFSPath;  // of Work, with a trailing colon
};

// --- Code 1 -------------------------------------------------------------------------------------

TEST_F(HFSPathCommands, AFullPathIsTheVolumeAndTheFoldersEachWithAColon) {
  std::string expected = mWork.substr(1) + "/";
  std::replace(expected.begin(), expected.end(), '/', ':');
  EXPECT_THAT(mHFSPath, testing::EndsWith(":Work:"));
  EXPECT_EQ(mHFSPath.back(), ':');
  // Independent of the volumes of this machine.
  EXPECT_TRUE(expected.ends_with(mHFSPath.substr(mHFSPath.find(':') + 1)));
}

TEST_F(HFSPathCommands, AFullPathOfSize0IsOnlyItsLength) {
  const auto length = static_cast<unsigned>(mHFSPath.size());
  EXPECT_TRUE(mService.Answers(FullPathRequest(mWork, 0, 1), U16(length).append(kTrailer)));
}

TEST_F(HFSPathCommands, AFullPathIsFollowedByZeros) {
  std::string buffer = mHFSPath;
  const auto length = static_cast<unsigned>(buffer.size());
  buffer.resize(1024);
  EXPECT_TRUE(mService.Answers(FullPathRequest(mWork, 1024, 1),
                               U16(length).append(buffer).append(kTrailer)));
  buffer.resize(length + 1);
  EXPECT_TRUE(mService.Answers(FullPathRequest(mWork, length + 1, 1),
                               U16(length).append(buffer).append(kTrailer)));
}

TEST_F(HFSPathCommands, AFullPathThatDoesNotFitIsShortenedAndHasItsWholeLengthStated) {
  const auto length = static_cast<unsigned>(mHFSPath.size());
  const std::string response = mService.Ask(FullPathRequest(mWork, length, 1), 2 + length + 4);
  EXPECT_EQ(response.substr(0, 2), U16(length));
  EXPECT_TRUE(response.ends_with(kTrailer));
  const std::string path = response.substr(2).c_str();
  EXPECT_LT(path.size(), length);
  EXPECT_EQ(path.substr(0, path.find(':') + 1), mHFSPath.substr(0, mHFSPath.find(':') + 1));
  EXPECT_THAT(path, testing::HasSubstr(":...:"));
  EXPECT_THAT(path, testing::EndsWith(":Work:"));
}

TEST_F(HFSPathCommands, WithoutTheFlagAFullPathIsShortenedToItsVolume) {
  const auto length = static_cast<unsigned>(mHFSPath.size());
  const std::string response = mService.Ask(FullPathRequest(mWork, length, 0), 2 + length + 4);
  EXPECT_EQ(response.substr(0, 2), U16(length));
  const std::string path = response.substr(2).c_str();
  EXPECT_EQ(path, mHFSPath.substr(0, mHFSPath.find(':')));
}

TEST_F(HFSPathCommands, WithoutTheFlagTheVolumeIsFollowedByZerosWhateverTheSize) {
  std::string volume = mHFSPath.substr(0, mHFSPath.find(':'));
  const auto length = static_cast<unsigned>(mHFSPath.size());
  for (const unsigned size : {length, length + 1, 1024u}) {
    volume.resize(size);
    EXPECT_TRUE(mService.Answers(FullPathRequest(mWork, size, 0),
                                 U16(length).append(volume).append(kTrailer)))
        << size;
  }
}

TEST_F(HFSPathCommands, AFullPathLosesOuterFoldersUntilItFits) {
  const auto length = static_cast<unsigned>(mHFSPath.size());
  const std::string volume = mHFSPath.substr(0, mHFSPath.find(':') + 1);
  std::string folders = mHFSPath.substr(volume.size());
  // The smallest size that is answered has room for the volume, "...:" and the NUL.
  for (unsigned size = length; size > volume.size() + 4; --size) {
    while (volume.size() + folders.size() >= size) {
      folders = "..." + folders.substr(folders.find(':', 4));
    }
    std::string buffer = volume + folders;
    buffer.resize(size);
    EXPECT_TRUE(mService.Answers(FullPathRequest(mWork, size, 1),
                                 U16(length).append(buffer).append(kTrailer)))
        << size;
  }
}

TEST_F(HFSPathCommands, AnyFlagThatIsNot0IsSet) {
  const auto length = static_cast<unsigned>(mHFSPath.size());
  const std::string set = mService.Ask(FullPathRequest(mWork, length, 1), 2 + length + 4);
  for (const unsigned flag : {2u, 255u}) {
    EXPECT_TRUE(mService.Answers(FullPathRequest(mWork, length, flag), set)) << flag;
  }
}

TEST_F(HFSPathCommands, AFullPathAbove1024BytesEndsTheServiceWithoutAResponse) {
  for (const unsigned size : {1025u, 65535u}) {
    Service service;
    service.Write(U16(1) + CString(mWork) + U16(size));
    EXPECT_EQ(service.Wait(), 0);
    EXPECT_EQ(service.ReadToEnd(), "");
  }
}

// --- Code 2 -------------------------------------------------------------------------------------

TEST_F(HFSPathCommands, AnHFSPathGivesThePathOfItsFolder) {
  EXPECT_TRUE(
      mService.Answers(PathOfHFSPathRequest(mHFSPath + '\0', "", 0), ResultResponse(0, mWork)));
  const std::string withoutColon = mHFSPath.substr(0, mHFSPath.size() - 1);
  EXPECT_TRUE(
      mService.Answers(PathOfHFSPathRequest(withoutColon + '\0', "", 0), ResultResponse(0, mWork)));
}

TEST_F(HFSPathCommands, AnHFSPathAndANameGiveThePathOfTheItem) {
  EXPECT_TRUE(mService.Answers(PathOfHFSPathRequest(mHFSPath + '\0', "f\0"s, 0),
                               ResultResponse(0, mWork + "/f")));
  EXPECT_TRUE(mService.Answers(PathOfHFSPathRequest(mHFSPath + '\0', "Docs\0"s, 0),
                               ResultResponse(0, mWork + "/Docs")));
}

TEST_F(HFSPathCommands, AFolderThatDoesNotExistIsAResultAndNoPath) {
  EXPECT_TRUE(mService.Answers(PathOfHFSPathRequest(mHFSPath + "no:\0"s, "f\0"s, 0),
                               ResultResponse(kResultNoFolder)));
  EXPECT_TRUE(mService.Answers(PathOfHFSPathRequest("no such volume:\0"s, "f\0"s, 0),
                               ResultResponse(kResultNoVolume)));
  EXPECT_TRUE(mService.Answers(PathOfHFSPathRequest(mHFSPath + '\0', "missing\0"s, 0),
                               ResultResponse(kResultNoItem)));
}

TEST_F(HFSPathCommands, WithTheFlagTheFolderIsTwoStrings) {
  const std::string parent = mHFSPath.substr(0, mHFSPath.rfind(':', mHFSPath.size() - 2));
  for (const unsigned flag : {1u, 2u, 255u}) {
    EXPECT_TRUE(mService.Answers(PathOfHFSPathRequest(parent + "\0Work\0"s, "f\0"s, flag),
                                 ResultResponse(0, mWork + "/f")))
        << flag;
  }
  EXPECT_TRUE(mService.Answers(PathOfHFSPathRequest(parent + "\0Work\0"s, "f\0"s, 0),
                               ResultResponse(kResultNoItem)));
}

TEST_F(HFSPathCommands, AFolderWithoutItsNULEndsWhereTheCountEnds) {
  EXPECT_TRUE(
      mService.Answers(PathOfHFSPathRequest(mHFSPath, "f", 0), ResultResponse(0, mWork + "/f")));
  // The second string is empty: its NUL follows that of the first. Two colons lead one folder up.
  EXPECT_TRUE(
      mService.Answers(PathOfHFSPathRequest(mHFSPath, "f", 1), ResultResponse(kResultNoItem)));
}

TEST_F(HFSPathCommands, WithoutFolderAndNameThePathIsTheCurrentFolder) {
  const std::string here = std::filesystem::current_path();
  EXPECT_TRUE(mService.Answers(PathOfHFSPathRequest("", "", 0), ResultResponse(0, here)));
}

// --- Code 6 -------------------------------------------------------------------------------------

TEST_F(HFSPathCommands, ANameIsAddedToAFolder) {
  EXPECT_TRUE(mService.Answers(AddNameRequest(mWork, "f", 0), PathResponse(mWork + "/f")));
  EXPECT_TRUE(mService.Answers(AddNameRequest(mWork, "new", 1), PathResponse(mWork + "/new")));
  EXPECT_TRUE(mService.Answers(AddNameRequest(mWork, "a/b", 0), PathResponse(mWork + "/a:b")));
}

TEST_F(HFSPathCommands, ANameIsAddedUnconvertedToANonFolder) {
  EXPECT_TRUE(
      mService.Answers(AddNameRequest(mWork + "/f", "a/b", 0), PathResponse(mWork + "/f/a/b")));
}

TEST_F(HFSPathCommands, ANameOf1024BytesIsTakenAndALongerOneEndsTheService) {
  const std::string longest(1024, 'x');
  const std::string request = U16(6) + CString(mWork) + Counted(longest) + Flag(0);
  EXPECT_TRUE(mService.Answers(request, PathResponse(mWork + "/" + std::string(255, 'x'))));
  Service service;
  service.Write(U16(6) + CString(mWork) + U16(1025));
  EXPECT_EQ(service.Wait(), 0);
  EXPECT_EQ(service.ReadToEnd(), "");
}

TEST_F(HFSPathCommands, ANameWithoutItsNULEndsWhereTheCountEnds) {
  mService.Ask(AddNameRequest(mWork, "a longer name than the next one", 0), 0);
  const std::string first = PathResponse(mWork + "/a longer name than the next one");
  EXPECT_EQ(mService.Read(first.size()), first);
  EXPECT_TRUE(mService.Answers(U16(6) + CString(mWork) + Counted("new") + Flag(0),
                               PathResponse(mWork + "/new")));
}

TEST_F(HFSPathCommands, APathTooLongForACountIsNone) {
  const std::string path = "/" + std::string(65000, 'x');
  const std::string name(65534 - path.size() - 1, 'n');
  EXPECT_TRUE(mService.Answers(AddNameRequest(path, name, 0), PathResponse(path + "/" + name)));
  EXPECT_TRUE(
      mService.Answers(AddNameRequest(path, name + "n", 0), (Flag(1) + U16(0)).append(kTrailer)));
}

}  // namespace
}  // namespace tallowmere::test
