// What a process asks of its platform beside the host's calls. Where the host's own frameworks are,
// all of it does nothing.
#pragma once

namespace tallowmere::process {

// While one is open, the host's calls of this thread answer as at one moment: what one call has
// looked at serves the next, and a change that others make meanwhile may or may not be seen. Without
// one each call looks for itself.
//
// A moment keeps a few folders open, so that their volumes cannot be unmounted: open it for one
// request, not longer. Within another it is that one. It may be ended before its scope does; the
// end of the scope ends it, by an exception too.
class Moment {
 public:
  Moment() noexcept;
  Moment(const Moment&) = delete;
  Moment& operator=(const Moment&) = delete;
  ~Moment() { End(); }

  void End() noexcept;

 private:
  bool mIsOutermost;
};

// Locks this process in, and what it starts from now on, for good: from then on it can read files,
// use the descriptors that it has, and ask local sockets, but not write to files, make, move or
// remove them, run programs, start processes, signal or trace others, mount, or reach a network
// that the machine's user database does without. What is closed answers an error, mostly EPERM or
// EACCES; it never ends the process. docs/reliability.md tells all of it.
//
// What the kernel does not offer is left out without a word: this never fails. To be called once,
// by a program with one thread, before its first request. A library does not lock its users in.
void LockIn();

}  // namespace tallowmere::process
