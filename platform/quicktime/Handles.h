// Memory handles as this process has them: which ones are alive, and blocks made of bytes.
//
// A block lives until it is disposed of or the process ends.
#pragma once

#include <QuickTime/QuickTime.h>

#include <cstddef>
#include <string_view>

namespace tallowmere::quicktime {

// How many blocks have not been disposed of.
std::size_t LiveHandles();

// A new block with these bytes. Null when memory is short.
Handle NewHandleWith(std::string_view bytes);

}  // namespace tallowmere::quicktime
