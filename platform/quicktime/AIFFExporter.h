// What an exporter of AIFF and AIFF-C files takes, and its settings for it.
#pragma once

#include <QuickTime/QuickTime.h>

#include <optional>
#include <string>

namespace tallowmere::quicktime {

class AIFFExporter {
 public:
  // noErr, and the sound is the one to export from now on. Otherwise all stays as it was: paramErr
  // for a size that is not a sound description's, no channels, a rate of 0, or a sample size of 0
  // in an uncompressed format; badFormat for a format that the files cannot hold. With more than
  // one fault, the size counts first, the format second.
  OSErr SetSound(const SoundDescription& sound);

  bool HasSound() const { return mSound.has_value(); }

  // The settings for the sound, an atom container. In its root is the atom 'soun', and in that the
  // format 'ssct' (32 bits), the rate 'ssrt' (in hertz, unsigned 16.16), the sample size 'ssss' (in
  // bits, 16 bits) and the channels 'sscc' (16 bits). REQUIRES: HasSound().
  std::string Settings() const;

 private:
  std::optional<SoundDescription> mSound;
};

}  // namespace tallowmere::quicktime
