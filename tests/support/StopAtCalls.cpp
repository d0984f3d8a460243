// Loaded into programs that stop at every system call, except those for waiting, memory and the two
// pipes, until the holder of a descriptor lets them continue. Each copy sends that descriptor, or a
// byte alone where stopping is not permitted.
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <array>
#include <cstddef>
#include <cstdlib>
#include <iterator>

#include "support/BecomeCopies.h"
#include "support/DescriptorMessage.h"

namespace tallowmere::test {
namespace {

constexpr std::array kGoingOn{SYS_sendmsg, SYS_exit_group, SYS_brk,         SYS_mmap,
                              SYS_munmap,  SYS_mprotect,   SYS_madvise,     SYS_futex,
                              SYS_read,    SYS_write,      SYS_rt_sigreturn};

int Listener() {
  std::array<sock_filter, 2 * kGoingOn.size() + 2> filter{};
  auto* next = filter.data();
  *next++ = BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr));
  for (const long call : kGoingOn) {
    *next++ = BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, static_cast<unsigned>(call), 0, 1);
    *next++ = BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW);
  }
  *next++ = BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_USER_NOTIF);
  const sock_fprog program{static_cast<unsigned short>(filter.size()), filter.data()};
  if (prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) != 0) return -1;
  return static_cast<int>(
      syscall(SYS_seccomp, SECCOMP_SET_MODE_FILTER, SECCOMP_FILTER_FLAG_NEW_LISTENER, &program));
}

__attribute__((constructor)) void Begin() {
  const int socket = BecomeCopies();
  if (socket < 0) return;
  const int listener = Listener();
  const char none = 0;
  const bool isSent = listener >= 0 ? SendDescriptor(socket, listener)
                                    : write(socket, &none, sizeof none) == sizeof none;
  if (!isSent) _exit(EXIT_FAILURE);
  if (listener >= 0) close(listener);
  close(socket);
}

}  // namespace
}  // namespace tallowmere::test
