#include "support/CountedCalls.h"

#include <signal.h>
#include <sys/ptrace.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <stdexcept>

namespace tallowmere::test {
namespace {

bool IsForMemory(long call) {
  return call == SYS_brk || call == SYS_mmap || call == SYS_munmap || call == SYS_mprotect ||
         call == SYS_madvise;
}

// Makes a call that tells the parent where the child is.
void Stop(pid_t self) {
  kill(self, SIGSTOP);
}

[[noreturn]] void Run(const std::function<void()>& prepare, const std::function<void()>& work) {
  const pid_t self = getpid();
  if (ptrace(PTRACE_TRACEME, 0, nullptr, nullptr) != 0) _exit(1);
  Stop(self);
  prepare();
  Stop(self);
  work();
  Stop(self);
  _exit(0);
}

// The signal that stopped a child; nullopt when the child has ended.
std::optional<int> WaitForStop(pid_t child) {
  int status = 0;
  if (waitpid(child, &status, 0) != child || !WIFSTOPPED(status)) return std::nullopt;
  return WSTOPSIG(status);
}

// The call that a child is about to make; nullopt at the end of one.
std::optional<long> CallBegun(pid_t child) {
  __ptrace_syscall_info info{};
  if (ptrace(PTRACE_GET_SYSCALL_INFO, child, sizeof info, &info) <= 0 ||
      info.op != PTRACE_SYSCALL_INFO_ENTRY) {
    return std::nullopt;
  }
  return static_cast<long>(info.entry.nr);
}

// The calls up to and including the next Stop().
std::vector<long> CallsToNextStop(pid_t child) {
  constexpr int kAtACall = SIGTRAP | 0x80;
  std::vector<long> calls;
  for (;;) {
    const bool goesOn = ptrace(PTRACE_SYSCALL, child, nullptr, nullptr) == 0;
    const auto signal = goesOn ? WaitForStop(child) : std::nullopt;
    if (!signal) throw std::runtime_error("what is traced has ended the process");
    if (signal == SIGSTOP) return calls;
    const auto call = signal == kAtACall ? CallBegun(child) : std::nullopt;
    if (call && !IsForMemory(*call)) calls.push_back(*call);
  }
}

std::optional<std::vector<long>> Trace(pid_t child) {
  const bool isTraced = WaitForStop(child) == SIGSTOP &&
                        ptrace(PTRACE_SETOPTIONS, child, nullptr, PTRACE_O_TRACESYSGOOD) == 0;
  if (!isTraced) return std::nullopt;
  CallsToNextStop(child);
  auto calls = CallsToNextStop(child);
  calls.pop_back();  // the call of Stop() itself
  return calls;
}

}  // namespace

std::optional<std::vector<long>> CallsOf(const std::function<void()>& prepare,
                                         const std::function<void()>& work) {
  const pid_t child = fork();
  if (child == 0) Run(prepare, work);
  const auto end = [child] {
    kill(child, SIGKILL);
    waitpid(child, nullptr, 0);
  };
  try {
    auto calls = Trace(child);
    end();
    return calls;
  } catch (...) {
    end();
    throw;
  }
}

}  // namespace tallowmere::test
