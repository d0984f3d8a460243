// The object behind a CFURLRef.
#pragma once

#include <CoreFoundation/CoreFoundation.h>

#include <optional>
#include <string>
#include <string_view>

#include "foundation/Object.h"
#include "foundation/String.h"
#include "foundation/UrlParts.h"

namespace tallowmere::foundation {

class Url final : public Object {
 public:
  // The second form is given what Path() returns. REQUIRES: `text` satisfies IsUrl; `base` is the
  // URL of a folder for a relative text, else empty.
  Url(std::string text, std::string base);
  Url(std::string text, std::string base, OwnedString path) noexcept;

  const std::string& Text() const noexcept { return mText; }
  const std::string& Base() const noexcept { return mBase; }
  const UrlParts& Parts() const noexcept { return mParts; }

  // The path percent-decoded, without the folder mark except for "/"; null when the URL has no path
  // or one with an encoded NUL.
  const String* Path() const noexcept { return mPath.get(); }

  bool Equals(const Object& other) const noexcept override;

 private:
  const std::string mText;
  const std::string mBase;
  const UrlParts mParts;  // views into mText
  const OwnedString mPath;
};

const Url& UrlOf(CFURLRef reference) noexcept;

// A new URL that the caller owns. REQUIRES: as for the constructor. Throws std::bad_alloc.
CFURLRef CreateUrl(std::string text, std::string base);

// The URL of a path in Linux bytes, with or without the folder mark. A relative path gets the
// current directory as its base. Null for an empty path, and for a relative one when there is no
// current directory. The caller owns the result. Throws std::bad_alloc.
CFURLRef CreateUrlOfPath(std::string_view path, bool folder);

// The same for a path as a string. Also null for a string that no bytes represent.
CFURLRef CreateUrlOfPath(const String& path, bool folder);

// The path of a URL in Linux bytes, without the folder mark except for "/". Nullopt when the URL
// has no path or one with an encoded NUL. Throws std::bad_alloc.
std::optional<std::string> PathOfUrl(CFURLRef url);

// The absolute Linux path of the item that a file URL names: one with the scheme "file" on this
// machine, or a relative one, resolved against its base. Nullopt for every other URL, and where
// PathOfUrl returns nullopt. Throws std::bad_alloc.
std::optional<std::string> AbsolutePathOfUrl(CFURLRef url);

}  // namespace tallowmere::foundation
