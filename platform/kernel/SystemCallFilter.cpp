#include "kernel/SystemCallFilter.h"

// The architectures whose calls and registers are known here.
#if (defined(__x86_64__) && !defined(__ILP32__)) || defined(__i386__) || \
    (defined(__aarch64__) && defined(__AARCH64EL__) && !defined(__ILP32__))

#include <fcntl.h>
#include <linux/audit.h>
#include <linux/fs.h>
#include <linux/seccomp.h>
#include <sched.h>
#include <sys/ioctl.h>
#include <sys/socket.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>
#include <cstddef>
#include <cstdint>
#include <span>

namespace tallowmere::kernel {
namespace {

#if defined(__x86_64__) && !defined(__ILP32__)
constexpr std::uint32_t kArchitecture = AUDIT_ARCH_X86_64;
#elif defined(__i386__)
constexpr std::uint32_t kArchitecture = AUDIT_ARCH_I386;
#else
constexpr std::uint32_t kArchitecture = AUDIT_ARCH_AARCH64;
#endif

#if defined(__SANITIZE_ADDRESS__)
constexpr bool kLooksForLeaks = true;  // at exit, from a process that traces this one
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
constexpr bool kLooksForLeaks = true;
#else
constexpr bool kLooksForLeaks = false;
#endif
#else
constexpr bool kLooksForLeaks = false;
#endif

// --- What becomes of each call ------------------------------------------------------------------

enum class Rule : std::uint8_t {
  kAllow,
  kRefuse,       // EPERM
  kUnknown,      // ENOSYS, as from a kernel that lacks the call
  kNoSignal,     // kill: only the check for a process
  kThisProcess,  // tgkill: only to end itself, as abort(3) does
  kItsOwn,       // prlimit64: only for 0 or its own id
  kThread,       // clone
  kSocket,       // socket, socketpair: by family
  kNetwork,      // calls that only network sockets need
  kFlagsSecond,  // open: not for writing
  kFlagsThird,   // openat, open_by_handle_at: the same
  kRequest,      // ioctl: only requests that read
};

// The last call known when these lists were made; since 424 all architectures use the same numbers.
// Newer calls may open what is closed here. The numbers of x86_64's x32 are above it too.
constexpr unsigned kLastKnownCall = 450;  // set_mempolicy_home_node, Linux 5.17
constexpr unsigned kNumberOfCalls = kLastKnownCall + 1;

// Running programs; tracing, reading and signalling other processes; leaving their surroundings.
// Calls that take a process's descriptor are closed by closing pidfd_open.
constexpr unsigned kOfProcesses[] = {
    SYS_execve,  SYS_execveat,        SYS_process_vm_readv,  SYS_process_vm_writev, SYS_kcmp,
    SYS_tkill,   SYS_rt_sigqueueinfo, SYS_rt_tgsigqueueinfo, SYS_pidfd_send_signal, SYS_pidfd_open,
    SYS_unshare, SYS_setns,           SYS_migrate_pages,     SYS_move_pages,
};

// Changing what is mounted, and which folder is the root.
constexpr unsigned kOfMounts[] = {
    SYS_mount,   SYS_umount2,  SYS_pivot_root,  SYS_chroot, SYS_open_tree,     SYS_move_mount,
    SYS_fsopen,  SYS_fsconfig, SYS_fsmount,     SYS_fspick, SYS_mount_setattr, SYS_swapon,
    SYS_swapoff, SYS_quotactl, SYS_quotactl_fd, SYS_acct,   SYS_nfsservctl,
};

// Creating, changing, moving and removing files and their metadata.
constexpr unsigned kOfFiles[] = {
    SYS_truncate,  SYS_ftruncate,   SYS_unlinkat,     SYS_renameat2,    SYS_linkat,
    SYS_symlinkat, SYS_mkdirat,     SYS_mknodat,      SYS_fchmod,       SYS_fchmodat,
    SYS_fchown,    SYS_fchownat,    SYS_utimensat,    SYS_setxattr,     SYS_lsetxattr,
    SYS_fsetxattr, SYS_removexattr, SYS_lremovexattr, SYS_fremovexattr,
#ifdef SYS_renameat
    SYS_renameat,
#endif
#ifdef SYS_open  // calls that take only paths, which newer architectures lack
    SYS_creat,     SYS_unlink,      SYS_rename,       SYS_link,         SYS_symlink,
    SYS_mkdir,     SYS_rmdir,       SYS_mknod,        SYS_chmod,        SYS_chown,
    SYS_lchown,    SYS_utime,       SYS_utimes,       SYS_futimesat,
#endif
};

// Sharing memory and messages with other processes, and being called by them.
constexpr unsigned kOfSharing[] = {
    SYS_shmget,       SYS_shmat,           SYS_shmctl,    SYS_shmdt,         SYS_msgget,
    SYS_msgsnd,       SYS_msgrcv,          SYS_msgctl,    SYS_mq_open,       SYS_mq_unlink,
    SYS_mq_timedsend, SYS_mq_timedreceive, SYS_mq_notify, SYS_mq_getsetattr, SYS_listen,
};

// Changing the kernel, the clock and the machine, and parts of the kernel with a history of holes.
constexpr unsigned kOfTheMachine[] = {
    SYS_init_module,
    SYS_finit_module,
    SYS_delete_module,
    SYS_kexec_load,
    SYS_bpf,
    SYS_perf_event_open,
    SYS_userfaultfd,
    SYS_fanotify_init,
    SYS_fanotify_mark,
    SYS_io_uring_setup,
    SYS_io_uring_enter,
    SYS_io_uring_register,
    SYS_keyctl,
    SYS_add_key,
    SYS_request_key,
    SYS_reboot,
    SYS_sethostname,
    SYS_setdomainname,
    SYS_settimeofday,
    SYS_clock_settime,
    SYS_adjtimex,
    SYS_clock_adjtime,
    SYS_vhangup,
#ifdef SYS_kexec_file_load
    SYS_kexec_file_load,
#endif
#ifdef SYS_iopl  // only on x86 processors
    SYS_iopl,
    SYS_ioperm,
    SYS_modify_ldt,
    SYS_uselib,
#endif
};

// Harmless calls that nobody needs, numbered between others on x86_64: including them makes the
// filter shorter and the process start faster.
constexpr unsigned kInBetween[] = {
    SYS_sync,
    SYS_syncfs,
    SYS_waitid,
    SYS_recvmmsg,
    SYS_ioprio_set,
    SYS_ioprio_get,
    SYS_inotify_add_watch,
    SYS_inotify_rm_watch,
    SYS_mbind,
    SYS_set_mempolicy,
    SYS_get_mempolicy,
    SYS_sched_setattr,
    SYS_sched_getattr,
#ifdef SYS_setrlimit
    SYS_setrlimit,
#endif
#ifdef SYS_inotify_init
    SYS_inotify_init,
    SYS_vserver,
#endif
#ifdef SYS__sysctl
    SYS__sysctl,
    SYS_create_module,
    SYS_get_kernel_syms,
    SYS_query_module,
#endif
};

#ifdef __i386__
// The same calls again, for longer numbers and from before the others existed. This architecture's
// socketcall stays open: there, a socket's family is behind a pointer.
constexpr unsigned kOfThisArchitecture[] = {
    SYS_truncate64,
    SYS_ftruncate64,
    SYS_chown32,
    SYS_lchown32,
    SYS_fchown32,
    SYS_umount,
    SYS_stime,
    SYS_ipc,
    SYS_vm86,
    SYS_vm86old,
    SYS_clock_settime64,
    SYS_clock_adjtime64,
    SYS_utimensat_time64,
    SYS_mq_timedsend_time64,
    SYS_mq_timedreceive_time64,
};
#else
constexpr std::span<const unsigned> kOfThisArchitecture;
#endif

// The ioctl requests that pass: the label of a file system; the geometry of xfs and the generations
// of its items (XFS_IOC_FSGEOMETRY, XFS_IOC_BULKSTAT); what the C library asks of a stream and a
// socket. Compared by kind and number, whatever their size.
constexpr unsigned KindAndNumber(unsigned request) {
  return request & (_IOC_TYPEMASK << _IOC_TYPESHIFT | _IOC_NRMASK << _IOC_NRSHIFT);
}
constexpr unsigned kRequests[] = {KindAndNumber(FS_IOC_GETFSLABEL), _IOC(0U, 'X', 126U, 0U),
                                  _IOC(0U, 'X', 127U, 0U),          KindAndNumber(TCGETS),
                                  KindAndNumber(FIONREAD),          KindAndNumber(FIONBIO)};

// Families of sockets: local ones, and those of networks.
constexpr unsigned kLocalFamilies[] = {AF_UNIX};
constexpr unsigned kAllFamilies[] = {AF_UNIX, AF_INET, AF_INET6, AF_NETLINK};

constexpr unsigned kToWrite = O_ACCMODE | O_CREAT | O_TRUNC | (O_TMPFILE & ~O_DIRECTORY);
constexpr unsigned kNewNamespaces = CLONE_NEWNS | CLONE_NEWCGROUP | CLONE_NEWUTS | CLONE_NEWIPC |
                                    CLONE_NEWUSER | CLONE_NEWPID | CLONE_NEWNET;

using Rules = std::array<Rule, kNumberOfCalls>;

constexpr void Refuse(Rules& rules, std::span<const unsigned> calls) {
  for (const unsigned call : calls) rules.at(call) = Rule::kRefuse;
}

constexpr Rules MakeRules() {
  Rules rules{};  // kAllow
  for (const std::span<const unsigned> calls :
       {std::span<const unsigned>(kOfProcesses), std::span<const unsigned>(kOfMounts),
        std::span<const unsigned>(kOfFiles), std::span<const unsigned>(kOfSharing),
        std::span<const unsigned>(kOfTheMachine), std::span<const unsigned>(kInBetween),
        std::span<const unsigned>(kOfThisArchitecture)}) {
    Refuse(rules, calls);
  }
  rules[SYS_clone3] = Rule::kUnknown;  // its flags are behind a pointer; callers fall back to clone
  rules[SYS_kill] = Rule::kNoSignal;
  rules[SYS_tgkill] = Rule::kThisProcess;
  rules[SYS_prlimit64] = Rule::kItsOwn;
  rules[SYS_socket] = rules[SYS_socketpair] = Rule::kSocket;
  rules[SYS_bind] = Rule::kNetwork;
  rules[SYS_ioctl] = Rule::kRequest;
  rules[SYS_openat] = rules[SYS_open_by_handle_at] = Rule::kFlagsThird;
#ifdef SYS_open
  rules[SYS_open] = Rule::kFlagsSecond;
  if (!kLooksForLeaks) rules[SYS_fork] = rules[SYS_vfork] = Rule::kRefuse;
#endif
  if (!kLooksForLeaks) rules[SYS_clone] = Rule::kThread;
  if (!kLooksForLeaks) rules[SYS_ptrace] = Rule::kRefuse;
  return rules;
}

constexpr Rules kRules = MakeRules();

constexpr Rule kRulesWithLooks[] = {Rule::kNoSignal,   Rule::kThisProcess, Rule::kItsOwn,
                                    Rule::kThread,     Rule::kSocket,      Rule::kFlagsSecond,
                                    Rule::kFlagsThird, Rule::kRequest};

// --- The program --------------------------------------------------------------------------------

// A run of neighbouring calls with the same rule.
struct Run {
  unsigned first;
  Rule rule;
};

// The offset of an argument's low half: none that are examined are wider.
constexpr unsigned Argument(unsigned index) {
  return static_cast<unsigned>(offsetof(seccomp_data, args) + index * sizeof(std::uint64_t));
}

// Stands for this process's id, which only the running process knows.
constexpr unsigned kSelf = ~0U;

// Writes the filter's steps. The steps for a rule come after all jumps to it, since the kernel only
// allows forward jumps.
class Writer {
 public:
  constexpr explicit Writer(const Openings& openings) : mOpenings(openings) { Write(); }

