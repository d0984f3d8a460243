// Code 10: the export settings that a sound is answered with, and what is refused.
#include <gtest/gtest.h>

#include "support/AtomReader.h"
#include "support/Wire.h"

namespace tallowmere::test {
namespace {

constexpr std::uint32_t kHertz = 65536;
constexpr const char* kFormats[] = {"NONE", "raw ", "twos", "sowt", "in24", "in32", "fl32",
                                    "fl64", "ulaw", "alaw", "ima4", "MAC3", "MAC6"};

const std::string kAnyRequest = ExportSettingsRequest(44100 * kHertz, 16, 2, "twos");

struct Response {
  int result = 0;
  std::uint32_t size = 0;  // as stated in the response
  std::string settings;
  std::string trailer;
};

template <class Number>
Number NumberIn(const std::string& bytes, std::size_t place) {
  Number number{};
  if (place + sizeof number <= bytes.size())
    bytes.copy(reinterpret_cast<char*>(&number), sizeof number, place);
  return number;
}

Response ReadResponse(Service& service) {
  Response response;
  const std::string head = service.Read(6);
  response.result = NumberIn<std::int16_t>(head, 0);
  response.size = NumberIn<std::uint32_t>(head, 2);
  response.settings = service.Read(response.size);
  response.trailer = service.Read(kTrailer.size());
  return response;
}

Response Ask(Service& service, const std::string& request) {
  service.Write(request);
  return ReadResponse(service);
}

// Checks that the response is complete and holds the settings for this sound.
void ExpectSettings(const Response& response, std::string_view format, std::uint32_t rate,
                    unsigned sampleSize, unsigned channels) {
  EXPECT_EQ(response.result, 0);
  EXPECT_EQ(response.settings.size(), response.size);
  EXPECT_EQ(response.trailer, kTrailer);
  EXPECT_EQ(ReadAtomContainer(response.settings), SettingsOf(format, rate, sampleSize, channels));
}

// The whole response when there are no settings.
std::string Refusal(int result) {
  return (I16(result) + U32(0)).append(kTrailer);
}

TEST(AudioCommands, SettingsMatchTheRequestInEveryFormat) {
  Service service;
  for (const auto* const format : kFormats) {
    for (const unsigned sampleSize : {8u, 16u, 24u, 32u}) {
      for (const unsigned channels : {1u, 2u, 6u, 255u}) {
        for (const std::uint32_t hertz : {8000u, 44100u, 48000u, 65535u}) {
          SCOPED_TRACE(testing::Message() << format << ' ' << sampleSize << " bits, " << channels
                                          << " channels, " << hertz << " Hz");
          const std::uint32_t rate = hertz * kHertz;
          const std::string request =
              ExportSettingsRequest(rate, sampleSize, static_cast<std::uint8_t>(channels), format);
          ExpectSettings(Ask(service, request), format, rate, sampleSize, channels);
          ASSERT_FALSE(HasFailure());
        }
      }
    }
  }
  service.Write(kQuit);
  EXPECT_EQ(service.ReadToEnd(), "");
  EXPECT_EQ(service.Wait(), 0);
}

TEST(AudioCommands, TheFractionOfARateIsKept) {
  Service service;
  const std::uint32_t rate = 11127 * kHertz + 0x745D;
  ExpectSettings(Ask(service, ExportSettingsRequest(rate, 8, 1, "raw ")), "raw ", rate, 8, 1);
}

TEST(AudioCommands, ASampleSizeAbove65535CountsByItsLow16Bits) {
  Service service;
  const std::uint32_t rate = 44100 * kHertz;
  ExpectSettings(Ask(service, ExportSettingsRequest(rate, 0x10010, 2, "twos")), "twos", rate, 16,
                 2);
  ExpectSettings(Ask(service, ExportSettingsRequest(rate, 0xFFFFFFFF, 2, "twos")), "twos", rate,
                 0xFFFF, 2);
  EXPECT_EQ(service.Ask(ExportSettingsRequest(rate, 0x10000, 2, "twos"), 10), Refusal(-50));
}

TEST(AudioCommands, TheResponseIsAsLongAsItsSizeSays) {
  Service service;
  service.Write(kAnyRequest + kQuit);
  const std::string response = service.ReadToEnd();
  const auto size = NumberIn<std::uint32_t>(response, 2);
  EXPECT_GT(size, 0u);
  EXPECT_EQ(response.size(), 2 + 4 + size + 4);
  EXPECT_TRUE(response.ends_with(kTrailer));
  EXPECT_EQ(service.Wait(), 0);
}

TEST(AudioCommands, ARequestAByteAtATimeIsServedNormally) {
  Service service;
  for (const char byte : kAnyRequest) {
    service.Write({&byte, 1});
    usleep(500);
  }
  ExpectSettings(ReadResponse(service), "twos", 44100 * kHertz, 16, 2);
}

TEST(AudioCommands, TheSameRequestHasTheSameResponseInEveryService) {
  Service first;
  Service second;
  const std::string settings = Ask(first, kAnyRequest).settings;
  EXPECT_EQ(Ask(first, kAnyRequest).settings, settings);
  EXPECT_EQ(Ask(second, kAnyRequest).settings, settings);
}

TEST(AudioCommands, ARefusalOfTheExporterIsItsCodeAndNoSettings) {
  Service service;
  const std::uint32_t rate = 44100 * kHertz;
  EXPECT_EQ(service.Ask(ExportSettingsRequest(rate, 16, 2, "mp4a"), 10), Refusal(-206));
  EXPECT_EQ(service.Ask(ExportSettingsRequest(rate, 16, 2, "sowT"), 10), Refusal(-206));
  EXPECT_EQ(service.Ask(ExportSettingsRequest(rate, 16, 0, "twos"), 10), Refusal(-50));
  EXPECT_EQ(service.Ask(ExportSettingsRequest(0, 16, 2, "twos"), 10), Refusal(-50));
  EXPECT_EQ(service.Ask(ExportSettingsRequest(rate, 0, 2, "twos"), 10), Refusal(-50));
  ExpectSettings(Ask(service, kAnyRequest), "twos", rate, 16, 2);
}

}  // namespace
}  // namespace tallowmere::test
