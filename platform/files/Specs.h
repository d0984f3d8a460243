// Records and references of items: from a place to its record and back.
#pragma once

#include <CoreServices/CoreServices.h>

#include "files/Catalog.h"
#include "files/NameLookup.h"

namespace tallowmere::files {

// The folder that holds an item, with its volume. `known` is a volume asked for just now on which
// it may be, or null. nsvErr when that folder is on no volume; fnfErr for "/", which nothing holds.
OSErr HoldingFolder(const Place& item, const VolumePointer& known, Folder& folder);

// The volume of an item. `known` as above. Null for an item of a kernel interface.
VolumePointer VolumeOf(const Place& item, const VolumePointer& known);

// The record of an item; the second, of one that was found in a folder just now.
OSErr SpecOfPlace(const Place& item, FSSpec& spec);
OSErr SpecOfPlace(const Place& item, const Folder& folder, FSSpec& spec);

// Whether the item is the root folder of that volume, which is its own or null.
bool IsRootOf(const VolumePointer& volume, const Place& item);

// The existing folder with an id on a volume. nsvErr, dirNFErr.
OSErr FolderWithID(SInt16 vRefNum, UInt32 id, Folder& folder);

// Fills a record; a name beyond 63 bytes is cut.
void FillSpec(FSSpec& spec, SInt16 vRefNum, UInt32 parID, std::string_view name);

}  // namespace tallowmere::files
