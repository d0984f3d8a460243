// What the change time of a folder proves about its entries.
#pragma once

#include "kernel/Clock.h"
#include "volumes/Volume.h"

namespace tallowmere::catalog {

// Whether a folder has the same entries until its change time moves. A server that promises nothing
// can show several folders as one, with one change time.
bool HoldsUntilChange(const volumes::Volume& volume);

// Whether another change may get the same time as this one, because it was only just made.
bool MayChangeUnseen(kernel::Nanoseconds change, kernel::Nanoseconds now);

}  // namespace tallowmere::catalog
