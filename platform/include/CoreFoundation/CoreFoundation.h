// Strings, URLs and their encodings, under the host's spelling.
#pragma once

#include <MacTypes.h>

// Which 8-bit or Unicode encoding a run of bytes is in. The numbers are the published ones.
using CFStringEncoding = UInt32;
enum : CFStringEncoding {
  kCFStringEncodingMacRoman = 0,
};
