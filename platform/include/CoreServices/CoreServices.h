// The File Manager and its Pascal-string helpers, under the host's spelling.
//
// Every call answers with a platform result code and never throws. One thread at a time.
#pragma once

#include <CoreFoundation/CoreFoundation.h>
#include <MacTypes.h>

#include <cstddef>

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

// --- Files ------------------------------------------------------------------------------------

// A reference to an existing item, taken by CFURLGetFSRef. It follows its item through a rename
// within the process. All bytes zero: no item.
struct FSRef {
  UInt8 hidden[80];
};
static_assert(sizeof(FSRef) == 80);

// An item by its volume, the id of the folder that holds it, and its HFS name in that folder. It
// may name an item that does not exist yet.
#pragma pack(push, 2)
struct FSSpec {
  SInt16 vRefNum;
  SInt32 parID;
  Str63 name;
};
#pragma pack(pop)
static_assert(sizeof(FSSpec) == 70);
static_assert(offsetof(FSSpec, parID) == 2);
static_assert(offsetof(FSSpec, name) == 6);

// Whether two references are to the same item, by what they hold: noErr, or errFSRefsDifferent.
// errFSBadFSRef when one of them is null or to no item.
OSErr FSCompareFSRefs(const FSRef* first, const FSRef* second);

// --- Aliases ----------------------------------------------------------------------------------
//
// Only a Finder alias is an alias, and Linux has none: a symbolic link is not one.

enum : unsigned long { kResolveAliasFileNoUI = 1 };

// Puts the target of the alias `item` in its place; with `resolveAliasChains` the last one of a
// chain. Says, each unless null, whether the target is a folder and whether `item` was an alias at
// all: never, so noErr leaves `item` as it is, without a look at whether it still exists. fnfErr
// when `item` is null or no item; nothing is written then.
OSErr FSResolveAliasFile(FSRef* item, Boolean resolveAliasChains, Boolean* targetIsFolder,
                         Boolean* wasAliased);

// The same; `mountFlags` (0 or kResolveAliasFileNoUI) says whether volumes that have to be mounted
// may ask the user.
OSErr FSResolveAliasFileWithMountFlags(FSRef* item, Boolean resolveAliasChains,
                                       Boolean* targetIsFolder, Boolean* wasAliased,
                                       unsigned long mountFlags);
}
