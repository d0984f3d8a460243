#include "support/DeadMount.h"

#include <fcntl.h>
#include <sys/mount.h>
#include <unistd.h>

#include <utility>

namespace tallowmere::test {

DeadMount::DeadMount(const std::string& place) : mServer(open("/dev/fuse", O_RDWR | O_CLOEXEC)) {
  const std::string options =
      "fd=" + std::to_string(mServer) + ",rootmode=40000,user_id=0,group_id=0";
  mMount.emplace("dead", place, "fuse", MS_NODEV | MS_NOSUID, options);
}

DeadMount::~DeadMount() {
  mMount.reset();
  End();
}

void DeadMount::End() {
  if (mServer >= 0) close(std::exchange(mServer, -1));
}

}  // namespace tallowmere::test
