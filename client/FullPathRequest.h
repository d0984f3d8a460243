// The request for a full path in a buffer of any size.
#pragma once

#include <tallowmere/Request.h>

#include <cstdint>
#include <string_view>

#include "client/Answers.h"
#include "service/Protocol.h"

namespace tallowmere::request {

// The longest buffer in bytes, which every full path fits into.
inline constexpr std::uint16_t kLongestFullPathBuffer = protocol::kLongestHFSName;

// REQUIRES: the path fits into `size` bytes, if need be shortened; the service is busy with it for
// ever otherwise. At most kLongestFullPathBuffer.
Request<answer::FullPath> FullPathInBuffer(std::string_view path, std::uint16_t size,
                                           bool keepFolders);

}  // namespace tallowmere::request
