// Whether two paths lead to one item.
#pragma once

#include <string>

namespace tallowmere::cli {

// Whether two absolute paths lead to the same item now, the last link of each not followed. By its
// number, and on a file system where two items can have one number by its canonical path as well.
bool IsSameItem(const std::string& first, const std::string& second);

}  // namespace tallowmere::cli
