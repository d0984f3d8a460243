// Requests whose answers the client looks into: a full path in a buffer of any size, and a path
// with its result code.
#pragma once

#include <tallowmere/Request.h>

#include <cstdint>
#include <string_view>

#include "client/Answers.h"
#include "service/Protocol.h"

namespace tallowmere::request {

// The longest buffer in bytes; every full path fits into it.
inline constexpr std::uint16_t kLongestFullPathBuffer = protocol::kLongestHFSName;

// REQUIRES: the path fits into `size` bytes, shortened if necessary, as the service is otherwise
// busy with it for ever; at most kLongestFullPathBuffer.
Request<answer::FullPath> FullPathInBuffer(std::string_view path, std::uint16_t size,
                                           bool keepFolders);

// MakeFileRefFromPath, with the result code. REQUIRES: at most 255 bytes, and no NUL.
Request<answer::PathByResult> PathAndResult(std::string_view hfsPath);

}  // namespace tallowmere::request
