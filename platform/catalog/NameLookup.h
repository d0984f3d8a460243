// The HFS name of an item in its folder, and the item of a folder with an HFS name.
//
// A plain ASCII name takes one system call, whether the item exists or not.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

#include "catalog/Moment.h"
#include "catalog/Sighting.h"
#include "kernel/Result.h"

namespace tallowmere::catalog {

// The item with an HFS name in a folder. Tries in this order: the precomposed name; the decomposed
// one; the only entry with that HFS form; the entry without a name of its own that has that short
// form; where names can be Mac Roman, the entry that has these very bytes and is not UTF-8. Returns
// ENOENT when there is none or more than one, otherwise the error of the look. The name of the look
// can differ in letter case from the stored one.
kernel::Result<Look> LookUpHFSName(Moment& moment, const HeldFolder& folder, std::string_view name);

// The HFS name, of at most `limit` bytes and in the stored letter case, by which LookUpHFSName
// finds this very item. Returns ENOENT when there is none.
kernel::Result<std::string> HFSNameOf(Moment& moment, const Look& found, std::size_t limit);

}  // namespace tallowmere::catalog
