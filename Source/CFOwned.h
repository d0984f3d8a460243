// Ownership of what a Create or Copy call returns. Needs only the public header.
#pragma once

#include <CoreFoundation/CoreFoundation.h>

#include <utility>

// Holds one reference to an object, or null, and releases it when destroyed:
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

  // Hands the reference over to the caller and holds null afterwards.
  [[nodiscard]] Reference Detach() noexcept { return std::exchange(mObject, nullptr); }

 private:
  Reference mObject = nullptr;
};
