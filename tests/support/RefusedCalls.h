// Makes the kernel refuse system calls, as a sandbox does: for a test's own processes, for good.
#pragma once

namespace tallowmere::test {

// Makes a system call fail with this error. Returns false where that is not possible.
bool RefuseCall(long call, int error);

// The same for one request of ioctl(2).
bool RefuseIoctl(unsigned long request, int error);

}  // namespace tallowmere::test
