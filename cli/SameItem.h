// Whether two paths lead to the same item.
#pragma once

#include <string>

namespace tallowmere::cli {

// Whether two absolute paths lead to the same item now, without following a link as the last
// component. Compares inode numbers and, on a file system where two items can share one, canonical
// paths as well.
bool IsSameItem(const std::string& first, const std::string& second);

}  // namespace tallowmere::cli
