// The base of every reference-counted object of the platform. A CF reference is the address of an
// object's Object part.
#pragma once

#include <CoreFoundation/CoreFoundation.h>

#include <atomic>

namespace tallowmere::foundation {

class Object {
 public:
  Object(const Object&) = delete;
  Object& operator=(const Object&) = delete;

  void Retain() const noexcept;
  void Release() const noexcept;  // the last reference deletes the object
  CFIndex RetainCount() const noexcept;

  // Implements CFEqual.
  virtual bool Equals(const Object& other) const noexcept = 0;

 protected:
  Object() = default;  // with one reference, the creator's
  virtual ~Object() = default;

 private:
  mutable std::atomic<CFIndex> mCount{1};
};

// Releases one reference when the pointer that holds it is destroyed.
struct ReleaseObject {
  void operator()(const Object* object) const noexcept { object->Release(); }
};

}  // namespace tallowmere::foundation
