// What a request for export settings leaves behind in the process.
#include <gtest/gtest.h>

#include "service/AudioCommands.h"
#include "support/AtomReader.h"
#include "support/OwnedByCallers.h"

namespace tallowmere::test {
namespace {

constexpr unsigned long kRate = 44100ul << 16;
constexpr unsigned long kTwos = 0x74776F73;
constexpr unsigned long kOther = 0x6F746872;

TEST(AudioExport, EachSuccessLeavesItsInstanceOpenAndItsBlockAlive) {
  for (int i = 0; i < 3; ++i) {
    const auto instances = OpenInstances();
    const auto handles = LiveHandles();
    Handle settings = nullptr;
    ASSERT_EQ(GetAIFFExportSettingsThroughIPC(&settings, kRate, 16, 2, kTwos), 0);
    EXPECT_EQ(OpenInstances(), instances + 1);
    EXPECT_EQ(LiveHandles(), handles + 1);
  }
}

TEST(AudioExport, AFailureLeavesNothing) {
  const auto instances = OpenInstances();
  const auto handles = LiveHandles();
  char* bytes = nullptr;
  Handle settings = &bytes;
  EXPECT_EQ(GetAIFFExportSettingsThroughIPC(&settings, kRate, 16, 2, kOther), -206);
  EXPECT_EQ(settings, nullptr);
  EXPECT_EQ(GetAIFFExportSettingsThroughIPC(&settings, 0, 16, 2, kTwos), -50);
  EXPECT_EQ(OpenInstances(), instances);
  EXPECT_EQ(LiveHandles(), handles);
}

TEST(AudioExport, TheBlockHoldsTheSettingsWithoutFurtherBytes) {
  Handle settings = nullptr;
  ASSERT_EQ(GetAIFFExportSettingsThroughIPC(&settings, kRate, 16, 2, kTwos), 0);
  EXPECT_EQ(ReadAtomContainer({*settings, static_cast<std::size_t>(GetHandleSize(settings))}),
            SettingsOf("twos", kRate, 16, 2));
}

TEST(AudioExport, NumbersBeyond32BitsCountByTheirLow32Bits) {
  constexpr unsigned long kMore = 1ul << 32;
  Handle settings = nullptr;
  ASSERT_EQ(GetAIFFExportSettingsThroughIPC(&settings, kMore + kRate, kMore + 16, 2, kMore + kTwos),
            0);
  EXPECT_EQ(ReadAtomContainer({*settings, static_cast<std::size_t>(GetHandleSize(settings))}),
            SettingsOf("twos", kRate, 16, 2));
}

}  // namespace
}  // namespace tallowmere::test
