// Paths as a person gives them.
#pragma once

#include <optional>
#include <string>

namespace tallowmere::cli {

// The path from the root, without slashes at its end and with the links on the way resolved where
// they lead somewhere: the service takes a link in the last place but one for a folder itself.
// REQUIRES: not empty.
std::string AbsolutePath(const std::string& path);

// The folder that a path leads to, all links resolved; none where there is none.
std::optional<std::string> FolderAt(const std::string& path);

// Whether a folder is there; a link to one is none.
bool IsFolder(const std::string& path);

}  // namespace tallowmere::cli
