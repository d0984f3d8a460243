// What an item is called in HFS terms in its folder, and which item of a folder has an HFS name.
//
// A plain ASCII name costs one look at the folder, present or missing.
#pragma once

#include <CoreServices/CoreServices.h>

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

#include "files/Catalog.h"
#include "files/ItemReference.h"
#include "files/MountTable.h"

namespace tallowmere::files {

// A folder in which names are looked up. REQUIRES of who makes one: it is a folder, and its volume
// has a root.
struct Folder : OpenFolder {
  VolumePointer volume;

  std::uint32_t ID() const;
};

// The item with an HFS name in a folder, in this order: the precomposed name; the decomposed one;
// the one entry whose HFS form is the same; the entry without a name of its own whose short form it
// is. fnfErr when there is none, or no single one; else the error of the look (afpAccessDenied,
// ioErr).
OSErr LookUpHFSName(const Folder& folder, std::string_view name, Place& item);

// The HFS name of an item of a folder, at most `limit` bytes: by it LookUpHFSName finds this very
// item. None when no name does.
std::optional<std::string> HFSNameOf(const Folder& folder, const Place& item, std::size_t limit);

// The result code for the system error in errno, fnfErr where nothing is there.
OSErr ErrorOfSystem();

}  // namespace tallowmere::files
