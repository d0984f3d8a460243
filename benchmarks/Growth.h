// How cost grows with what is asked about: depth, size of a folder, number of mounts, number of
// items.
#pragma once

#include <filesystem>

#include "Measure.h"

namespace tallowmere::benchmark {

// Writes growth-depth.svg, growth-folder.svg, growth-mounts.svg and growth-memory.svg into a
// folder, and the exponents to standard output. What is not permitted is skipped with a word.
void PlotGrowth(const Settings& settings, const std::filesystem::path& folder);

}  // namespace tallowmere::benchmark
