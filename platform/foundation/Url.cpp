#include "foundation/Url.h"

#include <unistd.h>

#include <cerrno>
#include <utility>

#include "foundation/LetterCase.h"
#include "foundation/PathText.h"
#include "foundation/PercentEncoding.h"
#include "foundation/UrlParts.h"

namespace tallowmere::foundation {
namespace {

// RFC 8089: a file URL of this machine has an empty authority, "localhost" or none.
constexpr std::string_view kFileUrlStart = "file://";
constexpr std::string_view kFileScheme = "file";
constexpr std::string_view kThisMachine = "localhost";

std::string UrlTextOfAbsolutePath(std::string_view path) {
  return std::string(kFileUrlStart) + PercentEncodePath(path, false);
}

// The current directory, none when it has been removed or cannot be read.
std::optional<std::string> CurrentDirectory() {
  std::string path(256, '\0');
  while (getcwd(path.data(), path.size()) == nullptr) {
    if (errno != ERANGE) return std::nullopt;
    path.resize(path.size() * 2);
  }
  path.resize(path.find('\0'));
  return path;
}

// The decoded path; none when the text has no path or it contains a NUL.
std::optional<std::string> DecodedPath(std::string_view url) {
  std::string path = PercentDecode(SplitUrl(url).path);
  if (path.empty() || path.find('\0') != path.npos) return std::nullopt;
  return path;
}

bool IsFileUrlOfThisMachine(const UrlParts& parts) {
  return parts.scheme && EqualIgnoringCase(*parts.scheme, kFileScheme) &&
         (!parts.authority || parts.authority->empty() ||
          EqualIgnoringCase(*parts.authority, kThisMachine));
}

}  // namespace

Url::Url(std::string text, std::string base) noexcept
    : mText(std::move(text)), mBase(std::move(base)) {}

bool Url::Equals(const Object& other) const noexcept {
  const auto* url = dynamic_cast<const Url*>(&other);
  return url != nullptr && url->mText == mText && url->mBase == mBase;
}

const Url& UrlOf(CFURLRef reference) noexcept {
  return static_cast<const Url&>(*reinterpret_cast<const Object*>(reference));
}

CFURLRef CreateUrl(std::string text, std::string base) {
  const Object* const object = new Url(std::move(text), std::move(base));
  return reinterpret_cast<CFURLRef>(object);
}

CFURLRef CreateUrlOfPath(std::string_view path, bool folder) {
  if (path.empty()) return nullptr;
  const std::string marked = WithFolderMark(path, folder);
  if (marked.starts_with('/')) return CreateUrl(UrlTextOfAbsolutePath(marked), "");
  const auto directory = CurrentDirectory();
  if (!directory) return nullptr;
  return CreateUrl(PercentEncodePath(marked, true),
                   UrlTextOfAbsolutePath(WithFolderMark(*directory, true)));
}

std::optional<std::string> PathOfUrl(CFURLRef url) {
  const auto path = DecodedPath(UrlOf(url).Text());
  if (!path) return std::nullopt;
  return WithFolderMark(*path, false);
}

std::optional<std::string> AbsolutePathOfUrl(CFURLRef url) {
  const Url& object = UrlOf(url);
  auto path = PathOfUrl(url);
  if (!path) return std::nullopt;
  if (object.Base().empty()) {
    const bool names = path->starts_with('/') && IsFileUrlOfThisMachine(SplitUrl(object.Text()));
    return names ? path : std::nullopt;
  }
  const auto base = DecodedPath(object.Base());
  if (!base) return std::nullopt;
  return JoinPath(*base, *path);
}

}  // namespace tallowmere::foundation
