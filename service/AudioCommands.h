// The export settings for AIFF sound files, from the host's movie exporter.
#pragma once

#include <QuickTime/QuickTime.h>

// Stores the exporter's settings for a sound in `settings`, as a block: an atom container. The rate
// is in hertz, unsigned 16.16, in 32 bits; of the sample size, in bits, the low 16 bits count; the
// format is a four-character code.
//
// Returns a platform result code of 16 bits: noErr, protocol::kNoAIFFExporter when there is no
// exporter, or the code of the host's call that failed. `settings` is null unless a call left a
// block, which the caller owns. The exporter's instance that made it stays open until the process
// ends.
OSStatus GetAIFFExportSettingsThroughIPC(char*** settings, unsigned long sampleRate,
                                         unsigned long sampleSize, unsigned char channels,
                                         unsigned long dataFormat);
