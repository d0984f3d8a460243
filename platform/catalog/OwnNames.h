// Own names: HFS names that are the item's Linux name in HFS form, as opposed to short forms.
#pragma once

#include <cstddef>
#include <string_view>

#include "catalog/Moment.h"
#include "catalog/Sighting.h"
#include "kernel/Result.h"

namespace tallowmere::catalog {

// Whether a look found nothing, rather than failed.
bool IsMissing(const kernel::Result<Look>& look);

// The item with an own name. Tries the precomposed name, the decomposed one, then the only entry
// with that HFS form.
kernel::Result<Look> FindByOwnName(Moment& moment, const HeldFolder& folder, std::string_view name);

// Whether an item has an own name, of at most `limit` bytes, that finds it.
bool HasOwnName(Moment& moment, const HeldFolder& folder, const Sighting& item, std::size_t limit);

}  // namespace tallowmere::catalog
