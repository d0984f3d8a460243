#include "calls/Process.h"

#include <Tallowmere/Process.h>

#include <new>
#include <thread>

namespace tallowmere::calls {
namespace {

struct State : Process {
  std::thread::id owner;  // whose moment is open; no thread's where none is
};

State& ThisState() {
  static State& state = *new State;
  return state;
}

}  // namespace

Process& ThisProcess() {
  return ThisState();
}

catalog::Moment* OpenMoment() {
  State& state = ThisState();
  return state.owner == std::this_thread::get_id() ? &state.moment : nullptr;
}

}  // namespace tallowmere::calls

namespace tallowmere::process {

// Without memory for the state of the process there is no moment, and each call looks for itself.
Moment::Moment() noexcept : mIsOutermost(false) {
  try {
    calls::State& state = calls::ThisState();
    if (state.owner != std::thread::id()) return;
    state.owner = std::this_thread::get_id();
    mIsOutermost = true;
  } catch (const std::bad_alloc&) {
    return;
  }
}

void Moment::End() noexcept {
  if (!mIsOutermost) return;
  calls::ThisState().moment.Restart();
  calls::ThisState().owner = {};
  mIsOutermost = false;
}

}  // namespace tallowmere::process
