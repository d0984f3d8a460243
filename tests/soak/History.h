// The history of the tree.
#pragma once

#include <atomic>
#include <cstdint>
#include <vector>

#include "Model.h"

namespace tallowmere::soak {

// The states of the tree in order. One thread writes, others read; the latest kKept are kept.
class History {
 public:
  using Version = std::uint64_t;
  static constexpr Version kKept = 1 << 14;

  explicit History(const State& first);

  // The latest state that has certainly been reached; later ones may have been too.
  Version Reached() const { return mReached.load(std::memory_order_seq_cst); }
  // The latest state that may have been reached.
  Version Begun() const { return mBegun.load(std::memory_order_seq_cst); }
  // Valid until kKept more have begun.
  const State& At(Version version) const { return mStates[version % kKept]; }
  // Whether a state, and so all later ones, have not begun to be overwritten.
  bool Keeps(Version version) const { return Begun() + 1 - version < kKept; }

  // For the writer: begins the next state. Facts that are not known before it is reached are filled
  // in until then.
  State& Begin(const State& next);
  void Reach();

 private:
  std::vector<State> mStates;
  std::atomic<Version> mBegun{0};
  std::atomic<Version> mReached{0};
};

}  // namespace tallowmere::soak
