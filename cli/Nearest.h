// The word that was probably meant.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace tallowmere::cli {

// Returns the word that takes the fewest changes of single characters to become `word`; a missing
// ending counts as one change. The first of several; empty when none is near.
std::string Nearest(std::string_view word, const std::vector<std::string>& words);

}  // namespace tallowmere::cli
