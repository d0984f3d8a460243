#include "support/BecomeCopies.h"

#include <sched.h>
#include <signal.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <sys/types.h>
#include <unistd.h>

#include <array>
#include <cstdlib>

#include "support/DescriptorMessage.h"

namespace tallowmere::test {
namespace {

// Makes a copy whose parent is this process's. Returns its id, and 0 in the copy.
pid_t Copy() {
  // Where the C library keeps the id of its thread.
  int* id = nullptr;
  if (prctl(PR_GET_TID_ADDRESS, &id, 0, 0, 0) != 0) return -1;
  return static_cast<pid_t>(
      syscall(SYS_clone, CLONE_PARENT | CLONE_CHILD_SETTID | SIGCHLD, nullptr, nullptr, id, 0));
}

}  // namespace

int BecomeCopies() {
  const char* const descriptor = std::getenv(kCopiesSocketVariable);
  if (descriptor == nullptr) return -1;
  const int socket = std::atoi(descriptor);  // NOLINT(cert-err34-c)
  const char ready = 1;
  if (write(socket, &ready, sizeof ready) != sizeof ready) _exit(EXIT_FAILURE);
  while (true) {
    std::array<int, 3> streams{};
    for (int& stream : streams) {
      stream = ReceiveDescriptor(socket);
      if (stream < 0) _exit(EXIT_SUCCESS);
    }
    const pid_t copy = Copy();
    for (int i = 0; i < 3; ++i) {
      if (copy == 0) dup2(streams[static_cast<std::size_t>(i)], i);
      close(streams[static_cast<std::size_t>(i)]);
    }
    // A copy tells of itself, so that nothing that it sends can come before.
    const pid_t told = copy == 0 ? getpid() : -1;
    if (copy <= 0 && write(socket, &told, sizeof told) != sizeof told) _exit(EXIT_FAILURE);
    if (copy == 0) return socket;
  }
}

}  // namespace tallowmere::test
