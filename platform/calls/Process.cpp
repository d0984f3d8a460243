#include "calls/Process.h"

#include <Tallowmere/Process.h>

#include <new>

namespace tallowmere::calls {

Process& ThisProcess() {
  static Process& process = *new Process;
  return process;
}

catalog::Moment* OpenMoment() {
  Process& process = ThisProcess();
  return process.momentOwner == std::this_thread::get_id() ? &process.moment : nullptr;
}

}  // namespace tallowmere::calls

namespace tallowmere::process {

// Without memory for the process's state no moment opens, and each call looks for itself.
MomentScope::MomentScope() noexcept : mIsOutermost(false) {
  try {
    calls::Process& process = calls::ThisProcess();
    if (process.momentOwner != std::thread::id()) return;
    process.momentOwner = std::this_thread::get_id();
    mIsOutermost = true;
  } catch (const std::bad_alloc&) {
    return;
  }
}

void MomentScope::End() noexcept {
  if (!mIsOutermost) return;
  calls::ThisProcess().moment.Restart();
  calls::ThisProcess().momentOwner = {};
  mIsOutermost = false;
}

}  // namespace tallowmere::process