  constexpr const SystemCallFilter& Filter() const { return mFilter; }

 private:
  constexpr void Write() {
    Load(offsetof(seccomp_data, arch));
    Compare(BPF_JEQ, kArchitecture);
    LeadTo(Rule::kRefuse, kNo);
    Load(offsetof(seccomp_data, nr));
    WriteChoice();
    for (const Rule rule : kRulesWithLooks) {
      if (Arrive(rule)) WriteLook(rule);
    }
    Arrive(Rule::kAllow);
    Add(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW));
    Arrive(Rule::kRefuse);
    Add(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | EPERM));
    Arrive(Rule::kUnknown);
    Add(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | ENOSYS));
  }

  enum Outcome : bool { kNo, kYes };  // of a comparison

  struct Way {
    unsigned short from;
    Outcome outcome;
    Rule to;
  };

  constexpr Rule RuleOf(unsigned call) const {
    if (call > kLastKnownCall) return Rule::kUnknown;
    switch (kRules[call]) {
      case Rule::kFlagsSecond:
      case Rule::kFlagsThird:
        return mOpenings.toWrite ? Rule::kAllow : kRules[call];
      case Rule::kNetwork:
        return mOpenings.toNetworks ? Rule::kAllow : Rule::kRefuse;
      default:
        return kRules[call];
    }
  }

  constexpr void Add(sock_filter step) { mFilter.steps.at(mFilter.size++) = step; }
  constexpr void Load(unsigned offset) { Add(BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offset)); }
  constexpr void Keep(unsigned bits) { Add(BPF_STMT(BPF_ALU | BPF_AND | BPF_K, bits)); }
  constexpr void Compare(unsigned short how, unsigned with) {
    Add(BPF_JUMP(static_cast<unsigned short>(BPF_JMP | how | BPF_K), with, 0, 0));
  }

  // Makes a comparison with this outcome jump to the next step.
  constexpr void LeadOn(unsigned short from, Outcome outcome) {
    const auto distance = static_cast<std::uint8_t>(mFilter.size - from - 1);
    (outcome == kYes ? mFilter.steps.at(from).jt : mFilter.steps.at(from).jf) = distance;
  }
  // Makes the last step jump to a rule's steps.
  constexpr void LeadTo(Rule rule, Outcome outcome) { LeadTo(rule, outcome, Last()); }
  constexpr void LeadTo(Rule rule, Outcome outcome, unsigned short from) {
    mWays.at(mWayCount++) = {from, outcome, rule};
  }
  // Makes all jumps to a rule lead to the next step. Returns false when there are none.
  constexpr bool Arrive(Rule rule) {
    bool isAwaited = false;
    for (const Way& way : std::span(mWays).first(mWayCount)) {
      if (way.to != rule) continue;
      isAwaited = true;
      LeadOn(way.from, way.outcome);
    }
    return isAwaited;
  }
  constexpr unsigned short Last() const { return static_cast<unsigned short>(mFilter.size - 1); }

  // Maps the call's number to its rule.
  constexpr void WriteChoice() {
    std::array<Run, kNumberOfCalls + 1> runs{};
    std::size_t count = 0;
    for (unsigned call = 0; call <= kNumberOfCalls; ++call) {
      const Rule rule = RuleOf(call);
      if (count == 0 || runs[count - 1].rule != rule) runs[count++] = {call, rule};
    }
    Choose(std::span(runs).first(count));
  }

  // A binary search, so that few steps run for each call.
  constexpr void Choose(std::span<const Run> runs) {
    const std::size_t half = runs.size() / 2;
    Compare(BPF_JGE, runs[half].first);
    const unsigned short step = Last();
    Continue(step, kYes, runs.subspan(half));
    Continue(step, kNo, runs.first(half));
  }
  constexpr void Continue(unsigned short step, Outcome outcome, std::span<const Run> runs) {
    if (runs.size() == 1) return LeadTo(runs.front().rule, outcome, step);
    LeadOn(step, outcome);
    Choose(runs);
  }

  // Examines an argument and decides.
  constexpr void WriteLook(Rule rule) {
    switch (rule) {
      case Rule::kNoSignal:
        Load(Argument(1));
        return AllowWhere(0);
      case Rule::kThisProcess:
        Load(Argument(0));
        return AllowWhere(kSelf);
      case Rule::kItsOwn:
        Load(Argument(0));
        return AllowWhere(std::array{0U, kSelf});
      case Rule::kThread:
        Load(Argument(0));
        Keep(CLONE_THREAD | kNewNamespaces);
        return AllowWhere(CLONE_THREAD);
      case Rule::kSocket:
        Load(Argument(0));
        return mOpenings.toNetworks ? AllowWhere(kAllFamilies) : AllowWhere(kLocalFamilies);
      case Rule::kFlagsSecond:
      case Rule::kFlagsThird:
        Load(Argument(rule == Rule::kFlagsSecond ? 1 : 2));
        Keep(kToWrite);
        return AllowWhere(0);
      case Rule::kRequest:
        Load(Argument(1));
        Keep(KindAndNumber(~0U));
        return AllowWhere(kRequests);
      default:
        return;
    }
  }
  constexpr void AllowWhere(unsigned value) { AllowWhere({&value, 1}); }
  constexpr void AllowWhere(std::span<const unsigned> values) {
    for (const unsigned value : values) {
      Compare(BPF_JEQ, value);
      LeadTo(Rule::kAllow, kYes);
    }
    LeadTo(Rule::kRefuse, kNo);
  }

  const Openings mOpenings;
  SystemCallFilter mFilter{};
  std::array<Way, SystemCallFilter::kMost> mWays{};
  std::size_t mWayCount = 0;
};

#ifdef TALLOWMERE_COVERAGE
// Built on each use, so that coverage counts the code that builds it.
SystemCallFilter FilterFor(const Openings& openings) {
  return Writer(openings).Filter();
}
#else
// Built by the compiler: a starting process only copies the one that it needs.
constexpr SystemCallFilter kFilters[2][2] = {
    {Writer({false, false}).Filter(), Writer({false, true}).Filter()},
    {Writer({true, false}).Filter(), Writer({true, true}).Filter()},
};
const SystemCallFilter& FilterFor(const Openings& openings) {
  return kFilters[openings.toWrite ? 1 : 0][openings.toNetworks ? 1 : 0];
}
#endif

}  // namespace

SystemCallFilter MakeSystemCallFilter(const Openings& openings) {
  SystemCallFilter filter = FilterFor(openings);
  const auto self = static_cast<unsigned>(getpid());
  for (sock_filter& step : filter.steps) {
    if (step.k == kSelf) step.k = self;
  }
  return filter;
}

}  // namespace tallowmere::kernel

#else

tallowmere::kernel::SystemCallFilter tallowmere::kernel::MakeSystemCallFilter(const Openings&) {
  return {};
}

#endif
