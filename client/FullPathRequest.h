// The request for a full path in a buffer of any size.
#pragma once

#include <tallowmere/Request.h>

#include <cstdint>
#include <string_view>

#include "client/Answers.h"

namespace tallowmere::request {

// REQUIRES: the path fits into `size` bytes, if need be shortened; the service is busy with it for
// ever otherwise. At most 1024.
Request<answer::FullPath> FullPathInBuffer(std::string_view path, std::uint16_t size,
                                           bool keepFolders);

}  // namespace tallowmere::request
