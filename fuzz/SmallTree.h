// A root folder for targets that access files: two small volumes with names of every kind and
// nothing else, the same in every run.
//
// It is made in a mount namespace of the process's own. Inode numbers are the same each time, so
// the corpus may contain node ids; volume numbers are the kernel's.
#pragma once

#include <cstdint>

namespace tallowmere::fuzz {

// Makes the tree. Where that is not permitted, reports it and ends the process with kSkipped, which
// is not an exit status of the engine.
void MakeSmallTree();
inline constexpr int kSkipped = 100;

// During its life, "/" and the current directory of the process are the tree's root.
class InsideSmallTree {
 public:
  InsideSmallTree();
  InsideSmallTree(const InsideSmallTree&) = delete;
  InsideSmallTree& operator=(const InsideSmallTree&) = delete;
  ~InsideSmallTree();
};

// Translates a volume number of the input for this machine: -1 is the first volume's, -2 the second
// one's, all others are unchanged. REQUIRES: within the tree.
std::int16_t VolumeNumberHere(std::int16_t number);

}  // namespace tallowmere::fuzz
