// The host's result codes for the platform's errors: the one place where errors become codes.
#pragma once

#include <CoreServices/CoreServices.h>

#include "kernel/Result.h"

namespace tallowmere::calls {

//   error                                       code
//   ---------------------------------------------------------------------
//   nothing is there, or no path leads there    fnfErr
//   kNoFolder                                   dirNFErr
//   kNoVolume                                   nsvErr
//   permission refused                          afpAccessDenied
//   any other                                   ioErr
OSErr ResultCodeOf(kernel::Error error);

// The code for a folder on the way: if nothing is there, dirNFErr.
OSErr ResultCodeOfFolder(kernel::Error error);

// The code for an alias: paramErr for one that is broken.
OSErr ResultCodeOfAlias(kernel::Error error);

}  // namespace tallowmere::calls
