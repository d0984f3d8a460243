// A file system whose server never answers: whoever accesses it waits.
#pragma once

#include <optional>
#include <string>

#include "support/MountNamespace.h"

namespace tallowmere::test {

class DeadMount {
 public:
  explicit DeadMount(const std::string& place);
  DeadMount(const DeadMount&) = delete;
  DeadMount& operator=(const DeadMount&) = delete;
  ~DeadMount();

  // False without FUSE or the right to mount.
  bool IsMounted() const { return mServer >= 0 && mMount->IsMounted(); }

  // Ends the server: all who wait get an error.
  void End();

 private:
  int mServer;
  std::optional<ScopedMount> mMount;
};

}  // namespace tallowmere::test
