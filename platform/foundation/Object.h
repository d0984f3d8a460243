// What every counted object of the platform is made of. A CF reference is the address of an
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
  void Release() const noexcept;  // the last one deletes the object
  CFIndex RetainCount() const noexcept;

  // The meaning of CFEqual.
  virtual bool Equals(const Object& other) const noexcept = 0;

 protected:
  Object() = default;  // with one reference, the maker's
  virtual ~Object() = default;

 private:
  mutable std::atomic<CFIndex> mCount{1};
};

// Gives back one reference at the end of the pointer that holds it.
struct ReleaseObject {
  void operator()(const Object* object) const noexcept { object->Release(); }
};

}  // namespace tallowmere::foundation
