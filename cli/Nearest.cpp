#include "cli/Nearest.h"

#include <algorithm>
#include <numeric>

namespace tallowmere::cli {
namespace {

// The number of characters to insert, remove, replace or swap with a neighbour ("optimal string
// alignment"), computed row by row.
std::size_t Distance(std::string_view first, std::string_view second) {
  std::vector<std::size_t> before;
  std::vector<std::size_t> last(second.size() + 1);
  std::iota(last.begin(), last.end(), 0);
  for (std::size_t i = 1; i <= first.size(); ++i) {
    std::vector<std::size_t> row{i};
    for (std::size_t j = 1; j <= second.size(); ++j) {
      const std::size_t replaced = last[j - 1] + (first[i - 1] == second[j - 1] ? 0 : 1);
      std::size_t least = std::min({replaced, last[j] + 1, row[j - 1] + 1});
      const bool isExchange =
          i > 1 && j > 1 && first[i - 1] == second[j - 2] && first[i - 2] == second[j - 1];
      if (isExchange) least = std::min(least, before[j - 2] + 1);
      row.push_back(least);
    }
    before = std::move(last);
    last = std::move(row);
  }
  return last.back();
}

}  // namespace

std::string Nearest(std::string_view word, const std::vector<std::string>& words) {
  std::string nearest;
  std::size_t least = word.size();
  for (const std::string& other : words) {
    const std::size_t distance = other.starts_with(word) ? 1 : Distance(word, other);
    if (distance >= least || distance >= other.size()) continue;
    least = distance;
    nearest = other;
  }
  return nearest;
}

}  // namespace tallowmere::cli
