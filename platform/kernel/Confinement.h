// Takes from this process what it never needs, for good and for every process that it starts.
#pragma once

namespace tallowmere::kernel {

// Sets no new privileges, Landlock with nothing but reading, and a filter of system calls, each
// where the kernel supports it. Changes nothing else of the process: no descriptor stays open.
// Never fails. REQUIRES: the process has one thread.
void LockIn();

}  // namespace tallowmere::kernel
