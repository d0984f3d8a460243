// What a process asks of its platform besides the host's calls. On the host's own frameworks, none
// of this has any effect.
#pragma once

namespace tallowmere::process {

// While a MomentScope is open, the host's calls of this thread answer as if at one moment: a call
// reuses what an earlier one has looked up, so a concurrent change by others may or may not be
// seen. Without one, each call looks everything up anew.
//
// It keeps a few folders open, so that their volumes cannot be unmounted: open it for one request,
// no longer. One opened within another joins the outer one. It ends with its scope, also
// when an exception leaves that, or earlier with End().
class MomentScope {
 public:
  MomentScope() noexcept;
  MomentScope(const MomentScope&) = delete;
  MomentScope& operator=(const MomentScope&) = delete;
  ~MomentScope() { End(); }

  void End() noexcept;

 private:
  bool mIsOutermost;
};

// Confines this process, and every process that it starts from then on, for good. It can still read
// files, use its open descriptors and query local sockets. It can no longer write, create, move or
// remove files, run programs, start processes, signal or trace others, mount, or reach a network
// that the machine's user database does not need. A forbidden call returns an error, mostly EPERM
// or EACCES; it never ends the process. docs/reliability.md has the details.
//
// What the kernel does not support is left out silently: this never fails. Call it once, from a
// program with one thread, before its first request. A library must not confine its users.
void LockIn();

}  // namespace tallowmere::process
