// Records and references of items: from a place to its record and back.
#pragma once

#include <CoreServices/CoreServices.h>

#include "files/Catalog.h"
#include "files/NameLookup.h"

namespace tallowmere::files {

// The folder that holds an item, with its volume. nsvErr when that folder is on no volume; fnfErr
// for
// "/", which nothing holds.
OSErr HoldingFolder(const Place& item, Folder& folder);

// The record of an item.
OSErr SpecOfPlace(const Place& item, FSSpec& spec);

// Whether the item is the root folder of its volume, which is then given.
VolumePointer VolumeOfRoot(const Place& item);

// The existing folder with an id on a volume. nsvErr, dirNFErr.
OSErr FolderWithID(SInt16 vRefNum, UInt32 id, Folder& folder);

// Fills a record; a name beyond 63 bytes is cut.
void FillSpec(FSSpec& spec, SInt16 vRefNum, UInt32 parID, std::string_view name);

}  // namespace tallowmere::files
