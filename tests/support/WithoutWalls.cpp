// without_walls landlock|filters|both PROGRAM ARGUMENTS…: executes the program on a kernel that
// appears to lack Landlock, filters of system calls, or both.
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <string>
#include <vector>

namespace {

using Filter = std::vector<sock_filter>;

constexpr unsigned kCall = offsetof(seccomp_data, nr);
constexpr unsigned kFirstArgument = offsetof(seccomp_data, args);

// Adds steps that run only where the value at an offset equals `value`.
void Where(Filter& filter, unsigned offset, long value, const Filter& steps) {
  filter.push_back(BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offset));
  filter.push_back(BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, static_cast<unsigned>(value), 0,
                            static_cast<std::uint8_t>(steps.size())));
  filter.insert(filter.end(), steps.begin(), steps.end());
}

Filter Answer(int error) {
  return {BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | static_cast<unsigned>(error))};
}

Filter FilterOf(const std::string& missing) {
  Filter filter;
  if (missing != "filters") {
    for (const long call :
         {SYS_landlock_create_ruleset, SYS_landlock_add_rule, SYS_landlock_restrict_self}) {
      Where(filter, kCall, call, Answer(ENOSYS));
    }
  }
  if (missing != "landlock") {
    Where(filter, kCall, SYS_seccomp, Answer(ENOSYS));
    Filter setting;
    Where(setting, kFirstArgument, PR_SET_SECCOMP, Answer(EINVAL));
    Where(filter, kCall, SYS_prctl, setting);
  }
  filter.push_back(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW));
  return filter;
}

}  // namespace

int main(int count, char** arguments) {
  if (count < 3) return 1;
  Filter filter = FilterOf(arguments[1]);
  const sock_fprog program{static_cast<unsigned short>(filter.size()), filter.data()};
  if (prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) != 0 ||
      prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program) != 0) {
    return 2;
  }
  execvp(arguments[2], arguments + 2);
  std::perror(arguments[2]);
  return 1;
}
