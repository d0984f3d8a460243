// Between file references and what the File Manager calls a file: FSSpec records, HFS names, HFS
// full paths, volume and folder numbers.
//
// An HFS name is a Pascal string of 8-bit text in which ':' separates and '/' is an ordinary
// character; a POSIX name has it the other way round. An HFS full path is the volume's name, the
// folders from the top down, each followed by ':', and for an item its name. A volume is named by
// its volume reference number, kNoVolume for none.
//
// Nothing here throws, logs or retries. C strings are 8-bit HFS text; those that become a Pascal
// string are cut to 255 bytes. Where an FSSpec is read, a name length above 63 counts as 63. A flag
// called `last` changes nothing. Pointers are not null unless a comment allows it. One thread at a
// time, as for CFileRef.
#pragma once

#include <CoreFoundation/CoreFoundation.h>
#include <CoreServices/CoreServices.h>

#include "CFileRef.h"

// --- Names ------------------------------------------------------------------------------------
//
// 8-bit text is tried in CFileRef::mLocalEncoding, in Mac Roman and in the system's encoding.

// The longest name in an FSSpec, in bytes.
inline constexpr unsigned char kLongestSpecName = sizeof(Str63) - 1;

// Writes a name as a Pascal string of at most `bufferSize` bytes, the length byte among them, with
// '/' and ':' exchanged. False when no encoding has all of it or it does not fit: then as much of
// it as fits in Mac Roman, with '?' for what that lacks and nothing exchanged; or, when not one
// character could be converted, "(str_conversion_err)" cut to the buffer. False too, and nothing is
// written, for a size below 1.
bool GetPascalStringFromCFString(CFStringRef name, StringPtr buffer, SInt32 bufferSize);

// The name with each '/' made ':', owned by the caller. Null for null, and when no encoding has the
// bytes or there is no memory.
CFMutableStringRef CreateCFStringFromPascalString(ConstStr255Param pascalName);

// A copy whose name length is at most 63, whatever came in over the wire.
FSSpec BoundedFSSpec(FSSpec const& spec);

// --- Records and references -------------------------------------------------------------------

// Makes `ref` name what the record names: the existing item; failing that, with
// `searchOtherVolumes`, the existing item with the same folder id and name on another volume;
// failing that the name, each '/' made ':', in the folder of the record; and where there is no such
// folder, the name alone as the whole path. True when it names one of these, even when the name has
// no URL and leaves it empty. False with the reference empty for a null record and for an empty
// name in an unknown folder; false for a null `ref`.
bool CFileUtilSetFileRefFromDeprecatedFSSpecThroughIPC(CFileRef* ref, FSSpec const* spec,
                                                       bool searchOtherVolumes, bool last);

// The same, other volumes searched, for the record that FSMakeFSSpec makes of a volume, a folder
// and a name or path; only the last component may be missing. False, with the reference as it was,
// when there is no such record.
bool CFileUtilSetFileRefFromFSSpecData(CFileRef* ref, short vRefNum, long dirID, char const* name,
                                       bool last);

// Writes the reference's FSSpec, whatever it is; true when it has a volume, a folder and a name.
bool CFileUtilGetDeprecatedFSSpecThroughIPC(CFileRef const& ref, FSSpec* spec);

// Adds a name. In an existing folder it is an HFS name: of an existing item, which is then named
// itself, or else with each '/' made ':'. Below anything else the name is added as it stands, as
// UTF-8. `flag` is AddToPath's folder flag, whose result this is. False for null.
bool CFileUtilAddHFSName(CFileRef* ref, char const* name, bool flag);

// Make a record, or a reference to an existing item, of a folder's full path (or null) and a name
// (or null), joined by ':'. With `joinSecond` a second C string follows the first in memory and is
// a part of the folder's path. The length of the joined path is taken modulo 256. The result is
// FSMakeFSSpec's: for the record, fnfErr means that only the last component is missing, and with any
// other error nothing is written; a reference is as it was unless the result is noErr.
OSErr CFileUtilMakeFSSpecFromPath(FSSpec* spec, char const* hfsFolderPath, char const* name,
                                  unsigned char joinSecond);
OSErr CFileUtilMakeFileRefFromPath(CFileRef* ref, char const* hfsFolderPath, char const* name,
                                   unsigned char joinSecond);

// --- Full paths and volumes -------------------------------------------------------------------

// The length of the HFS full path of a folder, or of the folder that holds anything else. At most
// 511 bytes of folders are in it, the innermost ones; ":" stands for an unknown volume. Unless
// `path` is null, writes that path there in less than `maxLength` bytes, the outer folders replaced
// by "..." where it is too long; with `keepFolders` 0, only the volume's name is left of it.
// REQUIRES: `path` has `maxLength` bytes, at least 6 more than the volume's name has. With fewer
// the call never returns when the path cannot be made to fit.
unsigned short CFileUtilMakeFullPath(CFileRef const& ref, char* path, unsigned short maxLength,
                                     unsigned char keepFolders);

// The first mounted volume with this very name, letter case included.
short CFileUtilGetVolRefnumByHFSName(char const* volumeName);

// Writes a volume's name into a buffer of 256 bytes; an empty one and false for an unknown volume.
bool CFileUtilGetHFSVolumeName(short vRefNum, char* volumeName);

// Writes the name in the FSSpec of an existing item. False with an empty name when it does not fit
// into `size` bytes with its NUL; false with the buffer as it was for an item that does not exist,
// for null and for size 0.
bool CFileUtilGetHFSName(CFileRef const& ref, char* name, unsigned short size);
