// Where is an item: by the reference that was taken of it, or by its node id on a volume.
//
// A remembered place first, verified with one look; then, where the process may, by the file
// system's own handle; then by a pass over the volume's folders. Everything may throw
// std::bad_alloc.
#pragma once

#include <CoreServices/CoreServices.h>

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "files/ItemReference.h"
#include "files/MountTable.h"

namespace tallowmere::files {

// Remembers where the item was found, for as long as there is room.
void RememberPlace(const Place& place);

// The same of an absolute path that need not be canonical.
void RememberSighting(const ItemReference& item, std::string_view path);

// The item at an absolute path, links on the way followed, one in the last place not. None when
// there is none.
std::optional<Place> PlaceAt(const std::string& path);

// The same, if it was remembered there and the path has no link in the last place. One look.
std::optional<Place> RememberedPlaceAt(const std::string& path);

// The folder in which the kernel finds the last component of an absolute path other than "/". None,
// and errno tells, when there is none or no path leads to it.
std::optional<Place> HolderOf(const std::string& path);

// The canonical path of a folder that a path leads to, all links followed.
std::optional<std::string> RealPath(const std::string& path);

// The folder that holds a path, which must not be "/".
std::string FolderOf(const std::string& path);

// A path of this very item now, with links on the way perhaps, but without ".", ".." and empty
// components. None when it is gone or cannot be found with certainty.
std::optional<std::string> FindPath(const ItemReference& item);

// The same, its canonical path.
std::optional<std::string> FindCanonicalPath(const ItemReference& item);

// The item with a node id on a volume; with `folder` nothing but a folder. None when there is none
// and when it is not certain which item that is.
std::optional<Place> FindItem(const VolumePointer& volume, std::uint32_t id, bool folder);

// The same without reading a folder: none too when the item has no remembered place and cannot be
// opened by its number.
std::optional<Place> FindItemAtOnce(const VolumePointer& volume, std::uint32_t id, bool folder);

}  // namespace tallowmere::files
