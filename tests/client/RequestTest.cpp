// The bytes that are sent for each request, and what is answered without being sent.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "client/ClientSupport.h"
#include "client/FullPathRequest.h"
#include "support/Wire.h"

namespace tallowmere {
namespace {

using test::MessageOf;
using test::SentDuring;
using test::TemporaryFolder;

const std::string kTextWithNUL("a\0b", 3);

TEST(Request, TheFullPathIsAskedForInTheLongestBufferWithItsFolders) {
  EXPECT_EQ(SentDuring([](Client& client) { EXPECT_TRUE(client.MakeFullPath("/tmp")); }),
            test::FullPathRequest("/tmp", 1024, 1));
}

TEST(Request, AnHFSPathIsSentAsANameInNoFolder) {
  EXPECT_EQ(SentDuring([](Client& client) { EXPECT_TRUE(client.MakeFileRefFromPath("v:a")); }),
            test::PathOfHFSPathRequest(std::string(1, '\0'), std::string("v:a\0", 4), 0));
}

TEST(Request, AVolumesNameIsSentAsItIs) {
  EXPECT_EQ(SentDuring([](Client& client) { EXPECT_TRUE(client.GetVolRefnumByHFSName("v")); }),
            test::VolumeNumberRequest("v"));
}

TEST(Request, AVolumesNumberIsSentWithItsSign) {
  EXPECT_EQ(SentDuring([](Client& client) { EXPECT_TRUE(client.GetHFSVolumeName(-259)); }),
            test::VolumeNameRequest(-259));
}

TEST(Request, TheHFSNameIsAskedForInTheLongestBuffer) {
  EXPECT_EQ(SentDuring([](Client& client) { EXPECT_TRUE(client.GetHFSName("/tmp")); }),
            test::HFSNameRequest("/tmp", 1024));
}

TEST(Request, FolderAndNameAreSentInThisOrder) {
  EXPECT_EQ(SentDuring([](Client& client) { EXPECT_TRUE(client.AddHFSName("/tmp", "a/b")); }),
            test::AddNameRequest("/tmp", "a/b", 0));
}

TEST(Request, ARecordIsAskedForByPath) {
  EXPECT_EQ(SentDuring([](Client& client) { EXPECT_TRUE(client.GetFSSpec("")); }),
            test::RecordRequest(""));
}

TEST(Request, VolumeFolderAndNameAreSentInThisOrder) {
  EXPECT_EQ(SentDuring([](Client& client) {
              EXPECT_TRUE(client.SetFileRefFromFSSpecData({-3, -11, "x"}));
            }),
            test::PathOfPartsRequest(-3, -11, "x", 0));
}

TEST(Request, ARecordIsSentWithTheWishToSearchOtherVolumes) {
  const FSSpec spec{-3, -11, "x"};
  const std::string record = test::Record(-3, -11, "x");
  EXPECT_EQ(SentDuring([&](Client& client) {
              EXPECT_TRUE(client.SetFileRefFromFSSpec(spec, true));
              EXPECT_TRUE(client.SetFileRefFromFSSpec(spec, false));
            }),
            test::PathOfRecordRequest(record, 1, 0) + test::PathOfRecordRequest(record, 0, 0));
}

TEST(Request, ASoundIsSentInItsFourFields) {
  EXPECT_EQ(
      SentDuring([](Client& client) {
        EXPECT_TRUE(client.GetAIFFExportSettings(
            {.rate = 0xAC440001, .sampleSize = 0x1234, .channels = 200, .format = 0x74776F73}));
      }),
      test::ExportSettingsRequest(0xAC440001, 0x1234, 200, "twos"));
}

// The longest text that a counted string can carry; the service answers it and goes on.
TEST(Request, APathOf65534BytesIsSentAndALongerOneIsNone) {
  const std::string longest(65534, 'x');
  const std::string sent = SentDuring([&](Client& client) {
    for (const std::string& path : {longest, longest + 'x', kTextWithNUL}) {
      EXPECT_EQ(MessageOf(client.GetHFSName(path)), "");
      EXPECT_EQ(MessageOf(client.GetFSSpec(path)), "");
      EXPECT_EQ(MessageOf(client.MakeFullPath(path)), "");
      EXPECT_EQ(MessageOf(client.AddHFSName(path, "n")), "");
    }
    EXPECT_EQ(*client.GetHFSName(longest + 'x'), std::nullopt);
    EXPECT_EQ(*client.GetFSSpec(longest + 'x'), std::nullopt);
    EXPECT_EQ(*client.MakeFullPath(longest + 'x'), ":");
    EXPECT_EQ(*client.AddHFSName(longest + 'x', "n"), std::nullopt);
  });
  EXPECT_TRUE(sent == test::HFSNameRequest(longest, 1024) + test::RecordRequest(longest) +
                          test::FullPathRequest(longest, 1024, 1) +
                          test::AddNameRequest(longest, "n", 0));
}

TEST(Request, AVolumesNameOf255BytesIsSentAndALongerOneIsNone) {
  const std::string longest(255, 'x');
  EXPECT_EQ(SentDuring([&](Client& client) {
              for (const std::string& name : {longest, longest + 'x', kTextWithNUL}) {
                EXPECT_EQ(*client.GetVolRefnumByHFSName(name), std::nullopt);
              }
            }),
            test::VolumeNumberRequest(longest));
}

TEST(Request, AnHFSPathOf255BytesIsSentAndALongerOneIsNone) {
  const std::string longest(255, 'x');
  EXPECT_EQ(SentDuring([&](Client& client) {
              for (const std::string& path : {longest, longest + 'x', kTextWithNUL}) {
                EXPECT_EQ(*client.MakeFileRefFromPath(path), std::nullopt);
              }
            }),
            test::PathOfHFSPathRequest(std::string(1, '\0'), longest + '\0', 0));
}

TEST(Request, ANameToAddOf255BytesIsSentAndALongerOneIsNone) {
  const std::string longest(255, 'x');
  EXPECT_EQ(SentDuring([&](Client& client) {
              EXPECT_TRUE(client.AddHFSName("/", longest));
              EXPECT_EQ(*client.AddHFSName("/", longest + 'x'), std::nullopt);
              EXPECT_EQ(*client.AddHFSName("/", kTextWithNUL), std::nullopt);
            }),
            test::AddNameRequest("/", longest, 0));
}

TEST(Request, ANameInAFolderOf255BytesIsSentAndALongerOneIsNone) {
  const std::string longest(255, 'x');
  EXPECT_EQ(SentDuring([&](Client& client) {
              EXPECT_TRUE(client.SetFileRefFromFSSpecData({0, 2, longest}));
              EXPECT_EQ(*client.SetFileRefFromFSSpecData({0, 2, longest + 'x'}), std::nullopt);
              EXPECT_EQ(*client.SetFileRefFromFSSpecData({0, 2, kTextWithNUL}), std::nullopt);
            }),
            test::PathOfPartsRequest(0, 2, longest, 0));
}

TEST(Request, ARecordsNameOf63BytesIsSentAndALongerOneIsNone) {
  const std::string longest(63, 'x');
  EXPECT_EQ(SentDuring([&](Client& client) {
              EXPECT_TRUE(client.SetFileRefFromFSSpec({0, 2, longest}, false));
              EXPECT_EQ(*client.SetFileRefFromFSSpec({0, 2, longest + 'x'}, false), std::nullopt);
            }),
            test::PathOfRecordRequest(test::Record(0, 2, longest), 0, 0));
}

TEST(Request, ARecordsNameOf63BytesComesBackWhole) {
  const TemporaryFolder folder;
  const std::string file = folder.MakeFile(std::string(63, 'x'));
  Client client = test::StartClient();
  const auto spec = client.GetFSSpec(file);
  ASSERT_TRUE(spec && *spec);
  EXPECT_EQ((*spec)->name, std::string(63, 'x'));
}

TEST(Request, CanBeAskedMoreThanOnce) {
  Client client = test::StartClient();
  const auto request = request::GetHFSVolumeName(0);
  const auto first = client.Ask(request);
  const auto second = client.Ask(request);
  ASSERT_TRUE(first && *first && second);
  EXPECT_EQ(*first, *second);
}

TEST(Request, OneThatIsNotSentCanBeAskedMoreThanOnceAndStartsNoService) {
  Client client = test::StartClient();
  const auto request = request::MakeFullPath(kTextWithNUL);
  EXPECT_EQ(*client.Ask(request), ":");
  EXPECT_EQ(*client.Ask(request), ":");
  EXPECT_TRUE(test::HasNoChild());
}

// --- Full paths in a buffer -------------------------------------------------------------------

struct Buffered {
  TemporaryFolder folder;
  Client client{{.service = TALLOWMERE_SERVICE, .deadline = std::chrono::milliseconds(2000)}};
  std::string path = folder.MakeFolder("a folder with a long name").string();
  std::string whole = *client.MakeFullPath(path);
  std::string volume = whole.substr(0, whole.find(':'));
  std::uint16_t smallest = static_cast<std::uint16_t>(volume.size() + sizeof ":...:");
};

TEST(FullPathInBuffer, IsWholeWhereItFits) {
  Buffered paths;
  const auto size = static_cast<std::uint16_t>(paths.whole.size() + 1);
  EXPECT_EQ(*paths.client.MakeFullPath(paths.path, size), paths.whole);
  EXPECT_EQ(*paths.client.MakeFullPath(paths.path, 1024), paths.whole);
}

TEST(FullPathInBuffer, LosesItsOuterFoldersWhereItDoesNotFit) {
  Buffered paths;
  const auto size = static_cast<std::uint16_t>(paths.whole.size());
  const auto shortened = paths.client.MakeFullPath(paths.path, size);
  ASSERT_TRUE(shortened);
  EXPECT_THAT(*shortened, testing::StartsWith(paths.volume + ":...:"));
  EXPECT_THAT(*shortened, testing::EndsWith(":a folder with a long name:"));
  EXPECT_LT(shortened->size(), size);
}

TEST(FullPathInBuffer, LosesAllFoldersInTheSmallestBuffer) {
  Buffered paths;
  EXPECT_EQ(*paths.client.MakeFullPath(paths.path, paths.smallest), paths.volume + ":...:");
}

TEST(FullPathInBuffer, ASmallerOneWouldNotReturnAndIsRefused) {
  Buffered paths;
  const auto size = static_cast<std::uint16_t>(paths.smallest - 1);
  EXPECT_EQ(MessageOf(paths.client.MakeFullPath(paths.path, size)),
            "the full path cannot be shortened to " + std::to_string(size) + " bytes");
  EXPECT_EQ(MessageOf(paths.client.MakeFullPath(paths.path, size, false)),
            "the full path cannot be shortened to " + std::to_string(size) + " bytes");
  EXPECT_THAT(MessageOf(paths.client.Ask(request::FullPathInBuffer(paths.path, size, true))),
              testing::StartsWith(test::kNotInTime));
}

TEST(FullPathInBuffer, IsTheVolumesNameWithoutFolders) {
  Buffered paths;
  EXPECT_EQ(*paths.client.MakeFullPath(paths.path, paths.smallest, false), paths.volume);
  EXPECT_EQ(*paths.client.MakeFullPath(paths.path, 1024, false), paths.volume);
}

TEST(FullPathInBuffer, OfAVolumeNeedsRoomForItsNameAlone) {
  Buffered paths;
  const std::string whole = *paths.client.MakeFullPath("/");
  const auto size = static_cast<std::uint16_t>(whole.size() + 1);
  EXPECT_EQ(*paths.client.MakeFullPath("/", size), whole);
  EXPECT_FALSE(paths.client.MakeFullPath("/", static_cast<std::uint16_t>(size - 1)));
}

TEST(FullPathInBuffer, OfWhatIsOnNoVolumeIsAColon) {
  Buffered paths;
  EXPECT_EQ(*paths.client.MakeFullPath("x", 2), ":");
  EXPECT_FALSE(paths.client.MakeFullPath("x", 1));
  EXPECT_EQ(*paths.client.MakeFullPath(kTextWithNUL, 2), ":");
  EXPECT_FALSE(paths.client.MakeFullPath(kTextWithNUL, 1));
}

TEST(FullPathInBuffer, HasOneTo1024Bytes) {
  Client client = test::StartClient();
  EXPECT_EQ(MessageOf(client.MakeFullPath("/", 0)),
            "a full path is asked for in 1 to 1024 bytes, not in 0");
  EXPECT_EQ(MessageOf(client.MakeFullPath("/", 1025)),
            "a full path is asked for in 1 to 1024 bytes, not in 1025");
  EXPECT_TRUE(test::HasNoChild());
}

TEST(FullPathInBuffer, IsAskedForInThatSizeOnlyWhereItDoesNotFit) {
  Buffered paths;
  EXPECT_EQ(SentDuring([&](Client& client) {
              EXPECT_TRUE(client.MakeFullPath(paths.path, paths.smallest));
              EXPECT_FALSE(
                  client.MakeFullPath(paths.path, static_cast<std::uint16_t>(paths.smallest - 1)));
            }),
            test::FullPathRequest(paths.path, 1024, 1) +
                test::FullPathRequest(paths.path, paths.smallest, 1) +
                test::FullPathRequest(paths.path, 1024, 1));
}

}  // namespace
}  // namespace tallowmere
