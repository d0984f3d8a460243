// What stands behind a CFURLRef.
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
  // The second form is told what Path() gives. REQUIRES: text is a URL by IsUrl; base is the URL of
  // a folder for a relative text, or empty.
  Url(std::string text, std::string base);
  Url(std::string text, std::string base, OwnedString path) noexcept;

  const std::string& Text() const noexcept { return mText; }
  const std::string& Base() const noexcept { return mBase; }
  const UrlParts& Parts() const noexcept { return mParts; }

  // The path percent-decoded, without the folder mark except for "/"; null when the URL has none or
  // an encoded NUL in it.
  const String* Path() const noexcept { return mPath.get(); }

  bool Equals(const Object& other) const noexcept override;

 private:
  const std::string mText;
  const std::string mBase;
  const UrlParts mParts;  // of mText
  const OwnedString mPath;
};

const Url& UrlOf(CFURLRef reference) noexcept;

// A new URL that the caller owns. REQUIRES: as the constructor. Throws std::bad_alloc.
CFURLRef CreateUrl(std::string text, std::string base);

// The URL of a path in Linux bytes, with or without the folder mark; a relative one takes the
// current directory for its base. Null for an empty path, and for a relative one when there is no
// current directory. The caller owns it. Throws std::bad_alloc.
CFURLRef CreateUrlOfPath(std::string_view path, bool folder);

// The same of a path as a string; null as well for one that has no bytes.
CFURLRef CreateUrlOfPath(const String& path, bool folder);

// The path of a URL in Linux bytes, without the folder mark except for "/". None when it has no
// path or an encoded NUL in it. Throws std::bad_alloc.
std::optional<std::string> PathOfUrl(CFURLRef url);

// The absolute Linux path of the item that a file URL names: the scheme "file" on this machine, or
// the path of a relative URL behind its base. None for every other URL, and as PathOfUrl. Throws
// std::bad_alloc.
std::optional<std::string> AbsolutePathOfUrl(CFURLRef url);

}  // namespace tallowmere::foundation
