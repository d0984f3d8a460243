// What a process asks of its platform beside the host's calls. Elsewhere than on Linux all of it
// does nothing.
#pragma once

#include <MacTypes.h>

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

}  // namespace tallowmere::process
