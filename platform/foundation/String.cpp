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

CFStringRef CreateString(std::u16string text) {
  return ReferenceTo(new String(std::move(text), false));
}

CFMutableStringRef CreateMutableString(std::u16string text) {
  Object* const object = new String(std::move(text), true);
  return reinterpret_cast<CFMutableStringRef>(object);
}

CFStringRef ReferenceTo(const String* string) noexcept {
  const Object* const object = string;
  return reinterpret_cast<CFStringRef>(object);
}

CFStringRef CreateReference(OwnedString string) noexcept {
  return ReferenceTo(string.release());
}

OwnedString CopyOf(const String& string) {
  if (string.IsMutable()) return OwnedString(new String(string.Text(), false));
  string.Retain();
  return OwnedString(&string);
}

}  // namespace tallowmere::foundation
