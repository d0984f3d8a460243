// Which item the target of an alias is now. In this order, the first that applies and whose item is
// there:
//
//   1. relative     from the folder of the alias file up and down, by the record's levels
//   2. by path      on a mounted volume with the record's name
//   3. by id        there, by the catalog's own numbers, on hfs and hfsplus; the item's birth must
//                   prove it
//
// Whatever finds it, the item is of the record's kind and on that volume, and no way to it leaves
// the volume. What several readings, names or volumes find must be one item. What is not proved is
// not found.
#pragma once

#include "aliases/Target.h"
#include "catalog/Moment.h"
#include "catalog/Sighting.h"
#include "kernel/Result.h"

namespace tallowmere::aliases {

// How an item was found.
enum class Found : std::uint8_t { kByLevels, kByPath, kByID };

struct Resolved {
  catalog::Sighting item;  // at its canonical path
  Found by;
};

// The target of an alias file; without one (`file` null) nothing is relative.
//
//   kNoVolume    no volume with that name is mounted, or the alias names none
//   kNoFolder    a folder on the way is missing
//   ENOENT       the item is not there, or it is not certain which it is
//
// Other errors are the kernel's: what it hides may be there.
kernel::Result<Resolved> Resolve(catalog::Moment& moment, const catalog::Look* file,
                                 const Target& target);

}  // namespace tallowmere::aliases
