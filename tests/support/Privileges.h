// Running code in a process with fewer privileges than the test.
#pragma once

#include <linux/capability.h>
#include <sys/syscall.h>
#include <sys/types.h>
#include <sys/wait.h>
#include <unistd.h>

namespace tallowmere::test {

// Whether `prepare`, then `work`, return true in a child process.
template <class Prepare, class Work>
bool HoldsInChild(Prepare prepare, Work work) {
  const pid_t child = fork();
  if (child == 0) _exit(prepare() && work() ? 0 : 1);
  int status = 0;
  return waitpid(child, &status, 0) == child && WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

// Whether `work` returns true in a child process without privileges.
template <class Work>
bool HoldsForNobody(Work work) {
  constexpr uid_t kNobody = 65534;
  return HoldsInChild([] { return setresuid(kNobody, kNobody, kNobody) == 0; }, work);
}

// Whether `work` returns true in a child process that lacks a privilege below 32, such as
// CAP_SYS_ADMIN.
template <class Work>
bool HoldsWithout(unsigned capability, Work work) {
  const auto giveUp = [capability] {
    __user_cap_header_struct header{_LINUX_CAPABILITY_VERSION_3, 0};
    __user_cap_data_struct sets[_LINUX_CAPABILITY_U32S_3] = {};
    if (syscall(SYS_capget, &header, sets) != 0) return false;
    sets[0].effective &= ~(1U << capability);
    return syscall(SYS_capset, &header, sets) == 0;
  };
  return HoldsInChild(giveUp, work);
}

}  // namespace tallowmere::test
