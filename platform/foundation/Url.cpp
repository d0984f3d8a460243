#include "foundation/Url.h"

#include <utility>

#include "foundation/CurrentDirectory.h"
#include "foundation/LetterCase.h"
#include "foundation/PathText.h"
#include "foundation/PercentEncoding.h"
#include "text/FileNameText.h"
#include "text/Utf16.h"

namespace tallowmere::foundation {
namespace {

// RFC 8089: a file URL of this machine has an empty authority, "localhost" or none.
constexpr std::string_view kFileUrlStart = "file://";
constexpr std::string_view kFileScheme = "file";
constexpr std::string_view kThisMachine = "localhost";

// The text of the URL of a path, absolute or relative, with or without the folder mark.
std::string UrlTextOfPath(std::string_view path, bool folder) {
  const bool isAbsolute = path.starts_with('/');
  std::string text;
  text.reserve(kFileUrlStart.size() + path.size() + 1);
  if (isAbsolute) text += kFileUrlStart;
  AppendPercentEncodedPath(text, folder ? path : WithoutFolderMark(path), !isAbsolute);
  if (folder && !path.ends_with('/')) text += '/';
  return text;
}

bool HasNul(std::string_view path) {
  return path.find('\0') != path.npos;
}

bool IsFileUrlOfThisMachine(const UrlParts& parts) {
  return parts.scheme && EqualIgnoringCase(*parts.scheme, kFileScheme) &&
         (!parts.authority || parts.authority->empty() ||
          EqualIgnoringCase(*parts.authority, kThisMachine));
}

CFURLRef ReferenceTo(const Url* url) noexcept {
  const Object* const object = url;
  return reinterpret_cast<CFURLRef>(object);
}

// The path as Url keeps it. Null for an empty path and for one with a NUL.
OwnedString KeptPath(std::string_view path) {
  if (path.empty() || HasNul(path)) return nullptr;
  return OwnedString(new String(text::TextOfFileName(WithoutFolderMark(path)), false));
}

// `kept` has no folder mark. REQUIRES: the path is not empty.
CFURLRef CreateUrlOfPath(std::string_view path, bool folder, OwnedString kept) {
  std::string base;
  if (!path.starts_with('/')) {
    const auto directory = CurrentDirectory();
    if (!directory) return nullptr;
    base = UrlTextOfPath(*directory, true);
  }
  return ReferenceTo(new Url(UrlTextOfPath(path, folder), std::move(base), std::move(kept)));
}

}  // namespace

Url::Url(std::string text, std::string base)
    : mText(std::move(text)),
      mBase(std::move(base)),
      mParts(SplitUrl(mText)),
      mPath(KeptPath(PercentDecode(mParts.path))) {}

Url::Url(std::string text, std::string base, OwnedString path) noexcept
    : mText(std::move(text)),
      mBase(std::move(base)),
      mParts(SplitUrl(mText)),
      mPath(std::move(path)) {}

bool Url::Equals(const Object& other) const noexcept {
  const auto* url = dynamic_cast<const Url*>(&other);
  return url != nullptr && url->mText == mText && url->mBase == mBase;
}

const Url& UrlOf(CFURLRef reference) noexcept {
  return static_cast<const Url&>(*reinterpret_cast<const Object*>(reference));
}

CFURLRef CreateUrl(std::string text, std::string base) {
  return ReferenceTo(new Url(std::move(text), std::move(base)));
}

CFURLRef CreateUrlOfPath(std::string_view path, bool folder) {
  return path.empty() ? nullptr : CreateUrlOfPath(path, folder, KeptPath(path));
}

// An ASCII string without NUL or folder mark is kept as it is: decoding its bytes gives the same
// text.
CFURLRef CreateUrlOfPath(const String& path, bool folder) {
  const auto bytes = text::FileNameOfText(path.Text());
  if (!bytes || bytes->empty()) return nullptr;
  const bool isKept = text::IsAllAscii(std::string_view(*bytes)) && !HasNul(*bytes) &&
                      WithoutFolderMark(*bytes).size() == bytes->size();
  return CreateUrlOfPath(*bytes, folder, isKept ? CopyOf(path) : KeptPath(*bytes));
}

std::optional<std::string> PathOfUrl(CFURLRef url) {
  const String* const path = UrlOf(url).Path();
  return path == nullptr ? std::nullopt : text::FileNameOfText(path->Text());
}

std::optional<std::string> AbsolutePathOfUrl(CFURLRef url) {
  const Url& object = UrlOf(url);
  auto path = PathOfUrl(url);
  if (!path) return std::nullopt;
  if (object.Base().empty()) {
    const bool names = path->starts_with('/') && IsFileUrlOfThisMachine(object.Parts());
    return names ? std::move(path) : std::nullopt;
  }
  return JoinPath(PercentDecode(SplitUrl(object.Base()).path), *path);
}

}  // namespace tallowmere::foundation
