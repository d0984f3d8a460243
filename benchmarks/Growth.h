// How cost grows with depth, size of a folder, number of mounts and number of items.
#pragma once

#include <filesystem>

#include "Measure.h"

namespace tallowmere::benchmark {

// Writes growth-depth.svg, growth-folder.svg, growth-mounts.svg and growth-memory.svg into a
// folder, and the exponents to standard output. What is not permitted is skipped with a message.
void PlotGrowth(const Settings& settings, const std::filesystem::path& folder);

}  // namespace tallowmere::benchmark
