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

// A name as UTF-16 in the HFS view: '/' is ordinary, ':' does not occur.
struct HFSUniStr255 {
  UInt16 length;  // in UTF-16 units
  UniChar unicode[255];
};

// Which catalog information is wanted.
using FSCatalogInfoBitmap = UInt32;
enum : FSCatalogInfoBitmap {
  kFSCatInfoNone = 0,
  kFSCatInfoVolume = 4,
  kFSCatInfoNodeID = 16,
};

struct FSCatalogInfo {
  SInt16 volume;
  UInt32 nodeID;
};

// What the catalog says of an existing item; each output may be null. `catalogInfo` has the fields
// that `whichInfo` asks for, `outName` the item's name, `fsSpec` its record: the volume and the id
// of the folder that really holds it, and its HFS name in it, or the volume's name under parent id
// 1 for a volume's root. `parentRef` is the folder that holds it, all zero for a volume's root.
// fnfErr for an item that is gone; nsvErr for one on no volume.
OSErr FSGetCatalogInfo(const FSRef* ref, FSCatalogInfoBitmap whichInfo, FSCatalogInfo* catalogInfo,
                       HFSUniStr255* outName, FSSpec* fsSpec, FSRef* parentRef);

// The item, file or folder, with a node id on a volume; id 2 is the volume's root folder.
// nsvErr for an unknown volume; fnfErr when no item has the id, or when that is not certain.
OSErr FSResolveNodeID(SInt16 volume, UInt32 nodeID, FSRef* outRef);

// The item with a name in a folder. Ignores the encoding hint. fnfErr when there is none,
// errFSNotAFolder when `parentRef` is no folder.
OSErr FSMakeFSRefUnicode(const FSRef* parentRef, UniCharCount nameLength, const UniChar* name,
                         TextEncoding textEncodingHint, FSRef* newRef);

// The record of an item by a volume, a folder on it and a name or HFS path, a Str255: with a colon
// inside and none in front a full path, for which volume and folder do not count; else relative to
// the folder. Each further adjacent colon climbs one level, a colon at the end names the folder
// itself, an empty name is the given folder. Volume 0 and folder 0 are the current directory;
// folder 0 is else the volume's root. Links to folders on the way are followed. fnfErr with the
// record filled when only the last name is missing; dirNFErr when a folder on the way is missing or
// no folder; nsvErr for an unknown volume; bdNamErr for a missing last name that no record can
// hold.
OSErr FSMakeFSSpec(SInt16 vRefNum, SInt32 dirID, ConstStr255Param fileName, FSSpec* spec);

// The existing item that a record names. fnfErr when there is none, dirNFErr when its folder is
// missing, nsvErr for an unknown volume.
OSErr FSpMakeFSRef(const FSSpec* spec, FSRef* newRef);

// What PBGetCatInfoSync takes and gives for a folder by its id.
struct DirInfo {
  StringPtr ioNamePtr;  // out: the folder's name as a Str255; null: not wanted
  SInt16 ioVRefNum;     // in: the folder's volume
  SInt16 ioFDirIndex;   // in: -1
  SInt32 ioDrDirID;     // in: the folder's id
  SInt32 ioDrParID;     // out: the id of the folder that holds it
};
union CInfoPBRec {
  DirInfo dirInfo;
};
using CInfoPBPtr = CInfoPBRec*;

// Name and parent of the folder with an id. The name has at most 255 bytes. nsvErr for an unknown
// volume; dirNFErr when no folder has the id; paramErr for another index than -1.
OSErr PBGetCatInfoSync(CInfoPBPtr paramBlock);

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
