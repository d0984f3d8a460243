// Which calls the filter decides by number alone. When a filter is installed, the kernel runs it
// once for each number, and never again for those that it allows without reading an argument:
// seccomp_cache_prepare in kernel/seccomp.c, since Linux 5.11.
#include <gtest/gtest.h>
#include <linux/seccomp.h>
#include <sys/syscall.h>

#include <cerrno>
#include <cstddef>
#include <cstdint>
#include <optional>

#include "kernel/SystemCallFilter.h"

namespace tallowmere::kernel {
namespace {

constexpr Openings kUsualOpenings{.toWrite = true, .toNetworks = false};

// The first comparison of the filter is with the architecture.
std::uint32_t ArchitectureOf(const SystemCallFilter& filter) {
  return filter.steps[1].k;
}

// Returns what the filter returns for a call on this machine, or nullopt when it reads an argument.
std::optional<std::uint32_t> DecisionByNumber(const SystemCallFilter& filter, int call) {
  std::uint32_t value = 0;
  for (std::size_t at = 0; at < filter.size;) {
    const sock_filter& step = filter.steps[at];
    switch (step.code) {
      case BPF_LD | BPF_W | BPF_ABS:
        if (step.k >= offsetof(seccomp_data, args)) return std::nullopt;
        value = step.k == offsetof(seccomp_data, arch) ? ArchitectureOf(filter)
                                                       : static_cast<std::uint32_t>(call);
        at += 1;
        break;
      case BPF_JMP | BPF_JEQ | BPF_K:
        at += 1U + (value == step.k ? step.jt : step.jf);
        break;
      case BPF_JMP | BPF_JGE | BPF_K:
        at += 1U + (value >= step.k ? step.jt : step.jf);
        break;
      case BPF_RET | BPF_K:
        return step.k;
      default:
        ADD_FAILURE() << "step " << at << " is of another kind: " << step.code;
        return std::nullopt;
    }
  }
  ADD_FAILURE() << "the filter has no end";
  return std::nullopt;
}

class ASystemCallFilter : public testing::Test {
 protected:
  void SetUp() override {
    if (mFilter.size == 0) GTEST_SKIP() << "there is no filter for this architecture";
  }

  const SystemCallFilter mFilter = MakeSystemCallFilter(kUsualOpenings);
};

// Every call of a request about known items, except the kill that looks for the parent: its signal
// is an argument.
TEST_F(ASystemCallFilter, AllowsTheCallsOfARequestByNumberAlone) {
  for (const int call : {SYS_read, SYS_write, SYS_close, SYS_openat, SYS_openat2, SYS_statx,
                         SYS_ppoll, SYS_pread64, SYS_name_to_handle_at, SYS_getdents64, SYS_brk}) {
    EXPECT_EQ(DecisionByNumber(mFilter, call), SECCOMP_RET_ALLOW) << call;
  }
#ifdef SYS_newfstatat  // has another name on 32-bit processors
  EXPECT_EQ(DecisionByNumber(mFilter, SYS_newfstatat), SECCOMP_RET_ALLOW);
#endif
#ifdef SYS_poll  // newer architectures only have ppoll
  EXPECT_EQ(DecisionByNumber(mFilter, SYS_poll), SECCOMP_RET_ALLOW);
#endif
}

TEST_F(ASystemCallFilter, LooksAtTheSignal) {
  EXPECT_EQ(DecisionByNumber(mFilter, SYS_kill), std::nullopt);
}

TEST_F(ASystemCallFilter, ChecksTheFlagsOfOpenWhereNothingElseDoes) {
  const SystemCallFilter filter = MakeSystemCallFilter({.toWrite = false, .toNetworks = false});
  EXPECT_EQ(DecisionByNumber(filter, SYS_openat), std::nullopt);
  EXPECT_EQ(DecisionByNumber(filter, SYS_openat2), SECCOMP_RET_ALLOW);
}

TEST_F(ASystemCallFilter, RefusesForbiddenCallsByNumberAlone) {
  for (const int call : {SYS_execve, SYS_mount, SYS_unlinkat, SYS_bpf}) {
    EXPECT_EQ(DecisionByNumber(mFilter, call), SECCOMP_RET_ERRNO | EPERM) << call;
  }
}

TEST_F(ASystemCallFilter, AnswersNewerCallsAsUnknown) {
  EXPECT_EQ(DecisionByNumber(mFilter, 4711), SECCOMP_RET_ERRNO | ENOSYS);
}

}  // namespace
}  // namespace tallowmere::kernel
