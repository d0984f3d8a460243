// Names that items have of their own in HFS terms, as against short forms that stand for them.
#pragma once

#include <cstddef>
#include <string_view>

#include "catalog/Moment.h"
#include "catalog/Sighting.h"
#include "kernel/Result.h"

namespace tallowmere::catalog {

// Whether a look found nothing, rather than failed.
bool IsMissing(const kernel::Result<Look>& look);

// The item that has a name of its own: the precomposed name; the decomposed one; the one entry
// whose HFS form is the same.
kernel::Result<Look> FindByOwnName(Moment& moment, const HeldFolder& folder, std::string_view name);

// Whether an item of a folder has a name of its own, of at most `limit` bytes, that finds it.
bool HasOwnName(Moment& moment, const HeldFolder& folder, const Sighting& item, std::size_t limit);

}  // namespace tallowmere::catalog
