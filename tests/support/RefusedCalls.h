// System calls that the kernel refuses from now on, as a sandbox does: for processes of a test's
// own, for good.
#pragma once

namespace tallowmere::test {

// Lets a system call fail with that error. False where that cannot be arranged.
bool RefuseCall(long call, int error);

// The same for one request of ioctl(2).
bool RefuseIoctl(unsigned long request, int error);

}  // namespace tallowmere::test
