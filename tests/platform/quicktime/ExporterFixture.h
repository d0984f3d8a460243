// An open exporter, and descriptions of sounds for it.
#pragma once

#include <QuickTime/QuickTime.h>
#include <gtest/gtest.h>

#include <cstring>
#include <string_view>

namespace tallowmere::quicktime::test {

// Returns "twos" and the like as a number.
inline OSType CodeOf(std::string_view text) {
  OSType code = 0;
  for (const char c : text) code = code * 256 + static_cast<unsigned char>(c);
  return code;
}

inline SoundDescription Sound(std::string_view format, SInt16 sampleSize = 16, SInt16 channels = 2,
                              UnsignedFixed rate = 44100u << 16) {
  SoundDescription sound{};
  sound.descSize = 36;
  sound.dataFormat = CodeOf(format);
  sound.numChannels = channels;
  sound.sampleSize = sampleSize;
  sound.sampleRate = rate;
  return sound;
}

// Returns a new block with the description. The caller disposes of it.
inline Handle BlockOf(const SoundDescription& sound) {
  const Handle block = NewHandleClear(sizeof sound);
  std::memcpy(*block, &sound, sizeof sound);
  return block;
}

class WithExporter : public testing::Test {
 protected:
  void SetUp() override {
    ComponentDescription looking{MovieExportType, kQTFileTypeAIFF, SoundMediaType, 0, 0};
    ASSERT_EQ(OpenAComponent(FindNextComponent(nullptr, &looking), &mExporter), noErr);
  }
  void TearDown() override { CloseComponent(mExporter); }

  ComponentResult Set(Handle block, OSType mediaType = SoundMediaType) {
    return MovieExportSetSampleDescription(
        mExporter, reinterpret_cast<SampleDescriptionHandle>(block), mediaType);
  }
  ComponentResult Set(const SoundDescription& sound, OSType mediaType = SoundMediaType) {
    const Handle block = BlockOf(sound);
    const ComponentResult result = Set(block, mediaType);
    DisposeHandle(block);
    return result;
  }

  ComponentInstance mExporter = nullptr;
};

}  // namespace tallowmere::quicktime::test
