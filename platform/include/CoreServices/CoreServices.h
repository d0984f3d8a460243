// The File Manager and its Pascal-string helpers, under the host's spelling.
//
// Every call answers with a platform result code and never throws. One thread at a time.
#pragma once

#include <CoreFoundation/CoreFoundation.h>
#include <MacTypes.h>

extern "C" {

// --- Pascal strings ---------------------------------------------------------------------------

// Copies the C string `source` into the Pascal string `destination`, at most 255 bytes of it.
// REQUIRES: `destination` has room for one byte more than the text, 256 in all at the most.
void c2pstrcpy(StringPtr destination, const char* source);

// Copies the Pascal string `source` into `destination` as a C string.
// REQUIRES: `destination` has room for the text and its NUL.
void p2cstrcpy(char* destination, ConstStr255Param source);

// Turns the Pascal string into a C string in place. REQUIRES: its buffer has one byte more than the
// text, which every Str255 and Str63 has.
void P2CStr(StringPtr string);

// --- Volumes ----------------------------------------------------------------------------------
//
// A mounted volume is named by its volume reference number, a negative 16-bit number that it keeps
// while it stays mounted; 0 as an input is the volume of "/".

// What PBHGetVInfoSync takes and gives.
struct HVolumeParam {
  StringPtr ioNamePtr;  // out: the volume's name as a Str255; null: the name is not wanted
  SInt16 ioVRefNum;     // in when ioVolIndex is 0; out: the volume's number
  SInt16 ioVolIndex;    // position in the list of volumes from 1, or 0: look up by ioVRefNum
};
union HParamBlockRec {
  HVolumeParam volumeParam;
};
using HParmBlkPtr = HParamBlockRec*;

// Name and number of the volume at an index or with a number. nsvErr when there is none (past the
// last index, an index below 0, an unknown number); the block is then unchanged.
// Volume names have at most 63 bytes. Asking for index 1, 2, 3, … one after the other walks one
// state of the list, even when something is mounted in between.
OSErr PBHGetVInfoSync(HParmBlkPtr paramBlock);

// What PBGetVolumeInfoSync takes and gives.
using FSVolumeInfoBitmap = UInt32;
enum : FSVolumeInfoBitmap { kFSVolInfoNone = 0 };
struct FSVolumeInfoParam {
  SInt16 ioVRefNum;              // in when volumeIndex is 0; out: the volume's number
  UInt32 volumeIndex;            // position in the list of volumes from 1, or 0: by ioVRefNum
  FSVolumeInfoBitmap whichInfo;  // kFSVolInfoNone
};
using FSVolumeInfoParamPtr = FSVolumeInfoParam*;

// The number of the volume at an index or with a number, with the results of PBHGetVInfoSync.
OSErr PBGetVolumeInfoSync(FSVolumeInfoParamPtr paramBlock);
}
