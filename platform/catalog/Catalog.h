// Where is an item: by the reference that was taken of it, or by its node id on a volume.
//
// A remembered place first, verified; then, where the process may, by the file system's own handle;
// then by a pass over the volume's folders. Everything may throw std::bad_alloc.
//
// What was canonical can have links on its way by now, and they can go again in mid-question though
// the item stays where it is. So a path that was not just found is walked without links.
#pragma once

#include <CoreServices/CoreServices.h>

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>

#include "files/Descriptor.h"
#include "files/ItemReference.h"
#include "files/MountTable.h"

namespace tallowmere::files {

// Remembers where the item was found, for as long as there is room. The path is absolute and need
// not be canonical.
void RememberPlace(const Place& place);

// The item at an absolute path, links on the way followed, one in the last place not. None when
// there is none.
std::optional<Place> PlaceAt(const std::string& path);

// A folder, held for its path alone (O_PATH): its names are looked up in this very folder, whatever
// is at its place by then.
struct OpenFolder {
  Place place;
  std::shared_ptr<const Descriptor> descriptor;
};

// Whether that very item is in the folder now, under that name.
bool Holds(const OpenFolder& folder, const ItemReference& item, std::string_view name);

// The folder that was just found at a place. None, and errno tells, when it is not there now.
std::optional<OpenFolder> Open(const Place& folder);

// The folder at an absolute path. None, and errno tells, when there is none, and when a link is on
// the way: ELOOP or ENOTDIR, as for a file.
std::optional<OpenFolder> OpenFolderAt(const std::string& path);

// The folder in which the kernel finds the last component of an absolute path other than "/". None,
// and errno tells, when there is none or no path leads to it.
std::optional<OpenFolder> OpenHolderOf(const std::string& path);

// Where to look for an item, as in openat(2).
struct Spot {
  int folder;
  const char* name;
};

// The spot of an item that was found by way of an open folder: in this very folder, unless another
// mount shows it. Valid as long as both.
Spot SpotOf(const Place& item, const OpenFolder& folder);

// The folder to which the link at a spot leads, which is at `path` as well. None, and errno tells,
// as above.
std::optional<OpenFolder> OpenBehindLink(const Spot& link, const std::string& path);

// The canonical path of what a path leads to, all links followed. None, and errno tells.
std::optional<std::string> RealPath(const std::string& path);

// The path at which an item was last seen, with links on the way perhaps, but without ".", ".." and
// empty components. None when it is not remembered. Nothing is looked at.
std::optional<std::string> LastPathOf(const ItemReference& item);

// The same of the item with a node id on a volume.
std::optional<std::string> LastPathOf(const Volume& volume, std::uint32_t id);

// The canonical path of this very item now. None when it is gone or cannot be found with certainty.
std::optional<std::string> FindCanonicalPath(const ItemReference& item);

// The item with a node id on a volume; with `folder` nothing but a folder. None when there is none
// and when it is not certain which item that is.
std::optional<Place> FindItem(const VolumePointer& volume, std::uint32_t id, bool folder);

// The folder with a node id on a volume. None when there is none, as FindItem says.
std::optional<OpenFolder> OpenWithID(const VolumePointer& volume, std::uint32_t id);

// An item as FindItem gives it, without reading a folder: none too when the item has no remembered
// place and cannot be opened by its number.
std::optional<Place> FindItemAtOnce(const VolumePointer& volume, std::uint32_t id);

}  // namespace tallowmere::files
