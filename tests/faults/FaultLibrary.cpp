// The fault library, for LD_PRELOAD: makes one system call or one allocation of a service fail.
//
// A kernel filter turns every system call, including those inside the C library, into a signal,
// except those from one instruction of this file. The signal's handler makes the call from there,
// or writes the error into the registers that the call returns with. Allocations pass through the
// functions below on their way to the C library's. The clock is set some time ahead, so that no
// item is so new that a service examines it more often.
#include <linux/audit.h>
#include <linux/filter.h>
#include <linux/futex.h>
#include <linux/seccomp.h>
#include <signal.h>
#include <sys/mman.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <time.h>
#include <ucontext.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <climits>
#include <cstddef>
#include <cstdlib>

#include "faults/FaultPage.h"
#include "support/BecomeCopies.h"

// Makes a system call with six arguments; returns the kernel's result, with errors negative. The
// only call in the process that the filter lets pass, recognised by its return address.
extern "C" long FaultLibraryCall(long number, long first, long second, long third, long fourth,
                                 long fifth, long sixth);
extern "C" const char kFaultLibraryCallReturn[];
__asm__(R"(
    .text
    .hidden FaultLibraryCall
    .globl FaultLibraryCall
    .hidden kFaultLibraryCallReturn
    .globl kFaultLibraryCallReturn
  FaultLibraryCall:
    movq %rdi, %rax
    movq %rsi, %rdi
    movq %rdx, %rsi
    movq %rcx, %rdx
    movq %r8, %r10
    movq %r9, %r8
    movq 8(%rsp), %r9
    syscall
  kFaultLibraryCallReturn:
    ret
)");

// The C library's own functions.
extern "C" void* __libc_malloc(std::size_t size);
extern "C" void* __libc_calloc(std::size_t count, std::size_t size);
extern "C" void* __libc_realloc(void* block, std::size_t size);
extern "C" void* __libc_memalign(std::size_t alignment, std::size_t size);
extern "C" void __libc_free(void* block);

namespace tallowmere::test {
namespace {

// Holds the counts before the service begins, and where there is no page.
FaultPage gOwnPage;
FaultPage* gPage = &gOwnPage;

// Whether the service has not begun to read another request yet.
bool gIsBetweenRequests = true;

// --- System calls -----------------------------------------------------------------------------

struct Call {
  explicit Call(const greg_t* registers)
      : number(registers[REG_RAX]), arguments{registers[REG_RDI], registers[REG_RSI],
                                              registers[REG_RDX], registers[REG_R10],
                                              registers[REG_R8],  registers[REG_R9]} {}

  long Run() const {
    return FaultLibraryCall(number, arguments[0], arguments[1], arguments[2], arguments[3],
                            arguments[4], arguments[5]);
  }

  long number;
  long arguments[6];
};

long RunShortened(Call call) {
  // There must be room for one folder entry.
  const long least = call.number == SYS_getdents64 ? 512 : 1;
  call.arguments[2] = std::max(call.arguments[2] / 2, least);
  return call.Run();
}

long Fail(const Call& call, std::int32_t effect) {
  switch (call.number) {
    case SYS_close:  // the kernel closes even when it reports an error
      call.Run();
      return -effect;
    case SYS_brk:  // reports no error, but leaves the break where it is
      return FaultLibraryCall(SYS_brk, 0, 0, 0, 0, 0, 0);
    default:
      return -effect;
  }
}

// Wakes whoever waits for the service to be waiting.
void NoteRest() {
  ++gPage->rests;
  FaultLibraryCall(SYS_futex, reinterpret_cast<long>(&gPage->rests), FUTEX_WAKE, INT_MAX, 0, 0, 0);
}

long Carry(const Call& call) {
  const std::uint32_t count = ++gPage->calls;
  const SeenCall seen{call.number, call.arguments[0], call.arguments[2]};
  if (count <= kMostCalls) gPage->seen[count - 1] = seen;
  const bool isInput = call.number == SYS_read && call.arguments[0] == STDIN_FILENO;
  const bool beginsRequest = isInput && gIsBetweenRequests;
  if (isInput) gIsBetweenRequests = false;
  if (call.number == SYS_kill) gIsBetweenRequests = true;
  if (count == gPage->failingCall) {
    const std::int32_t effect = gPage->effect;
    gPage->failedCall = seen;
    gPage->failed = 1;
    if (effect != kShortened) return Fail(call, effect);
    if (beginsRequest) NoteRest();
    return RunShortened(call);
  }
  if (beginsRequest) NoteRest();
  return call.Run();
}

void OnCall(int, siginfo_t*, void* context) {
  greg_t* const registers = static_cast<ucontext_t*>(context)->uc_mcontext.gregs;
  registers[REG_RAX] = Carry(Call(registers));
}

void CatchCalls() {
  struct sigaction action {};
  action.sa_sigaction = OnCall;
  action.sa_flags = SA_SIGINFO;
  sigaction(SIGSYS, &action, nullptr);

  constexpr auto kLoad = static_cast<unsigned short>(BPF_LD | BPF_W | BPF_ABS);
  constexpr auto kIfEqual = static_cast<unsigned short>(BPF_JMP | BPF_JEQ | BPF_K);
  constexpr auto kReturn = static_cast<unsigned short>(BPF_RET | BPF_K);
  constexpr auto kAddress = static_cast<std::uint32_t>(offsetof(seccomp_data, instruction_pointer));
  const auto pass = reinterpret_cast<std::uintptr_t>(kFaultLibraryCallReturn);
  sock_filter program[] = {
      {kLoad, 0, 0, static_cast<std::uint32_t>(offsetof(seccomp_data, nr))},
      {kIfEqual, 4, 0, SYS_rt_sigreturn},  // used by the handler to return
      {kLoad, 0, 0, kAddress},
      {kIfEqual, 0, 3, static_cast<std::uint32_t>(pass)},
      {kLoad, 0, 0, kAddress + 4},
      {kIfEqual, 0, 1, static_cast<std::uint32_t>(pass >> 32)},
      {kReturn, 0, 0, SECCOMP_RET_ALLOW},
      {kReturn, 0, 0, SECCOMP_RET_TRAP},
  };
  const sock_fprog filter{static_cast<unsigned short>(std::size(program)), program};
  const bool isCaught = prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) == 0 &&
                        prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &filter, 0, 0) == 0;
  if (!isCaught) _exit(kCannotCatchCalls);
}

