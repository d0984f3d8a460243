// The scalar types, strings and result codes that every host interface is written in.
// Widths are fixed; a Str255 or Str63 is a Pascal string: one length byte, then that many bytes of
// text, the rest of the array unspecified.
#pragma once

#include <cstdint>

using UInt8 = std::uint8_t;
using SInt8 = std::int8_t;
using UInt16 = std::uint16_t;
using SInt16 = std::int16_t;
using UInt32 = std::uint32_t;
using SInt32 = std::int32_t;

using Boolean = unsigned char;  // 0 or 1
using UniChar = UInt16;         // one UTF-16 unit
using UniCharCount = unsigned long;
using TextEncoding = UInt32;
using ByteCount = unsigned long;
using ItemCount = unsigned long;
using OptionBits = UInt32;

using OSErr = SInt16;     // a platform result code, 0 for success
using OSStatus = SInt32;  // the same codes in 32 bits

using Str63 = unsigned char[64];
using Str255 = unsigned char[256];
using StringPtr = unsigned char*;
using ConstStr255Param = const unsigned char*;

// Result codes, each with the published constant's name.
enum : OSErr {
  noErr = 0,
  nsvErr = -35,                // no such volume
  ioErr = -36,                 // input or output failed
  bdNamErr = -37,              // an impossible name
  fnfErr = -43,                // no such item
  paramErr = -50,              // an invalid argument
  memFullErr = -108,           // not enough memory
  dirNFErr = -120,             // no such folder
  badFormat = -206,            // a sound format that is not supported
  errFSBadFSRef = -1401,       // a reference to no item
  errFSNotAFolder = -1407,     // not a folder
  errFSRefsDifferent = -1420,  // two references to different items
  afpAccessDenied = -5000,     // permission denied
};
