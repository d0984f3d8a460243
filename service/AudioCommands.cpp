#include "service/AudioCommands.h"

#include "service/Commands.h"
#include "service/Protocol.h"

namespace {

// A new block that describes a sound; the caller owns it. Null when there is not enough memory.
Handle NewSoundDescription(unsigned long sampleRate, unsigned long sampleSize,
                           unsigned char channels, unsigned long dataFormat) {
  const Handle block = NewHandleClear(sizeof(SoundDescription));
  if (block == nullptr) return nullptr;
  auto* const description = reinterpret_cast<SoundDescription*>(*block);
  description->descSize = sizeof(SoundDescription);
  description->dataFormat = static_cast<OSType>(dataFormat);
  description->numChannels = channels;
  description->sampleSize = static_cast<SInt16>(sampleSize);
  description->sampleRate = static_cast<UnsignedFixed>(sampleRate);
  return block;
}

}  // namespace

OSStatus GetAIFFExportSettingsThroughIPC(char*** settings, unsigned long sampleRate,
                                         unsigned long sampleSize, unsigned char channels,
                                         unsigned long dataFormat) {
  *settings = nullptr;
  ComponentDescription looking{MovieExportType, kQTFileTypeAIFF, SoundMediaType, 0, 0};
  const Component component = FindNextComponent(nullptr, &looking);
  if (component == nullptr) return tallowmere::protocol::kNoAIFFExporter;
  OSErr result = GetComponentInfo(component, &looking, nullptr, nullptr, nullptr);
  if (result != noErr) return result;
  ComponentInstance exporter = nullptr;
  result = OpenAComponent(component, &exporter);
  if (result != noErr) return result;

  const Handle description = NewSoundDescription(sampleRate, sampleSize, channels, dataFormat);
  if (description == nullptr) {
    CloseComponent(exporter);
    return memFullErr;
  }
  // Movie export returns 32 bits; the response carries 16.
  result = static_cast<OSErr>(MovieExportSetSampleDescription(
      exporter, reinterpret_cast<SampleDescriptionHandle>(description), SoundMediaType));
  DisposeHandle(description);
  if (result != noErr) {
    CloseComponent(exporter);
    return result;
  }
  return static_cast<OSErr>(MovieExportGetSettingsAsAtomContainer(exporter, settings));
}

namespace tallowmere::service {

// The settings stay in memory, as does the instance that made them; only the end of the process
// frees them.
void GetAIFFExportSettings(Channel& channel) {
  const auto sampleRate = channel.Take<std::uint32_t>();
  const auto sampleSize = channel.Take<std::uint32_t>();
  const auto channels = channel.Take<std::uint8_t>();
  const auto dataFormat = channel.Take<std::uint32_t>();
  if (channel.Failed()) return;

  Handle settings = nullptr;
  const OSStatus result =
      GetAIFFExportSettingsThroughIPC(&settings, sampleRate, sampleSize, channels, dataFormat);
  const auto size = static_cast<std::uint32_t>(GetHandleSize(settings));
  const char* const bytes = settings == nullptr ? nullptr : *settings;

  channel.Put(static_cast<std::int16_t>(result));
  channel.Put(size);
  if (size != 0 && bytes == nullptr) channel.Fail();
  channel.PutBytes(bytes, size);
}

}  // namespace tallowmere::service
