// Paths opened and read: every way from a path to an open item, and back.
//
// What is opened for its path alone (O_PATH) is held, not read: nothing waits for a device or a
// server, and no right to read is needed.
#pragma once

#include <string>
#include <string_view>

#include "kernel/Descriptor.h"
#include "kernel/Item.h"
#include "kernel/Result.h"

namespace tallowmere::kernel {

// Whether a path is absolute and has no empty component, "." or "..": canonical unless there are
// links on its way.
bool IsNormalized(std::string_view path);

// Holds the item at a path, which may itself be a link. ELOOP or ENOTDIR where a link is on the
// way. REQUIRES: the path is normalized.
Result<Descriptor> HoldWithoutLinks(const std::string& path);

// The same for a folder; ENOTDIR for anything else.
Result<Descriptor> HoldFolderWithoutLinks(const std::string& path);

// Holds the folder with a name in an open folder. ENOTDIR for anything else, a link among it.
Result<Descriptor> HoldFolderIn(const Spot& spot);

// Holds the folder to which a spot leads, links followed. No automounter is asked at its end.
Result<Descriptor> HoldFollowing(const Spot& spot);

// A folder opened for reading its entries; a link in the last place is not followed.
Result<Descriptor> OpenForReading(const Spot& spot);

// The canonical path of what a path leads to, all links followed.
Result<std::string> RealPath(const std::string& path);

// The same, but a link in the last place is not followed.
Result<std::string> CanonicalPath(const std::string& path);

// The path at which the kernel shows an open item. It is not verified: a removed item has one too,
// with " (deleted)" behind it.
Result<std::string> PathOfDescriptor(const Descriptor& descriptor);

}  // namespace tallowmere::kernel
