// Opens and reads paths: every way from a path to an open item, and back.
//
// What is opened for its path alone (O_PATH) is held, not read: it waits for no device or server
// and needs no permission to read.
#pragma once

#include <string>
#include <string_view>

#include "kernel/Descriptor.h"
#include "kernel/Item.h"
#include "kernel/Result.h"

namespace tallowmere::kernel {

// Whether a path is absolute without empty components, "." or "..": canonical unless there are
// links on its way.
bool IsNormalized(std::string_view path);

// Holds the item at a path, which may itself be a link. ELOOP or ENOTDIR when there is a link on
// the way. REQUIRES: the path is normalized.
Result<Descriptor> HoldWithoutLinks(const std::string& path);

// The same for a folder; ENOTDIR for anything else.
Result<Descriptor> HoldFolderWithoutLinks(const std::string& path);

// Holds the folder with a name in an open folder. ENOTDIR for anything else, including a link.
Result<Descriptor> HoldFolderIn(const Spot& spot);

// Holds the folder that a spot leads to, following links. Triggers no automounter at its end.
Result<Descriptor> HoldFollowing(const Spot& spot);

// Opens a folder for reading its entries; does not follow a link as the last component.
Result<Descriptor> OpenForReading(const Spot& spot);

// Whether a folder has the attribute by which it ignores letter case, as single folders of ext4,
// f2fs and tmpfs can: ioctl_iflags(2). False where that cannot be told.
bool HasCasefold(const Spot& folder);

// The canonical path of what a path leads to, following all links.
Result<std::string> RealPath(const std::string& path);

// The same, without following a link as the last component.
Result<std::string> CanonicalPath(const std::string& path);

// Whether a path leads to a regular file, following all links.
bool LeadsToFile(const std::string& path);

// The path at which the kernel shows an open item. It is not verified: a removed item has one too,
// followed by " (deleted)".
Result<std::string> PathOfDescriptor(const Descriptor& descriptor);

}  // namespace tallowmere::kernel
