// Mounting for a test, out of sight of everything else on the machine.
#pragma once

#include <string>

namespace tallowmere::test {

// Puts this process, and what it starts from now on, into a mount namespace of its own in which
// nothing spreads to or from the outside. False where that is not permitted. For good: a test
// program that continues afterwards stays in it.
bool EnterOwnMountNamespace();

// Makes a folder, at which something is mounted, the root of this mount namespace and leaves
// nothing of the former root in it. False with errno when it cannot.
bool MakeRootOfMounts(const std::string& folder);

// A mount that ends with its object.
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
