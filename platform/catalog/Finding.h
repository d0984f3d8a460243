// Where is an item: by the reference that was taken of it, or by its node id on a volume.
//
// The first that applies: a folder held in this moment; a remembered place, verified; where the
// process may, the file system's own handle; a pass over the volume's folders, which begins another
// moment. REQUIRES of callers: what they hold may be let go of.
//
// An id that several items could share is answered only when one has it: each of the numbers that
// share it was asked for, or the whole volume was seen.
#pragma once

#include <cstdint>
#include <string>

#include "catalog/Moment.h"
#include "catalog/Sighting.h"
#include "kernel/Result.h"

namespace tallowmere::catalog {

// A lead: the path at which an item was last seen, with links on the way perhaps. Empty when that
// is not remembered.
std::string LastPathOf(Moment& moment, const kernel::Item& reference);

// The item of a reference as the folder at the end of an absolute path holds it now, links on the
// way followed. ENOENT when another item or none is there; kNoVolume for a folder on none.
kernel::Result<Look> LookAgain(Moment& moment, const kernel::Item& reference,
                               const std::string& path);

// The canonical path of this very item now.
kernel::Result<std::string> FindPathOf(Moment& moment, const kernel::Item& reference);

// The item with a node id on a volume; with `foldersOnly` nothing but a folder. ENOENT when there
// is none and when it is not certain which item that is.
kernel::Result<Sighting> FindItem(Moment& moment, const volumes::VolumePointer& volume,
                                  std::uint32_t id, bool foldersOnly);

// An item as FindItem gives it, without a pass: ENOENT as well when the item has no remembered
// place and cannot be opened by its number.
kernel::Result<Sighting> FindItemWithoutPass(Moment& moment, const volumes::VolumePointer& volume,
                                             std::uint32_t id);

// The folder with a node id on the volume with a number. kNoVolume, kNoFolder.
kernel::Result<HeldFolder> HoldFolderWithID(Moment& moment, volumes::VolumeNumber number,
                                            std::uint32_t id);

}  // namespace tallowmere::catalog
