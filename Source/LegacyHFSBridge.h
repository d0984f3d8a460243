// Converts between file references and the File Manager's names for files: FSSpec records, HFS
// names, HFS full paths, volume and folder numbers.
//
// An HFS name is a Pascal string of 8-bit text in which ':' separates and '/' is an ordinary
// character; in a POSIX name it is the reverse. An HFS full path is the volume's name and the
// folders from the top down, each followed by ':', then, for an item, its name. A volume is given
// by its volume reference number; kNoVolume stands for none.
//
// Nothing here throws, logs or retries. C strings are 8-bit HFS text; those that become a Pascal
// string are cut to 255 bytes. In an FSSpec that is read, a name length above 63 counts as 63. A
// flag called `last` has no effect. Pointers must not be null unless a comment allows it. One
// thread at a time, as for CFileRef.
#pragma once

#include <CoreFoundation/CoreFoundation.h>
#include <CoreServices/CoreServices.h>

#include "CFileRef.h"

// --- Names ------------------------------------------------------------------------------------
//
// 8-bit text is tried in CFileRef::mLocalEncoding, then in Mac Roman, then in the system's
// encoding.

// The longest name in an FSSpec, in bytes.
inline constexpr unsigned char kLongestSpecName = sizeof(Str63) - 1;

// Writes a name, with '/' and ':' exchanged, as a Pascal string of at most `bufferSize` bytes, the
// length byte included. When no encoding has all of its characters or it does not fit, returns
// false and writes as much as fits in Mac Roman, with '?' for what that lacks and nothing
// exchanged; or, when not one character could be converted, "(str_conversion_err)" cut to the
// buffer. For a size below 1, returns false and writes nothing.
bool GetPascalStringFromCFString(CFStringRef name, StringPtr buffer, SInt32 bufferSize);

// The name with each '/' replaced by ':', owned by the caller. Null for null, and when no encoding
// accepts the bytes or there is not enough memory.
CFMutableStringRef CreateCFStringFromPascalString(ConstStr255Param pascalName);

// A copy whose name length is at most 63, whatever arrived over the wire.
FSSpec BoundedFSSpec(FSSpec const& spec);

// --- Records and references -------------------------------------------------------------------

// Makes `ref` name the first of these that applies:
//
//   1. the existing item that the record names;
//   2. with `searchOtherVolumes`, the existing item with the same folder id and name on another
//      volume;
//   3. the name, each '/' replaced by ':', in the record's folder;
//   4. when there is no such folder, the name alone as the whole path.
//
// Returns true when it names one of these, even when the name has no URL and leaves it empty.
// Returns false with the reference empty for a null record and for an empty name in an unknown
// folder; returns false for a null `ref`.
bool CFileUtilSetFileRefFromDeprecatedFSSpecThroughIPC(CFileRef* ref, FSSpec const* spec,
                                                       bool searchOtherVolumes, bool last);

// The same, searching other volumes, for the record that FSMakeFSSpec makes of a volume, a folder
// and a name or path; only the last component may be missing. Returns false, with the reference as
// it was, when there is no such record.
bool CFileUtilSetFileRefFromFSSpecData(CFileRef* ref, short vRefNum, long dirID, char const* name,
                                       bool last);

// Writes the reference's FSSpec in any case; returns whether it has a volume, a folder and a name.
bool CFileUtilGetDeprecatedFSSpecThroughIPC(CFileRef const& ref, FSSpec* spec);

// Appends a name. In an existing folder it is an HFS name: the reference then names the existing
// item itself; if there is none, the name is added with each '/' replaced by ':'. Below anything
// else it is added as it stands, as UTF-8. `flag` is AddToPath's folder flag, and the result is
// AddToPath's. Returns false for null.
bool CFileUtilAddHFSName(CFileRef* ref, char const* name, bool flag);

// Make a record, or a reference to an existing item, from a folder's full path (or null) and a name
// (or null), joined by ':'. With `joinSecond`, a second C string follows the first in memory and is
// part of the folder's path. The length of the joined path is taken modulo 256. Return
// FSMakeFSSpec's result: for the record, fnfErr means that only the last component is missing, and
// any other error that nothing is written; a reference changes only when the result is noErr.
OSErr CFileUtilMakeFSSpecFromPath(FSSpec* spec, char const* hfsFolderPath, char const* name,
                                  unsigned char joinSecond);
OSErr CFileUtilMakeFileRefFromPath(CFileRef* ref, char const* hfsFolderPath, char const* name,
                                   unsigned char joinSecond);

// --- Full paths and volumes -------------------------------------------------------------------

// Returns the length of the HFS full path of a folder, or of the folder that holds anything else.
// The path has at most 511 bytes of folders, the innermost ones; for an unknown volume it is ":".
// Unless `path` is null, writes the path there in less than `maxLength` bytes, with the outer
// folders replaced by "..." when it is too long; with `keepFolders` 0, only the volume's name.
// REQUIRES: `path` has `maxLength` bytes, at least 6 more than the volume's name. With fewer, the
// call never returns when the path cannot be made to fit.
unsigned short CFileUtilMakeFullPath(CFileRef const& ref, char* path, unsigned short maxLength,
                                     unsigned char keepFolders);

// The first mounted volume with exactly this name, letter case included.
short CFileUtilGetVolRefnumByHFSName(char const* volumeName);

// Writes a volume's name into a buffer of 256 bytes; for an unknown volume writes an empty one and
// returns false.
bool CFileUtilGetHFSVolumeName(short vRefNum, char* volumeName);

// Writes the name in the FSSpec of an existing item. Returns false with an empty name when it does
// not fit into `size` bytes with its NUL; returns false with the buffer as it was for an item that
// does not exist, for null and for size 0.
bool CFileUtilGetHFSName(CFileRef const& ref, char* name, unsigned short size);
