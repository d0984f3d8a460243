#include "kernel/Confinement.h"

#include <linux/landlock.h>
#include <linux/seccomp.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cstdint>

#include "kernel/SystemCallFilter.h"
#include "kernel/UserDatabase.h"

namespace tallowmere::kernel {
namespace {

// struct landlock_ruleset_attr of every version of the interface: an older kernel accepts a longer
// one whose rest is 0. Signals are never scoped, as the process must be able to check for its
// parent.
struct Ruleset {
  std::uint64_t files = 0;    // version 1
  std::uint64_t network = 0;  // version 4
  std::uint64_t scopes = 0;   // version 6
};

// The file rights that each version added and that can be taken away: landlock(7). Reading is not
// among them, so that what is open, or opened by its handle, can be read wherever it is.
struct Rights {
  int version;
  std::uint64_t files;
};
constexpr Rights kRights[] = {
    {1, LANDLOCK_ACCESS_FS_EXECUTE | LANDLOCK_ACCESS_FS_WRITE_FILE | LANDLOCK_ACCESS_FS_REMOVE_DIR |
            LANDLOCK_ACCESS_FS_REMOVE_FILE | LANDLOCK_ACCESS_FS_MAKE_CHAR |
            LANDLOCK_ACCESS_FS_MAKE_DIR | LANDLOCK_ACCESS_FS_MAKE_REG |
            LANDLOCK_ACCESS_FS_MAKE_SOCK | LANDLOCK_ACCESS_FS_MAKE_FIFO |
            LANDLOCK_ACCESS_FS_MAKE_BLOCK | LANDLOCK_ACCESS_FS_MAKE_SYM},
    {2, LANDLOCK_ACCESS_FS_REFER},
    {3, 1 << 14},  // LANDLOCK_ACCESS_FS_TRUNCATE
    {5, 1 << 15},  // LANDLOCK_ACCESS_FS_IOCTL_DEV
};
constexpr int kVersionOfTruncating = 3;

// LANDLOCK_ACCESS_NET_BIND_TCP and LANDLOCK_ACCESS_NET_CONNECT_TCP.
constexpr int kVersionOfNetworks = 4;
constexpr std::uint64_t kTCP = 1 << 0 | 1 << 1;

Ruleset RulesetOf(int version, bool needsNetwork) {
  Ruleset ruleset;
  for (const Rights& rights : kRights) {
    if (rights.version <= version) ruleset.files |= rights.files;
  }
  if (version >= kVersionOfNetworks && !needsNetwork) ruleset.network = kTCP;
  return ruleset;
}

// Landlock: allows nothing but reading. Returns whether files can no longer be opened for writing
// or truncated. REQUIRES: no new privileges.
bool CloseFiles(bool needsNetwork) {
  const long version =
      syscall(SYS_landlock_create_ruleset, nullptr, 0, LANDLOCK_CREATE_RULESET_VERSION);
  if (version < 1) return false;
  const Ruleset ruleset = RulesetOf(static_cast<int>(version), needsNetwork);
  const long descriptor = syscall(SYS_landlock_create_ruleset, &ruleset, sizeof ruleset, 0);
  if (descriptor < 0) return false;
  const bool isClosed = syscall(SYS_landlock_restrict_self, descriptor, 0) == 0;
  close(static_cast<int>(descriptor));
  return isClosed && version >= kVersionOfTruncating;
}

// seccomp(2). REQUIRES: no new privileges.
void CloseSystemCalls(const Openings& openings) {
  SystemCallFilter filter = MakeSystemCallFilter(openings);
  if (filter.size == 0) return;
  const sock_fprog program{filter.size, filter.steps.data()};
  prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program);
}

}  // namespace

void LockIn() {
  prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0);
  const bool needsNetwork = UserDatabaseNeedsNetwork();
  const bool writingIsClosed = CloseFiles(needsNetwork);
  CloseSystemCalls({.toWrite = writingIsClosed, .toNetworks = needsNetwork});
}

}  // namespace tallowmere::kernel
