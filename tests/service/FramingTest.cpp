// Requests in pieces, cut short or all at once, and the ends of counted strings.
#include <gtest/gtest.h>

#include <ostream>

#include "support/Wire.h"

namespace tallowmere::test {
namespace {

TEST(Framing, ARequestCodeInTwoReadsIsServedNormally) {
  Service service;
  service.Write(kAnyRequest.substr(0, 1));
  usleep(20'000);
  EXPECT_EQ(service.Ask(kAnyRequest.substr(1), 8), kItsResponse);
}

TEST(Framing, EndOfInputAfterTheFirstByteOfTheCodeWritesNothing) {
  Service service;
  service.Write(kAnyRequest.substr(0, 1));
  service.CloseInput();
  EXPECT_EQ(service.ReadToEnd(), "");
  EXPECT_EQ(service.Wait(), 0);
}

TEST(Framing, RequestsAByteAtATimeAreServedNormally) {
  Service service;
  for (const std::string& request : {VolumeNumberRequest("no such volume"), kAnyRequest}) {
    for (const char byte : request) {
      service.Write({&byte, 1});
      usleep(500);
    }
  }
  EXPECT_EQ(service.Read(14), VolumeNumberResponse(32767) + kItsResponse);
}

TEST(Framing, AHundredRequestsWrittenAtOnceAreAnsweredInOrder) {
  Service service;
  std::string requests;
  std::string responses;
  for (int i = 0; i < 50; ++i) {
    requests += VolumeNumberRequest("no such volume") + kAnyRequest;
    responses += VolumeNumberResponse(32767) + kItsResponse;
  }
  service.Write(requests + kQuit);
  EXPECT_EQ(service.ReadToEnd(), responses);
  EXPECT_EQ(service.Wait(), 0);
}

// A request that follows a complete one and is cut at each of its bytes.
class TruncatedRequest : public testing::TestWithParam<std::string> {};

TEST_P(TruncatedRequest, IsNotAnsweredWhereverItIsCut) {
  for (std::size_t length = 0; length < GetParam().size(); ++length) {
    Service service;
    service.Write(kAnyRequest + GetParam().substr(0, length));
    service.CloseInput();
    EXPECT_EQ(service.ReadToEnd(), kItsResponse) << length;
    EXPECT_EQ(service.Wait(), 0) << length;
  }
}

INSTANTIATE_TEST_SUITE_P(Framing, TruncatedRequest,
                         testing::Values(VolumeNumberRequest("Volume"), VolumeNameRequest(-1),
                                         ExportSettingsRequest(44100u << 16, 16, 2, "twos")));

TEST(Framing, AStringWithoutANulEndsWhereItsCountEnds) {
  Service service;
  const std::string name = service.NameOf(0);
  const int number = service.NumberOf(name);
  EXPECT_LT(number, 0);
  const std::string longer = name + "and more";
  service.Write(U16(3) + CString(longer));  // leaves its bytes where the next name will be
  EXPECT_EQ(service.Read(6), VolumeNumberResponse(32767));
  EXPECT_EQ(service.Ask(U16(3) + Counted(name), 6), VolumeNumberResponse(number));
}

TEST(Framing, AStringEndsAtANulInsideTheCount) {
  Service service;
  const std::string name = service.NameOf(0);
  const std::string withMore = std::string(name).append(1, '\0').append("more");
  EXPECT_EQ(service.Ask(U16(3) + CString(withMore), 6),
            VolumeNumberResponse(service.NumberOf(name)));
}

TEST(Framing, AStringOfLength1HoldingTheNulIsTheEmptyString) {
  Service service;
  EXPECT_EQ(service.Ask(U16(3) + CString(""), 6), VolumeNumberResponse(32767));
}

TEST(Framing, AStringOfLength0IsTheEmptyString) {
  Service service;
  EXPECT_EQ(service.Ask(U16(3) + U16(0), 6), VolumeNumberResponse(32767));
}

// A request with a counted string in one of its fields.
struct RequestWithText {
  const char* name;
  std::string before;
  std::string behind;

  friend std::ostream& operator<<(std::ostream& out, const RequestWithText& request) {
    return out << request.name;
  }
};

class TextOfARequest : public testing::TestWithParam<RequestWithText> {
 protected:
  static std::string ResponseTo(std::string_view text) {
    Service service;
    service.Write(GetParam().before + Counted(text) + GetParam().behind + kQuit);
    const std::string response = service.ReadToEnd();
    EXPECT_TRUE(response.ends_with(kTrailer));
    EXPECT_EQ(service.Wait(), 0);
    return response;
  }
};

TEST_P(TextOfARequest, EndsWhereTheCountEndsAndAtTheFirstNul) {
  using std::string_literals::operator""s;
  for (const std::string& text : {"/tmp"s, "file"s, "a:b"s, "Root"s}) {
    const std::string response = ResponseTo(text + '\0');
    EXPECT_EQ(ResponseTo(text), response) << text;
    EXPECT_EQ(ResponseTo(text + "\0/more\0"s), response) << text;
  }
}

TEST_P(TextOfARequest, OfLength0IsTheEmptyString) {
  EXPECT_EQ(ResponseTo(""), ResponseTo({"\0", 1}));
}

INSTANTIATE_TEST_SUITE_P(
    Framing, TextOfARequest,
    testing::Values(RequestWithText{"PathOfCode1", U16(1), U16(256) + Flag(1)},
                    RequestWithText{"FolderOfCode2", U16(2), CString("x") + Flag(0)},
                    RequestWithText{"NameOfCode3", U16(3), ""},
                    RequestWithText{"PathOfCode5", U16(5), U16(64)},
                    RequestWithText{"PathOfCode6", U16(6), CString("x") + Flag(0)},
                    RequestWithText{"NameOfCode6", U16(6) + CString("/tmp"), Flag(0)},
                    RequestWithText{"PathOfCode7", U16(7), ""},
                    RequestWithText{"NameOfCode8", U16(8) + I16(0) + Bytes<std::int32_t>(2),
                                    Flag(0)}),
    [](const auto& request) { return request.param.name; });

TEST(Framing, AnEmptyStringInAResponseIsALengthOf1AndItsNul) {
  Service service;
  EXPECT_EQ(service.Ask(VolumeNameRequest(32767), 8), std::string("\0\1\0\0MWLT", 8));
}

}  // namespace
}  // namespace tallowmere::test
