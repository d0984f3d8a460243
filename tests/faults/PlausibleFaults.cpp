#include "faults/PlausibleFaults.h"

#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>

namespace tallowmere::test {
namespace {

std::vector<std::int32_t> EffectsOnBytes(const SeenCall& call) {
  std::vector<std::int32_t> effects{EINTR, EIO, EAGAIN, ENOMEM, ESTALE};
  const bool isPipe = call.number == SYS_write || call.first == STDIN_FILENO;
  if (isPipe) effects.push_back(kWithoutBytes);
  if (call.size > 1) effects.push_back(kShortened);
  return effects;
}

}  // namespace

std::vector<std::int32_t> PlausibleEffects(const SeenCall& call) {
  switch (call.number) {
    case SYS_exit_group:
    case SYS_futex:
    case SYS_getuid:
    case SYS_munmap:
      return {};
    case SYS_brk:
    case SYS_mmap:
    case SYS_mremap:
    case SYS_mprotect:
      return {ENOMEM};
    case SYS_close:
      return {EINTR, EIO};
    case SYS_kill:
      return {EPERM, ESRCH};
    case SYS_poll:
      return {EINTR, ENOMEM};
    case SYS_read:
    case SYS_write:
    case SYS_pread64:
      return EffectsOnBytes(call);
    case SYS_getdents64:
      return {EINTR, EIO, EACCES, ENOMEM, ESTALE, kShortened};
    default:  // calls that find or open something by its name, or report on it
      return {EINTR, EIO, EACCES, EMFILE, ENOMEM, ELOOP, ENAMETOOLONG, ESTALE, EAGAIN};
  }
}

}  // namespace tallowmere::test
