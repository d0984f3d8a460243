// stop_at_calls SOCKET PROGRAM ARGUMENTS…: executes the program, which then stops at every system
// call, except those for waiting, memory and the two pipes, until the holder of the descriptor that
// is sent through the socket lets it continue. Exits with status 2 where that is not permitted.
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <array>
#include <cstddef>
#include <cstdlib>
#include <vector>

#include "support/DescriptorMessage.h"

namespace {

constexpr std::array kGoingOn{SYS_sendmsg, SYS_execve, SYS_exit_group, SYS_brk,
                              SYS_mmap,    SYS_munmap, SYS_mprotect,   SYS_madvise,
                              SYS_futex,   SYS_read,   SYS_write,      SYS_rt_sigreturn};

int Listener() {
  std::vector<sock_filter> filter;
  filter.push_back(BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr)));
  for (const long call : kGoingOn) {
    filter.push_back(BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, static_cast<unsigned>(call), 0, 1));
    filter.push_back(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW));
  }
  filter.push_back(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_USER_NOTIF));
  const sock_fprog program{static_cast<unsigned short>(filter.size()), filter.data()};
  if (prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) != 0) return -1;
  return static_cast<int>(
      syscall(SYS_seccomp, SECCOMP_SET_MODE_FILTER, SECCOMP_FILTER_FLAG_NEW_LISTENER, &program));
}

}  // namespace

int main(int count, char** arguments) {
  if (count < 3) return 1;
  const int listener = Listener();
  if (listener < 0) return 2;
  if (!tallowmere::test::SendDescriptor(std::atoi(arguments[1]), listener)) return 2;
  execv(arguments[2], arguments + 2);
  return 1;
}
