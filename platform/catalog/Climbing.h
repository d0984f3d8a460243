// The way from a folder up to the root of its volume, one folder at a time.
#pragma once

#include <cstdint>
#include <string>

#include "catalog/Moment.h"
#include "kernel/Result.h"

namespace tallowmere::catalog {

// Name and parent of the folder with an id on the volume with a number. kNoVolume; kNoFolder when
// no folder has the id.
//
// The names of a climb within one moment are those of one walk of the kernel: the one that led to
// the folder where it began, along its path. That holds for a folder on the mount of the volume's
// place, as long as every name up to the root is plain and the ids of all parents are remembered;
// those are not verified, and serve to ask for the next folder of this climb alone. Where one of
// them is missing, the folder is found by its id and looked up in the folder that holds it. Where
// the folder that holds it is on another volume, the climb ends.
kernel::Result<ClimbedFolder> ClimbFrom(Moment& moment, volumes::VolumeNumber number,
                                        std::uint32_t id);

}  // namespace tallowmere::catalog
