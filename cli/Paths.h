// Paths as a person gives them.
#pragma once

#include <string>

namespace tallowmere::cli {

// From the current directory, without slashes at the end. REQUIRES: not empty.
std::string AbsolutePath(const std::string& path);

// Whether a folder is there; a link to one is none.
bool IsFolder(const std::string& path);

}  // namespace tallowmere::cli
