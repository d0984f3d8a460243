// The File Manager and its Pascal-string helpers, under the host's spelling.
//
// Every call returns a platform result code and never throws. One thread at a time.
#pragma once

#include <CoreFoundation/CoreFoundation.h>
#include <MacTypes.h>

#include <cstddef>

extern "C" {

// --- Pascal strings ---------------------------------------------------------------------------

// Copies the C string `source` into the Pascal string `destination`, at most 255 bytes of it.
// REQUIRES: `destination` has room for the text and one byte more, 256 bytes at most.
void c2pstrcpy(StringPtr destination, const char* source);

// Copies the Pascal string `source` into `destination` as a C string.
// REQUIRES: `destination` has room for the text and its NUL.
void p2cstrcpy(char* destination, ConstStr255Param source);

// Turns the Pascal string into a C string in place. REQUIRES: its buffer has one byte more than the
// text, as every Str255 and Str63 has.
void P2CStr(StringPtr string);

// --- Volumes ----------------------------------------------------------------------------------
//
// A mounted volume is identified by its volume reference number, a negative 16-bit number that it
// keeps while it stays mounted; as an input, 0 is the volume of "/".

// The input and output of PBHGetVInfoSync.
struct HVolumeParam {
  StringPtr ioNamePtr;  // out: the volume's name as a Str255; null: the name is not wanted
  SInt16 ioVRefNum;     // in when ioVolIndex is 0; out: the volume's number
  SInt16 ioVolIndex;    // position in the list of volumes from 1, or 0: look up by ioVRefNum
};
union HParamBlockRec {
  HVolumeParam volumeParam;
};
using HParmBlkPtr = HParamBlockRec*;

// The name and number of the volume at an index or with a number. nsvErr when there is none (an
// index past the last or below 0, an unknown number); the block is then unchanged. Volume names
// have at most 63 bytes. Asking for index 1, 2, 3, … in sequence walks one snapshot of the list,
// even when something is mounted in between.
OSErr PBHGetVInfoSync(HParmBlkPtr paramBlock);

// The input and output of PBGetVolumeInfoSync.
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

// A reference to an existing item, obtained with CFURLGetFSRef. It follows its item through a
// rename within the process. All bytes zero: no item.
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

// Whether both references refer to the same item, judged by their content: noErr or
// errFSRefsDifferent. errFSBadFSRef when one of them is null or refers to no item.
OSErr FSCompareFSRefs(const FSRef* first, const FSRef* second);

// A name as UTF-16 in the HFS view: '/' is an ordinary character, ':' does not occur.
struct HFSUniStr255 {
  UInt16 length;  // in UTF-16 units
  UniChar unicode[255];
};

// Selects catalog information.
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

// What the catalog says of an existing item. fnfErr for an item that is gone; nsvErr for one on no
// volume. Each output may be null:
//
//   catalogInfo  the fields that `whichInfo` selects
//   outName      the item's name
//   fsSpec       the item's record: its volume, the id of the folder that really holds it and its
//                HFS name there; for a volume's root, parent id 1 and the volume's name
//   parentRef    the folder that holds it; all zero for a volume's root
OSErr FSGetCatalogInfo(const FSRef* ref, FSCatalogInfoBitmap whichInfo, FSCatalogInfo* catalogInfo,
                       HFSUniStr255* outName, FSSpec* fsSpec, FSRef* parentRef);

// The item, file or folder, with a node id on a volume; id 2 is the volume's root folder.
// nsvErr for an unknown volume; fnfErr when no item has the id, or when that is not certain.
OSErr FSResolveNodeID(SInt16 volume, UInt32 nodeID, FSRef* outRef);

// The item with a name in a folder. Ignores the encoding hint. fnfErr when there is none,
// errFSNotAFolder when `parentRef` is no folder.
OSErr FSMakeFSRefUnicode(const FSRef* parentRef, UniCharCount nameLength, const UniChar* name,
                         TextEncoding textEncodingHint, FSRef* newRef);

// The record of an item, given a volume, a folder on it and a name or HFS path, a Str255. A colon
// within the path, and none at its beginning, makes it a full path, for which volume and folder are
// ignored; any other is relative to the folder. Each further adjacent colon climbs one level, a
// trailing colon names the folder itself, an empty name the given folder. Volume 0 with folder 0 is
// the current directory; with any other volume, folder 0 is the volume's root. Links to folders are
// followed on the way.
//
//   fnfErr    only the last name is missing; the record is filled in
//   dirNFErr  a folder on the way is missing or is not a folder
//   nsvErr    unknown volume
//   bdNamErr  the last name is missing and no record can hold it
OSErr FSMakeFSSpec(SInt16 vRefNum, SInt32 dirID, ConstStr255Param fileName, FSSpec* spec);

// The existing item that a record names. fnfErr when there is none, dirNFErr when its folder is
// missing, nsvErr for an unknown volume.
OSErr FSpMakeFSRef(const FSSpec* spec, FSRef* newRef);

// The input and output of PBGetCatInfoSync for a folder given by its id.
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

// The name and the parent of the folder with an id. The name has at most 255 bytes. nsvErr for an
// unknown volume; dirNFErr when no folder has the id; paramErr for any index but -1.
OSErr PBGetCatInfoSync(CInfoPBPtr paramBlock);

// --- Aliases ----------------------------------------------------------------------------------
//
// A file is an alias when it holds a bookmark, or an alias record in its resource fork, wherever
// Linux keeps that; docs/platform.md has the rules by which its target is found. A symbolic link is
// not an alias.

enum : unsigned long { kResolveAliasFileNoUI = 1 };

// Replaces the alias file `item` by its target; with `resolveAliasChains`, by the last target of a
// chain of at most 64 steps. Stores, each unless null, whether the item that `item` refers to in
// the end is a folder, and whether `item` was an alias, also when its target is not found. `item`
// stays as it is when it is no alias (noErr) and on every error:
//
//   fnfErr           no such target, or it is not certain which it is; no such item; a ring
//   dirNFErr         a folder on the way is missing
//   nsvErr           its volume is not mounted
//   paramErr         the record or bookmark is broken
//   afpAccessDenied  permission refused, for the file or for its target
//
// Nothing is stored when `item` is null or no item: fnfErr.
OSErr FSResolveAliasFile(FSRef* item, Boolean resolveAliasChains, Boolean* targetIsFolder,
                         Boolean* wasAliased);

// The same: nothing is ever mounted and nobody asked, whatever `mountFlags` (0 or
// kResolveAliasFileNoUI).
OSErr FSResolveAliasFileWithMountFlags(FSRef* item, Boolean resolveAliasChains,
                                       Boolean* targetIsFolder, Boolean* wasAliased,
                                       unsigned long mountFlags);
}
