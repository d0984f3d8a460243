// Paths as a person enters them.
#pragma once

#include <optional>
#include <string>

namespace tallowmere::cli {

// The absolute path, without slashes at its end. Links before the last component are resolved where
// they lead somewhere, because the service would take a link in place of the item's folder for a
// folder itself. REQUIRES: the path is not empty.
std::string AbsolutePath(const std::string& path);

// The folder that a path leads to, all links resolved. Nullopt when it is not a folder.
std::optional<std::string> FolderAt(const std::string& path);

// Whether there is a folder at a path; a link to one does not count.
bool IsFolder(const std::string& path);

}  // namespace tallowmere::cli
