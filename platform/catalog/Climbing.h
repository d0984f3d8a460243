// The way from a folder up to the root of its volume, one folder at a time.
#pragma once

#include <cstdint>
#include <string>

#include "catalog/Moment.h"
#include "kernel/Result.h"

namespace tallowmere::catalog {

// The name and parent of the folder with an id. Returns kNoVolume when no volume has the number,
// and kNoFolder when no folder has the id.
//
// Within one moment, a climb takes its names from a single walk of the kernel: the walk along the
// path to the folder where the climb began. This requires that the folder is on the mount of the
// volume's place, that every name up to the root is plain, and that the ids of all parents are
// remembered. Remembered ids are not verified; they only identify the next step of this climb. If
// an id is missing, the folder is found by its own id and looked up in its parent. The climb ends
// where the parent is on another volume.
kernel::Result<ClimbedFolder> ClimbFrom(Moment& moment, volumes::VolumeNumber number,
                                        std::uint32_t id);

}  // namespace tallowmere::catalog
