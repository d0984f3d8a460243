// Where is a referenced item: remembered places, then file handles, then a pass over its volume.
#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "files/ItemReference.h"

namespace tallowmere::files {

// Remembers that the item was found at an absolute path, for as long as there is room.
// May throw std::bad_alloc.
void RememberPlace(const ItemReference& item, std::string_view path);

// The canonical absolute path at which this very item is now: no links on the way, and the item
// itself not followed when it is one. None when it is gone or cannot be found with certainty.
// May throw std::bad_alloc.
std::optional<std::string> FindPlace(const ItemReference& item);

}  // namespace tallowmere::files
