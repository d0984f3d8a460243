// What an item is called in HFS terms in its folder, and which item of a folder has an HFS name.
//
// A plain ASCII name costs one look at the folder, present or missing.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

#include "catalog/Moment.h"
#include "catalog/Sighting.h"
#include "kernel/Result.h"

namespace tallowmere::catalog {

// The item with an HFS name in a folder, in this order: the precomposed name; the decomposed one;
// the one entry whose HFS form is the same; the entry without a name of its own whose short form it
// is. ENOENT when there is none, or no single one; else the error of the look.
kernel::Result<Look> LookUpHFSName(Moment& moment, const HeldFolder& folder, std::string_view name);

// The HFS name of the item of a look, at most `limit` bytes: by it LookUpHFSName finds this very
// item. ENOENT when no name does.
kernel::Result<std::string> HFSNameOf(Moment& moment, const Look& item, std::size_t limit);

}  // namespace tallowmere::catalog
