// The sounds that an exporter of AIFF and AIFF-C files accepts, and its settings for them.
#pragma once

#include <QuickTime/QuickTime.h>

#include <optional>
#include <string>

namespace tallowmere::quicktime {

class AIFFExporter {
 public:
  // Selects the sound to export and returns noErr. Any other result changes nothing:
  //
  //   paramErr   the size is not a sound description's, there are no channels, the rate is 0, or
  //              the sample size is 0 in an uncompressed format
  //   badFormat  a format that the files cannot hold
  //
  // With more than one fault, the size takes precedence, then the format.
  OSErr SetSound(const SoundDescription& sound);

  bool HasSound() const { return mSound.has_value(); }

  // The settings for the sound: an atom container. Its root holds the atom 'soun', which in turn
  // holds the format 'ssct' (32 bits), the rate 'ssrt' (in hertz, unsigned 16.16), the sample size
  // 'ssss' (in bits, 16 bits) and the channels 'sscc' (16 bits). REQUIRES: HasSound().
  std::string Settings() const;

 private:
  std::optional<SoundDescription> mSound;
};

}  // namespace tallowmere::quicktime
