#include "foundation/Object.h"

namespace tallowmere::foundation {

void Object::Retain() const noexcept {
  mCount.fetch_add(1, std::memory_order_relaxed);
}

// Orders every other thread's release, and so its last use, before the deletion.
void Object::Release() const noexcept {
  if (mCount.fetch_sub(1, std::memory_order_acq_rel) == 1) delete this;
}

CFIndex Object::RetainCount() const noexcept {
  return mCount.load(std::memory_order_relaxed);
}

}  // namespace tallowmere::foundation

namespace {

using tallowmere::foundation::Object;

const Object& ObjectOf(CFTypeRef reference) {
  return *static_cast<const Object*>(reference);
}

}  // namespace

CFTypeRef CFRetain(CFTypeRef object) {
  ObjectOf(object).Retain();
  return object;
}

void CFRelease(CFTypeRef object) {
  ObjectOf(object).Release();
}

CFIndex CFGetRetainCount(CFTypeRef object) {
  return ObjectOf(object).RetainCount();
}

Boolean CFEqual(CFTypeRef first, CFTypeRef second) {
  return ObjectOf(first).Equals(ObjectOf(second));
}
