// A root folder for targets that access files: two small volumes with names of every kind and
// nothing else, the same in every run.
//
// It lives in a mount namespace of the process. Inode numbers are the same each time, so the corpus
// may contain node ids. Volume numbers are given by the kernel and differ.
#pragma once

#include <cstdint>

namespace tallowmere::fuzz {

// Makes the tree. Where that is not permitted, says so and ends the process with kSkipped, an exit
// status that the engine does not use.
void MakeSmallTree();
inline constexpr int kSkipped = 100;

// While it exists, the process's root folder and current directory are the tree's root.
class InsideSmallTree {
 public:
  InsideSmallTree();
  InsideSmallTree(const InsideSmallTree&) = delete;
  InsideSmallTree& operator=(const InsideSmallTree&) = delete;
  ~InsideSmallTree();
};

// Translates a volume number of the input to this machine: -1 means the first volume, -2 the
// second; all others stay as they are. REQUIRES: the process is inside the tree.
std::int16_t VolumeNumberHere(std::int16_t number);

}  // namespace tallowmere::fuzz
