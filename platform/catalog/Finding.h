// Finds an item, either by a reference to it or by its node id on a volume.
//
// Tries in this order: a folder held in this moment; a remembered place, verified; the file
// system's own handle, if the process is privileged; a pass over the volume's folders. A pass
// restarts the moment, so callers must not rely on what they held before.
//
// An id that several items could share is resolved only when exactly one item has it: every number
// that maps to the id was asked for, or the whole volume was read.
#pragma once

#include <cstdint>
#include <string>

#include "catalog/Moment.h"
#include "catalog/Sighting.h"
#include "kernel/Result.h"

namespace tallowmere::catalog {

// A lead: the path at which an item was last seen, possibly through links. Empty when that is not
// remembered.
std::string LastPathOf(Moment& moment, const kernel::Item& reference);

// Looks for a reference's item at an absolute path, following links on the way. Returns ENOENT when
// another item or none is there, and kNoVolume when its folder is on no volume.
kernel::Result<Look> LookAgain(Moment& moment, const kernel::Item& reference,
                               const std::string& path);

// The current canonical path of a reference's item.
kernel::Result<std::string> FindPathOf(Moment& moment, const kernel::Item& reference);

// The item with a node id on a volume, or only a folder if `foldersOnly`. Returns ENOENT when there
// is none and when it is uncertain which one is meant.
kernel::Result<Sighting> FindItem(Moment& moment, const volumes::VolumePointer& volume,
                                  std::uint32_t id, bool foldersOnly);

// Like FindItem, but never makes a pass: also returns ENOENT when the item has no remembered place
// and cannot be opened by its number.
kernel::Result<Sighting> FindItemWithoutPass(Moment& moment, const volumes::VolumePointer& volume,
                                             std::uint32_t id);

// Holds the folder with a node id. Returns kNoVolume when no volume has the number, and kNoFolder
// when no folder has the id.
kernel::Result<HeldFolder> HoldFolderWithID(Moment& moment, volumes::VolumeNumber number,
                                            std::uint32_t id);

}  // namespace tallowmere::catalog
