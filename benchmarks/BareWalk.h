// The floor of a pass over a volume.
#pragma once

#include <filesystem>

namespace tallowmere::benchmark {

// How many entries there are below a folder: opens, reads to the end and closes each folder, and
// looks at nothing.
long WalkBare(const std::filesystem::path& top);

}  // namespace tallowmere::benchmark
