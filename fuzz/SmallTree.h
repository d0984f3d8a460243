// A root folder for the targets that look at files: two small volumes with names of every kind and
// nothing else, the same in every run.
//
// It is made in a mount namespace of the process's own. Inode numbers are the same each time, so
// node ids may stand in the corpus; volume numbers are the kernel's.
#pragma once

#include <cstdint>

namespace tallowmere::fuzz {

// Makes the tree. Where that is not permitted, says so and ends the process with kSkipped,
// which is no exit status of the engine's.
void MakeSmallTree();
inline constexpr int kSkipped = 100;

// While it lives, "/" and the current directory of the process are the tree's root.
class InsideSmallTree {
 public:
  InsideSmallTree();
  InsideSmallTree(const InsideSmallTree&) = delete;
  InsideSmallTree& operator=(const InsideSmallTree&) = delete;
  ~InsideSmallTree();
};

// A volume number of the input as it is on this machine: -1 is the first volume's, -2 the second
// one's, all others are themselves. REQUIRES: within the tree.
std::int16_t VolumeNumberHere(std::int16_t number);

}  // namespace tallowmere::fuzz
