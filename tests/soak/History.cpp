#include "History.h"

namespace tallowmere::soak {

History::History(const State& first) : mStates(kKept) {
  mStates[0] = first;
}

State& History::Begin(const State& next) {
  const Version version = mBegun.load() + 1;
  mStates[version % kKept] = next;
  mBegun.store(version, std::memory_order_seq_cst);
  return mStates[version % kKept];
}

void History::Reach() {
  mReached.store(mBegun.load(), std::memory_order_seq_cst);
}

}  // namespace tallowmere::soak
