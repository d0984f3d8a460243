// What the error of a missed deadline says.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "client/ClientSupport.h"
#include "client/RequestText.h"
#include "support/DeadMount.h"
#include "support/MountNamespace.h"

namespace tallowmere {
namespace {

using test::MessageOf;
using test::TemporaryFolder;
using testing::HasSubstr;
using testing::Not;

// The message of a client whose service never answers.
template <class T>
std::string MessageAbout(const Request<T>& request) {
  const TemporaryFolder folder;
  Client client({.service = test::Impostor(folder, "exec sleep 60"),
                 .deadline = std::chrono::milliseconds(50)});
  return MessageOf(client.Ask(request));
}

TEST(MissedDeadline, NamesWhatWasAsked) {
  const FSSpec spec{-27, 19, "caf\x8E"};
  const std::string start = std::string(test::kNotInTime) + ", asked for ";
  EXPECT_EQ(MessageAbout(request::MakeFullPath("/x")), start + "the full HFS path of \"/x\"");
  EXPECT_EQ(MessageAbout(request::MakeFileRefFromPath("V\x8E:x")),
            start + "the item with the HFS path \"V\xC3\xA9:x\"");
  EXPECT_EQ(MessageAbout(request::GetVolRefnumByHFSName("x")),
            start + "the number of the volume \"x\"");
  EXPECT_EQ(MessageAbout(request::GetHFSVolumeName(-27)), start + "the name of the volume -27");
  EXPECT_EQ(MessageAbout(request::GetHFSName("/x")), start + "the HFS name of \"/x\"");
  EXPECT_EQ(MessageAbout(request::AddHFSName("/x", "y")), start + "the item \"y\" in \"/x\"");
  EXPECT_EQ(MessageAbout(request::GetFSSpec("/x")), start + "the record of \"/x\"");
  EXPECT_EQ(MessageAbout(request::SetFileRefFromFSSpec(spec, false)),
            start + "the item with the record \"-27:19:caf\xC3\xA9\"");
  EXPECT_EQ(MessageAbout(request::GetAIFFExportSettings({1, 16, 1, 0x74776F73})),
            start + "export settings");
}

TEST(MissedDeadline, QuotesAGiantTextInPart) {
  const std::string message = MessageAbout(request::GetHFSName("/" + std::string(60000, 'x')));
  EXPECT_LT(message.size(), 2000u);
  EXPECT_THAT(message, HasSubstr("xxx...\""));
}

TEST(MissedDeadline, NamesTheVolumesThatKeepASearchWaitingWithoutTouchingThem) {
  if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  const std::string place = folder.MakeFolder("dead");
  test::DeadMount dead(place);
  if (!dead.IsMounted()) GTEST_SKIP() << "FUSE is not available here";
  const FSSpec spec{-27, 19, "x"};
  EXPECT_THAT(MessageAbout(request::SetFileRefFromFSSpec(spec, true)),
              HasSubstr("; the search of the other volumes may wait for "));
  EXPECT_THAT(MessageAbout(request::SetFileRefFromFSSpec(spec, true)), HasSubstr(place + " (fuse"));
  EXPECT_THAT(MessageAbout(request::SetFileRefFromFSSpecData(spec)), HasSubstr(place));
  EXPECT_THAT(MessageAbout(request::SetFileRefFromFSSpec(spec, false)), Not(HasSubstr(place)));
}

}  // namespace
}  // namespace tallowmere