__attribute__((constructor)) void Begin() {
  const char* const descriptor = std::getenv(kFaultPageVariable);
  if (descriptor == nullptr) return;
  const int file = std::atoi(descriptor);  // NOLINT(cert-err34-c)
  void* const memory =
      mmap(nullptr, sizeof(FaultPage), PROT_READ | PROT_WRITE, MAP_SHARED, file, 0);
  if (memory == MAP_FAILED) _exit(kCannotCatchCalls);
  close(file);
  CatchCalls();
  close(BecomeCopies());
  auto* const page = static_cast<FaultPage*>(memory);
  page->liveAllocations = gOwnPage.liveAllocations.load();
  gPage = page;
}

// --- Allocations ------------------------------------------------------------------------------

bool HasToFail() {
  if (++gPage->allocations != gPage->failingAllocation) return false;
  gPage->callsBefore = gPage->calls.load();
  gPage->failed = 1;
  errno = ENOMEM;
  return true;
}

void* Counted(void* block) {
  if (block == nullptr) return nullptr;
  ++gPage->liveAllocations;
  return block;
}

}  // namespace
}  // namespace tallowmere::test

using namespace tallowmere::test;

extern "C" void* malloc(std::size_t size) {
  return HasToFail() ? nullptr : Counted(__libc_malloc(size));
}

extern "C" void* calloc(std::size_t count, std::size_t size) {
  return HasToFail() ? nullptr : Counted(__libc_calloc(count, size));
}

extern "C" void* realloc(void* block, std::size_t size) {
  if (HasToFail()) return nullptr;
  void* const moved = __libc_realloc(block, size);
  return block == nullptr ? Counted(moved) : moved;
}

extern "C" void* memalign(std::size_t alignment, std::size_t size) {
  return HasToFail() ? nullptr : Counted(__libc_memalign(alignment, size));
}

extern "C" void* aligned_alloc(std::size_t alignment, std::size_t size) {
  return memalign(alignment, size);
}

extern "C" int posix_memalign(void** block, std::size_t alignment, std::size_t size) {
  *block = memalign(alignment, size);
  return *block == nullptr ? ENOMEM : 0;
}

extern "C" void free(void* block) {
  if (block == nullptr) return;
  --gPage->liveAllocations;
  __libc_free(block);
}

// NOLINTNEXTLINE(readability-inconsistent-declaration-parameter-name): theirs are reserved.
extern "C" int clock_gettime(clockid_t clock, timespec* shown) noexcept {
  constexpr time_t kAhead = 60;
  const long result =
      FaultLibraryCall(SYS_clock_gettime, clock, reinterpret_cast<long>(shown), 0, 0, 0, 0);
  if (result == 0 && clock == CLOCK_REALTIME) shown->tv_sec += kAhead;
  if (result < 0) errno = static_cast<int>(-result);
  return result < 0 ? -1 : 0;
}
