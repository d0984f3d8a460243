// What the tree has been like.
#pragma once

#include <atomic>
#include <cstdint>
#include <vector>

#include "Model.h"

namespace tallowmere::soak {

// The states of the tree in their order. One thread writes, others read; the latest kKept are kept.
class History {
 public:
  using Version = std::uint64_t;
  static constexpr Version kKept = 1 << 14;

  explicit History(const State& first);

  // The state that is certainly reached; later ones may be too.
  Version Reached() const { return mReached.load(std::memory_order_seq_cst); }
  // The last state that may be reached.
  Version Begun() const { return mBegun.load(std::memory_order_seq_cst); }
  // Valid until kKept more have begun.
  const State& At(Version version) const { return mStates[version % kKept]; }

  // For the writer: the next state begins; what is not known of it before it is reached is written
  // into it until then.
  State& Begin(const State& next);
  void Reach();

 private:
  std::vector<State> mStates;
  std::atomic<Version> mBegun{0};
  std::atomic<Version> mReached{0};
};

}  // namespace tallowmere::soak
