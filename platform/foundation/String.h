// What stands behind a CFStringRef and a CFMutableStringRef.
#pragma once

#include <CoreFoundation/CoreFoundation.h>

#include <string>
#include <utility>

#include "foundation/Object.h"

namespace tallowmere::foundation {

class String final : public Object {
 public:
  explicit String(std::u16string text) noexcept : mText(std::move(text)) {}

  const std::u16string& Text() const noexcept { return mText; }
  std::u16string& Text() noexcept { return mText; }  // of a mutable string alone

  bool Equals(const Object& other) const noexcept override;

 private:
  std::u16string mText;
};

// The object behind a reference.
const String& StringOf(CFStringRef reference) noexcept;
String& StringOf(CFMutableStringRef reference) noexcept;

// A new string that the caller owns. Throws std::bad_alloc.
CFMutableStringRef CreateString(std::u16string text);

}  // namespace tallowmere::foundation
