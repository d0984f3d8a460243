// Records and references of items: from a place to its record and back.
#pragma once

#include <CoreServices/CoreServices.h>

#include "files/Catalog.h"
#include "files/NameLookup.h"

namespace tallowmere::files {

// The volume of an item that was just found; null for one of a kernel interface. `near` is a volume
// as the table has it now, the item's as a rule, or null.
VolumePointer VolumeOf(const Place& item, const VolumePointer& near);

// Whether an item is the root folder of its volume, which can be null.
bool IsRootOf(const VolumePointer& volume, const Place& item);

// The result code for a folder with that of an item: one that is missing is a missing folder.
OSErr OnTheWay(OSErr error);

// The folder that holds an item, with its volume, `near` as above. The item's path need not be
// canonical. nsvErr when that folder is on no volume; fnfErr for "/", which nothing holds.
OSErr HoldingFolder(const Place& item, const VolumePointer& near, Folder& folder);

// The record of the item that was last seen at a place, whose path need not be canonical. fnfErr
// when it is not there.
OSErr SpecOfPlace(const Place& item, FSSpec& spec);

// The record of an item of a folder, or of a volume that is mounted there.
OSErr SpecInFolder(const Folder& folder, const Place& item, FSSpec& spec);

// The existing folder with an id on a volume. nsvErr, dirNFErr.
OSErr FolderWithID(SInt16 vRefNum, UInt32 id, Folder& folder);

// Fills a record; a name beyond 63 bytes is cut.
void FillSpec(FSSpec& spec, SInt16 vRefNum, UInt32 parID, std::string_view name);

}  // namespace tallowmere::files
