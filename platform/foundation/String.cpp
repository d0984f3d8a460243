#include "foundation/String.h"

namespace tallowmere::foundation {

bool String::Equals(const Object& other) const noexcept {
  const auto* string = dynamic_cast<const String*>(&other);
  return string != nullptr && string->mText == mText;
}

const String& StringOf(CFStringRef reference) noexcept {
  return static_cast<const String&>(*reinterpret_cast<const Object*>(reference));
}

String& StringOf(CFMutableStringRef reference) noexcept {
  return static_cast<String&>(*reinterpret_cast<Object*>(reference));
}

CFMutableStringRef CreateString(std::u16string text) {
  Object* const object = new String(std::move(text));
  return reinterpret_cast<CFMutableStringRef>(object);
}

}  // namespace tallowmere::foundation
