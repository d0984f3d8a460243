// The memory handles of this process: which are alive, and blocks made from bytes.
//
// A block lives until it is disposed of or the process ends.
#pragma once

#include <QuickTime/QuickTime.h>

#include <cstddef>
#include <string_view>

namespace tallowmere::quicktime {

// The number of blocks that have not been disposed of.
std::size_t LiveHandles();

// A new block with these bytes. Null when there is not enough memory.
Handle NewHandleWith(std::string_view bytes);

}  // namespace tallowmere::quicktime
