// The words of a command as exec(3) and posix_spawn(3) take them.
#pragma once

#include <string>
#include <vector>

namespace tallowmere::test {

// Pointers into `words`, which has to outlive them, and a null behind them.
inline std::vector<char*> ArgumentVector(const std::vector<std::string>& words) {
  std::vector<char*> pointers;
  pointers.reserve(words.size() + 1);
  for (const std::string& word : words) pointers.push_back(const_cast<char*>(word.c_str()));
  pointers.push_back(nullptr);
  return pointers;
}

}  // namespace tallowmere::test
