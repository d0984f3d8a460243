// The history of the tree.
#pragma once

#include <atomic>
#include <cstdint>
#include <vector>

#include "Model.h"

namespace tallowmere::soak {

// The states of the tree in order. One thread writes, others read. Only the latest kKept remain.
class History {
 public:
  using Version = std::uint64_t;
  static constexpr Version kKept = 1 << 14;

  explicit History(const State& first);

  // Returns the latest state that has certainly been reached. Later ones may have been reached too.
  Version Reached() const { return mReached.load(std::memory_order_seq_cst); }
  // Returns the latest state that may have been reached.
  Version Begun() const { return mBegun.load(std::memory_order_seq_cst); }
  // The reference is valid until kKept more states have begun.
  const State& At(Version version) const { return mStates[version % kKept]; }
  // Returns whether this state and all later ones are still intact.
  bool Keeps(Version version) const { return Begun() + 1 - version < kKept; }

  // For the writer: begins the next state. Facts that only become known with the change are filled
  // in before Reach().
  State& Begin(const State& next);
  void Reach();

 private:
  std::vector<State> mStates;
  std::atomic<Version> mBegun{0};
  std::atomic<Version> mReached{0};
};

}  // namespace tallowmere::soak
