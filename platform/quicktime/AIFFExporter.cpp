#include "quicktime/AIFFExporter.h"

#include <algorithm>

#include "quicktime/AtomContainer.h"
#include "quicktime/FourCharacterCode.h"

namespace tallowmere::quicktime {
namespace {

struct Format {
  OSType code;
  bool isCompressed;  // its name alone determines the bits per sample
};

constexpr Format kFormats[] = {
    {FourCharacterCode("NONE"), false}, {FourCharacterCode("raw "), false},
    {FourCharacterCode("twos"), false}, {FourCharacterCode("sowt"), false},
    {FourCharacterCode("in24"), false}, {FourCharacterCode("in32"), false},
    {FourCharacterCode("fl32"), false}, {FourCharacterCode("fl64"), false},
    {FourCharacterCode("ulaw"), true},  {FourCharacterCode("alaw"), true},
    {FourCharacterCode("ima4"), true},  {FourCharacterCode("MAC3"), true},
    {FourCharacterCode("MAC6"), true},
};

const Format* FindFormat(OSType code) {
  const auto* const found = std::find_if(std::begin(kFormats), std::end(kFormats),
                                         [code](const Format& row) { return row.code == code; });
  return found == std::end(kFormats) ? nullptr : found;
}

constexpr OSType kRootAtom = FourCharacterCode("sean");
constexpr OSType kFormatAtom = FourCharacterCode("ssct");
constexpr OSType kRateAtom = FourCharacterCode("ssrt");
constexpr OSType kSampleSizeAtom = FourCharacterCode("ssss");
constexpr OSType kChannelsAtom = FourCharacterCode("sscc");

}  // namespace

OSErr AIFFExporter::SetSound(const SoundDescription& sound) {
  if (sound.descSize != sizeof sound) return paramErr;
  const Format* const format = FindFormat(sound.dataFormat);
  if (format == nullptr) return badFormat;
  if (sound.numChannels < 1 || sound.sampleRate == 0) return paramErr;
  if (sound.sampleSize == 0 && !format->isCompressed) return paramErr;
  mSound = sound;
  return noErr;
}

std::string AIFFExporter::Settings() const {
  constexpr UInt16 kLeaves = 4;
  AtomContainer settings;
  const std::size_t root = settings.Open(kRootAtom, 1);
  const std::size_t sound = settings.Open(SoundMediaType, kLeaves);
  settings.AddLeaf(kFormatAtom, mSound->dataFormat);
  settings.AddLeaf(kRateAtom, mSound->sampleRate);
  settings.AddLeaf(kSampleSizeAtom, static_cast<UInt16>(mSound->sampleSize));
  settings.AddLeaf(kChannelsAtom, static_cast<UInt16>(mSound->numChannels));
  settings.Close(sound);
  settings.Close(root);
  return settings.Take();
}

}  // namespace tallowmere::quicktime
