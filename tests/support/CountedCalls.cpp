#include "support/CountedCalls.h"

#include <linux/ptrace.h>
#include <signal.h>
#include <sys/ptrace.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

namespace tallowmere::test {
namespace {

bool IsForMemory(long call) {
  return call == SYS_brk || call == SYS_mmap || call == SYS_munmap || call == SYS_mprotect ||
         call == SYS_madvise;
}

// One call, which begins and ends the work.
void Stop() {
  syscall(SYS_kill, getpid(), SIGSTOP);
}

[[noreturn]] void Run(const std::function<void()>& prepare, const std::function<void()>& work) {
  if (ptrace(PTRACE_TRACEME, 0, nullptr, nullptr) != 0) _exit(1);
  prepare();
  Stop();
  work();
  Stop();
  _exit(0);
}

bool WaitForStop(pid_t child, int& signal) {
  int status = 0;
  if (waitpid(child, &status, 0) != child || !WIFSTOPPED(status)) return false;
  signal = WSTOPSIG(status);
  return true;
}

// The call at whose beginning a child stands; none at its end.
std::optional<long> CallBegun(pid_t child) {
  __ptrace_syscall_info info{};
  if (ptrace(static_cast<__ptrace_request>(PTRACE_GET_SYSCALL_INFO), child, sizeof info, &info) <=
          0 ||
      info.op != PTRACE_SYSCALL_INFO_ENTRY) {
    return std::nullopt;
  }
  return static_cast<long>(info.entry.nr);
}

std::optional<std::vector<long>> Trace(pid_t child) {
  constexpr int kAtACall = SIGTRAP | 0x80;
  int signal = 0;
  if (!WaitForStop(child, signal) || signal != SIGSTOP) return std::nullopt;
  if (ptrace(PTRACE_SETOPTIONS, child, nullptr, PTRACE_O_TRACESYSGOOD) != 0) return std::nullopt;
  std::vector<long> calls;
  for (;;) {
    if (ptrace(PTRACE_SYSCALL, child, nullptr, nullptr) != 0) return std::nullopt;
    if (!WaitForStop(child, signal)) return std::nullopt;
    if (signal == SIGSTOP) break;
    const auto call = signal == kAtACall ? CallBegun(child) : std::nullopt;
    if (call && !IsForMemory(*call)) calls.push_back(*call);
  }
  calls.pop_back();  // the stop itself
  return calls;
}

}  // namespace

std::optional<std::vector<long>> CallsOf(const std::function<void()>& prepare,
                                         const std::function<void()>& work) {
  const pid_t child = fork();
  if (child == 0) Run(prepare, work);
  auto calls = Trace(child);
  kill(child, SIGKILL);
  waitpid(child, nullptr, 0);
  return calls;
}

}  // namespace tallowmere::test
