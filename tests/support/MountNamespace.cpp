#include "support/MountNamespace.h"

#include <sched.h>
#include <sys/mount.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace tallowmere::test {

bool EnterOwnMountNamespace() {
  static const bool entered =
      unshare(CLONE_NEWNS) == 0 && mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0;
  return entered;
}

// Stacks the former root on the new one, then unmounts it from there.
bool MakeRootOfMounts(const std::string& folder) {
  return chdir(folder.c_str()) == 0 && syscall(SYS_pivot_root, ".", ".") == 0 &&
         umount2(".", MNT_DETACH) == 0 && chdir("/") == 0;
}

ScopedMount::ScopedMount(const std::string& source, const std::string& place, const char* type,
                         unsigned long flags, const std::string& options)
    : mPlace(place),
      mMounted(mount(source.c_str(), place.c_str(), type, flags, options.c_str()) == 0) {}

void ScopedMount::Unmount() {
  if (mMounted) umount2(mPlace.c_str(), MNT_DETACH);
  mMounted = false;
}

}  // namespace tallowmere::test
