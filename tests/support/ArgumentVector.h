// A command's words in the form that exec(3) and posix_spawn(3) take.
#pragma once

#include <string>
#include <vector>

namespace tallowmere::test {

// Pointers into `words`, which must outlive them, followed by a null pointer.
inline std::vector<char*> ArgumentVector(const std::vector<std::string>& words) {
  std::vector<char*> pointers;
  pointers.reserve(words.size() + 1);
  for (const std::string& word : words) pointers.push_back(const_cast<char*>(word.c_str()));
  pointers.push_back(nullptr);
  return pointers;
}

}  // namespace tallowmere::test
