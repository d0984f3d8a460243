// Mounting for a test, invisible to the rest of the machine.
#pragma once

#include <string>

namespace tallowmere::test {

// Moves this process, and what it starts afterwards, into a new mount namespace from and to which
// no mount propagates. Returns false where that is not permitted. For good: a test program that
// continues afterwards stays in it.
bool EnterOwnMountNamespace();

// Makes a folder, a mount point, the root of this mount namespace, leaving nothing of the former
// root in it. Returns false and sets errno when that fails.
bool MakeRootOfMounts(const std::string& folder);

// A mount that lasts as long as its object.
class ScopedMount {
 public:
  ScopedMount(const std::string& source, const std::string& place, const char* type,
              unsigned long flags = 0, const std::string& options = "");
  ScopedMount(const ScopedMount&) = delete;
  ScopedMount& operator=(const ScopedMount&) = delete;
  ~ScopedMount() { Unmount(); }

  bool IsMounted() const { return mMounted; }
  void Unmount();

 private:
  std::string mPlace;
  bool mMounted;
};

}  // namespace tallowmere::test
