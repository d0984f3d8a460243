// The objects behind CFStringRef and CFMutableStringRef.
#pragma once

#include <CoreFoundation/CoreFoundation.h>

#include <memory>
#include <string>
#include <utility>

#include "foundation/Object.h"

namespace tallowmere::foundation {

class String final : public Object {
 public:
  String(std::u16string text, bool isMutable) noexcept
      : mText(std::move(text)), mIsMutable(isMutable) {}

  const std::u16string& Text() const noexcept { return mText; }
  std::u16string& Text() noexcept { return mText; }  // REQUIRES: the string is mutable
  bool IsMutable() const noexcept { return mIsMutable; }

  bool Equals(const Object& other) const noexcept override;

 private:
  std::u16string mText;
  const bool mIsMutable;
};

// One reference to a string, or null.
using OwnedString = std::unique_ptr<const String, ReleaseObject>;

// The object behind a reference.
const String& StringOf(CFStringRef reference) noexcept;
String& StringOf(CFMutableStringRef reference) noexcept;

// A new string that the caller owns. Throws std::bad_alloc.
CFStringRef CreateString(std::u16string text);
CFMutableStringRef CreateMutableString(std::u16string text);

// A string as the caller knows it.
CFStringRef ReferenceTo(const String* string) noexcept;

// The reference to a string given away, which the caller owns.
CFStringRef CreateReference(OwnedString string) noexcept;

// A string with the text that this one has now: another reference to it unless it can change.
// Throws std::bad_alloc.
OwnedString CopyOf(const String& string);

}  // namespace tallowmere::foundation
