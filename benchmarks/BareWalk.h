// The lower bound of a pass over a volume.
#pragma once

#include <filesystem>

namespace tallowmere::benchmark {

// Returns the number of entries below a folder. Opens, reads to the end and closes each folder, and
// examines no item.
long WalkBare(const std::filesystem::path& top);

}  // namespace tallowmere::benchmark
