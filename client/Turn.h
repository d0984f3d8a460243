// Lets one thread at a time use something, for any length of time. Survives fork(2).
#pragma once

#include <atomic>
#include <cstdint>

namespace tallowmere {

// Counts the forks that led to this process: a copy of the parent's memory has another number.
std::uint32_t ProcessGeneration();

class Turn {
 public:
  // Waits until nobody else has the turn, and takes it. Returns false, at once, when this thread
  // has it already. In a child made by fork(2), what the parent's other threads had is free.
  bool Take();

  // REQUIRES: it has been taken. Any thread may do this.
  void Release();

 private:
  // The holder's process generation in the upper half, its thread in the lower one; 0 when free.
  std::atomic<std::uint64_t> mHolder{0};
};

}  // namespace tallowmere
