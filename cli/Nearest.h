// The word that was probably meant.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace tallowmere::cli {

// The one of the words that takes the fewest changes of single characters to become `word`, of
// which a beginning takes one; the first of several. Empty when each would have to be written anew.
std::string Nearest(std::string_view word, const std::vector<std::string>& words);

}  // namespace tallowmere::cli
