// Loaded into programs that are copied and otherwise as they are.
#include <unistd.h>

#include "support/BecomeCopies.h"

namespace tallowmere::test {
namespace {

__attribute__((constructor)) void Begin() {
  const int socket = BecomeCopies();
  if (socket >= 0) close(socket);
}

}  // namespace
}  // namespace tallowmere::test
