#include "support/Copies.h"

#include <sys/socket.h>
#include <unistd.h>

#include <array>
#include <cstdlib>
#include <vector>

#include "support/BecomeCopies.h"
#include "support/DescriptorMessage.h"

namespace tallowmere::test {

Copies::Copies(const std::string& program, const std::string& library) {
  std::array<int, 2> ends{};
  if (socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, ends.data()) != 0) std::abort();
  mSocket = ends[0];
  const int inherited = dup(ends[1]);
  close(ends[1]);
  setenv("LD_PRELOAD", library.c_str(), 1);
  setenv(kCopiesSocketVariable, std::to_string(inherited).c_str(), 1);
  mOriginal =
      std::make_unique<ChildProgram>(program, std::vector<std::string>{std::to_string(getpid())});
  unsetenv("LD_PRELOAD");
  unsetenv(kCopiesSocketVariable);
  close(inherited);
  char ready = 0;
  mCanMake = read(mSocket, &ready, sizeof ready) == sizeof ready;
}

Copies::~Copies() {
  close(mSocket);
}

pid_t Copies::Make(const ChildProgram::Streams& streams) const {
  for (const int stream : streams) {
    if (!SendDescriptor(mSocket, stream)) return -1;
  }
  pid_t copy = -1;
  return read(mSocket, &copy, sizeof copy) == sizeof copy ? copy : -1;
}

int Copies::Descriptor() const {
  return ReceiveDescriptor(mSocket);
}

}  // namespace tallowmere::test
