// Ownership of what a Create or Copy call returns. Needs nothing but the public header.
#pragma once

#include <CoreFoundation/CoreFoundation.h>

#include <utility>

// Holds one reference to an object, or null, and gives it back at its end:
//   const CFOwned name(CFURLCopyLastPathComponent(url));
template <typename Reference>
class CFOwned {
 public:
  CFOwned() = default;
  // Takes over the caller's reference.
  explicit CFOwned(Reference object) noexcept : mObject(object) {}
  CFOwned(CFOwned&& other) noexcept : mObject(other.Detach()) {}
  CFOwned& operator=(CFOwned&& other) noexcept {
    std::swap(mObject, other.mObject);
    return *this;
  }
  ~CFOwned() {
    if (mObject != nullptr) CFRelease(mObject);
  }

  explicit operator bool() const noexcept { return mObject != nullptr; }

  // Lends the object, or null.
  Reference Get() const noexcept { return mObject; }

  // Hands the reference over to the caller and holds null from then on.
  [[nodiscard]] Reference Detach() noexcept { return std::exchange(mObject, nullptr); }

 private:
  Reference mObject = nullptr;
};
