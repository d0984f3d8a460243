// What travels on the two pipes: the constants that the service and its clients share.
//
// All integers are in the byte order of the machine that runs both processes. A request is a code
// (16 bits), followed by the command's fields; a response is the command's fields, followed by the
// trailer.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace tallowmere::protocol {

enum RequestCode : std::uint16_t {
  kRequestQuit = 0,
  kRequestMakeFullPath = 1,
  kRequestMakeFileRefFromPath = 2,
  kRequestGetVolRefnumByHFSName = 3,
  kRequestGetHFSVolumeName = 4,
  kRequestGetHFSName = 5,
  kRequestAddHFSName = 6,
  kRequestGetFSSpec = 7,
  kRequestSetFileRefFromFSSpecData = 8,
  kRequestSetFileRefFromFSSpec = 9,
  kRequestGetAIFFExportSettings = 10,
};

inline constexpr std::uint16_t kLastRequestCode = kRequestGetAIFFExportSettings;

// Ends every complete response, and nothing else.
inline constexpr std::string_view kTrailer = "MWLT";

// The longest volume name in a request, in bytes with its NUL.
inline constexpr std::size_t kLongestVolumeName = 256;

// The longest HFS name in a request, in bytes with its NUL.
inline constexpr std::size_t kLongestHFSName = 1024;

// The longest HFS path, in bytes without a NUL: its length travels on in one byte.
inline constexpr std::size_t kLongestHFSPath = 255;

// Separates the names of an HFS path.
inline constexpr char kSeparator = ':';

// An FSSpec record: the volume reference number (16 bits), the id of the parent folder (32 bits)
// and the name, a length byte and room for 63 bytes, of which those after the name are unspecified.
inline constexpr std::size_t kFileSpecSize = 70;
inline constexpr std::size_t kLongestSpecName = 63;

// Stands for "no volume" where a volume reference number is expected.
inline constexpr std::int16_t kNoVolume = 32767;

// The result of kRequestGetAIFFExportSettings when there is no exporter for AIFF files.
inline constexpr std::int16_t kNoAIFFExporter = -2005;

}  // namespace tallowmere::protocol
