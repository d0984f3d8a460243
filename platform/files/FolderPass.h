// The last resort for an item that is not where it was: one pass over the folders of its volume.
#pragma once

#include <optional>
#include <string>

#include "files/ItemReference.h"

namespace tallowmere::files {

// A path of the item, found by reading folders: first `start`, then those next to it in the tree,
// above and below, and so on to the ends of the volume. None when no readable folder of the volume
// holds the item. Never enters another volume, and nothing waits for a server or an automounter.
// REQUIRES: `start` is the canonical absolute path of a folder on the item's volume.
// May throw std::bad_alloc.
std::optional<std::string> SearchFolders(const ItemReference& item, const std::string& start);

// Whether the item at `path` is on the volume of `item`, told without waiting.
bool IsOnVolumeOf(const ItemReference& item, const char* path);

}  // namespace tallowmere::files
