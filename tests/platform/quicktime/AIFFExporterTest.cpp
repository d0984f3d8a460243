// The exporter: the sounds that it accepts and the settings that it writes.
#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <optional>
#include <string>

#include "ExporterFixture.h"
#include "support/AtomReader.h"
#include "support/OwnedByCallers.h"

namespace tallowmere::quicktime::test {
namespace {

using tallowmere::test::Atom;
using tallowmere::test::LiveHandles;
using tallowmere::test::ReadAtomContainer;
using tallowmere::test::SettingsOf;

constexpr const char* kUncompressed[] = {"NONE", "raw ", "twos", "sowt",
                                         "in24", "in32", "fl32", "fl64"};
constexpr const char* kCompressed[] = {"ulaw", "alaw", "ima4", "MAC3", "MAC6"};
constexpr ComponentResult kBadArgument = -50;
constexpr ComponentResult kUnknownFormat = -206;

class AIFFExporter : public WithExporter {
 protected:
  // Returns the settings as a tree, or nullopt when there are none.
  std::optional<Atom> Settings() {
    Handle settings = nullptr;
    if (MovieExportGetSettingsAsAtomContainer(mExporter, &settings) != noErr) return std::nullopt;
    auto root = ReadAtomContainer({*settings, static_cast<std::size_t>(GetHandleSize(settings))});
    DisposeHandle(settings);
    return root;
  }
};

TEST_F(AIFFExporter, AcceptsEveryFormatThatTheFilesCanHold) {
  for (const auto* const format : kUncompressed) {
    EXPECT_EQ(Set(Sound(format, 24, 6, 48000u << 16)), noErr) << format;
    EXPECT_EQ(Settings(), SettingsOf(format, 48000u << 16, 24, 6)) << format;
  }
  for (const auto* const format : kCompressed) {
    EXPECT_EQ(Set(Sound(format, 24, 6, 48000u << 16)), noErr) << format;
    EXPECT_EQ(Settings(), SettingsOf(format, 48000u << 16, 24, 6)) << format;
  }
}

TEST_F(AIFFExporter, RefusesAnyOtherFormat) {
  for (const auto* const format : {"TWOS", "none", "raw\0", "mp4a", ".mp3", "in16", "\0\0\0\0"}) {
    EXPECT_EQ(Set(Sound({format, 4})), kUnknownFormat) << format;
  }
  EXPECT_FALSE(Settings());
}

TEST_F(AIFFExporter, RefusesADescriptionOfAnotherSize) {
  for (const SInt32 size : {0, 35, 37, -36}) {
    SoundDescription sound = Sound("twos");
    sound.descSize = size;
    EXPECT_EQ(Set(sound), kBadArgument) << size;
  }
  EXPECT_FALSE(Settings());
}

TEST_F(AIFFExporter, RefusesABlockThatDoesNotHoldTheDescription) {
  const SoundDescription sound = Sound("twos");
  const Handle block = NewHandleClear(sizeof sound - 1);
  std::memcpy(*block, &sound, sizeof sound - 1);
  EXPECT_EQ(Set(block), kBadArgument);
  DisposeHandle(block);
}

TEST_F(AIFFExporter, TakesADescriptionInALargerBlock) {
  const SoundDescription sound = Sound("twos");
  const Handle block = NewHandleClear(sizeof sound + 100);
  std::memcpy(*block, &sound, sizeof sound);
  EXPECT_EQ(Set(block), noErr);
  DisposeHandle(block);
}

TEST_F(AIFFExporter, RefusesAnotherMediaType) {
  for (const auto* const medium : {"vide", "SOUN", "\0\0\0\0"}) {
    EXPECT_EQ(Set(Sound("twos"), CodeOf({medium, 4})), kBadArgument) << medium;
  }
  EXPECT_FALSE(Settings());
}

TEST_F(AIFFExporter, RefusesFewerThanOneChannel) {
  EXPECT_EQ(Set(Sound("twos", 16, 0)), kBadArgument);
  EXPECT_EQ(Set(Sound("ulaw", 16, 0)), kBadArgument);
  EXPECT_EQ(Set(Sound("twos", 16, -1)), kBadArgument);
  EXPECT_FALSE(Settings());
}

TEST_F(AIFFExporter, RefusesARateOf0) {
  EXPECT_EQ(Set(Sound("twos", 16, 2, 0)), kBadArgument);
  EXPECT_EQ(Set(Sound("ulaw", 16, 2, 0)), kBadArgument);
  EXPECT_FALSE(Settings());
}

TEST_F(AIFFExporter, RefusesASampleSizeOf0InAnUncompressedFormat) {
  for (const auto* const format : kUncompressed) {
    EXPECT_EQ(Set(Sound(format, 0)), kBadArgument) << format;
  }
  EXPECT_FALSE(Settings());
}

TEST_F(AIFFExporter, TakesASampleSizeOf0InACompressedFormat) {
  for (const auto* const format : kCompressed) {
    EXPECT_EQ(Set(Sound(format, 0)), noErr) << format;
    EXPECT_EQ(Settings(), SettingsOf(format, 44100u << 16, 0, 2)) << format;
  }
}

TEST_F(AIFFExporter, TakesTheLargestAndTheSmallestNumbers) {
  EXPECT_EQ(Set(Sound("twos", -1, 0x7FFF, 0xFFFFFFFF)), noErr);
  EXPECT_EQ(Settings(), SettingsOf("twos", 0xFFFFFFFF, 0xFFFF, 0x7FFF));
  EXPECT_EQ(Set(Sound("twos", 1, 1, 1)), noErr);
  EXPECT_EQ(Settings(), SettingsOf("twos", 1, 1, 1));
}

TEST_F(AIFFExporter, ReportsTheSizeFirstAndTheFormatSecond) {
  SoundDescription sound = Sound("mp4a", 0, 0, 0);
  EXPECT_EQ(Set(sound), kUnknownFormat);
  sound.descSize = 0;
  EXPECT_EQ(Set(sound), kBadArgument);
}

TEST_F(AIFFExporter, KeepsTheSoundFromBeforeARefusal) {
  ASSERT_EQ(Set(Sound("twos")), noErr);
  EXPECT_NE(Set(Sound("mp4a")), noErr);
  EXPECT_NE(Set(Sound("sowt", 0)), noErr);
  EXPECT_EQ(Settings(), SettingsOf("twos", 44100u << 16, 16, 2));
}

TEST_F(AIFFExporter, LeavesTheDescriptionsBlockAlone) {
  const Handle block = BlockOf(Sound("twos"));
  const std::string before(*block, sizeof(SoundDescription));
  EXPECT_EQ(Set(block), noErr);
  EXPECT_EQ(std::string(*block, sizeof(SoundDescription)), before);
  EXPECT_EQ(GetHandleSize(block), Size{sizeof(SoundDescription)});
  DisposeHandle(block);
}

TEST_F(AIFFExporter, HasNoSettingsBeforeASoundIsSet) {
  char* bytes = nullptr;
  Handle settings = &bytes;
  EXPECT_EQ(MovieExportGetSettingsAsAtomContainer(mExporter, &settings), kBadArgument);
  EXPECT_EQ(settings, nullptr);
}

TEST_F(AIFFExporter, MakesANewBlockOfSettingsEachTime) {
  ASSERT_EQ(Set(Sound("twos")), noErr);
  const auto before = LiveHandles();
  Handle first = nullptr;
  Handle second = nullptr;
  EXPECT_EQ(MovieExportGetSettingsAsAtomContainer(mExporter, &first), noErr);
  EXPECT_EQ(MovieExportGetSettingsAsAtomContainer(mExporter, &second), noErr);
  EXPECT_NE(first, second);
  EXPECT_EQ(LiveHandles(), before + 2);
  DisposeHandle(first);
  DisposeHandle(second);
}

TEST_F(AIFFExporter, EachInstanceHasItsOwnSound) {
  const ComponentInstance first = mExporter;
  ASSERT_EQ(Set(Sound("twos")), noErr);
  SetUp();
  EXPECT_FALSE(Settings());
  ASSERT_EQ(Set(Sound("ulaw")), noErr);
  CloseComponent(mExporter);
  mExporter = first;
  EXPECT_EQ(Settings(), SettingsOf("twos", 44100u << 16, 16, 2));
}

TEST_F(AIFFExporter, RefusesNullAndClosedInstances) {
  EXPECT_EQ(Set(Handle{nullptr}), kBadArgument);
  EXPECT_EQ(MovieExportGetSettingsAsAtomContainer(mExporter, nullptr), kBadArgument);
  const Handle purged = BlockOf(Sound("twos"));
  *purged = nullptr;
  EXPECT_EQ(Set(purged), kBadArgument);
  DisposeHandle(purged);
  CloseComponent(mExporter);
  char* bytes = nullptr;
  Handle settings = &bytes;
  EXPECT_EQ(Set(Sound("twos")), kBadArgument);
  EXPECT_EQ(MovieExportGetSettingsAsAtomContainer(mExporter, &settings), kBadArgument);
  EXPECT_EQ(settings, nullptr);
}

// The settings of one sound, byte for byte in the published format.
TEST_F(AIFFExporter, WritesTheSettingsInTheirPublishedForm) {
  ASSERT_EQ(Set(Sound("sowt", 24, 6, 0xBB808000)), noErr);
  Handle settings = nullptr;
  ASSERT_EQ(MovieExportGetSettingsAsAtomContainer(mExporter, &settings), noErr);
  const auto header = [](std::string_view size, std::string_view type, char children) {
    return std::string(size)
        .append(type)
        .append("\0\0\0\1\0\0\0", 7)
        .append(1, children)
        .append(4, '\0');
  };
  const std::string expected =
      std::string(12, '\0') + header({"\0\0\0\x84", 4}, "sean", 1) +
      header({"\0\0\0\x70", 4}, "soun", 4) + header({"\0\0\0\x18", 4}, "ssct", 0) + "sowt" +
      header({"\0\0\0\x18", 4}, "ssrt", 0) + std::string("\xBB\x80\x80\0", 4) +
      header({"\0\0\0\x16", 4}, "ssss", 0) + std::string("\0\x18", 2) +
      header({"\0\0\0\x16", 4}, "sscc", 0) + std::string("\0\6", 2);
  EXPECT_EQ(std::string(*settings, static_cast<std::size_t>(GetHandleSize(settings))), expected);
  DisposeHandle(settings);
}

}  // namespace
}  // namespace tallowmere::quicktime::test
