#include "support/RefusedCalls.h"

#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sys/prctl.h>
#include <sys/syscall.h>

#include <cstddef>
#include <cstdint>
#include <vector>

namespace tallowmere::test {
namespace {

// Refuses the calls that pass all checks; a check that fails allows the call.
bool Install(std::vector<sock_filter> checks, int error) {
  for (std::size_t i = 0; i < checks.size(); ++i) {
    // Jumps over the remaining checks and the refusal.
    if (BPF_CLASS(checks[i].code) == BPF_JMP) {
      checks[i].jf = static_cast<std::uint8_t>(checks.size() - i);
    }
  }
  checks.push_back(
      BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | static_cast<std::uint32_t>(error)));
  checks.push_back(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW));
  const sock_fprog program{static_cast<unsigned short>(checks.size()), checks.data()};
  return prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) == 0 &&
         prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program) == 0;
}

constexpr std::uint32_t kNumber = offsetof(seccomp_data, nr);
// The lower half on machines with this byte order.
constexpr std::uint32_t kSecondArgument = offsetof(seccomp_data, args[1]);

}  // namespace

bool RefuseCall(long call, int error) {
  return Install({BPF_STMT(BPF_LD | BPF_W | BPF_ABS, kNumber),
                  BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, static_cast<std::uint32_t>(call), 0, 0)},
                 error);
}

bool RefuseIoctl(unsigned long request, int error) {
  return Install({BPF_STMT(BPF_LD | BPF_W | BPF_ABS, kNumber),
                  BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, SYS_ioctl, 0, 0),
                  BPF_STMT(BPF_LD | BPF_W | BPF_ABS, kSecondArgument),
                  BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, static_cast<std::uint32_t>(request), 0, 0)},
                 error);
}

}  // namespace tallowmere::test
