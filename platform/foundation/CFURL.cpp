#include <CoreFoundation/CoreFoundation.h>

#include <algorithm>
#include <optional>
#include <string>
#include <string_view>
#include <utility>

#include "foundation/Encodings.h"
#include "foundation/NoThrow.h"
#include "foundation/PathStyles.h"
#include "foundation/PathText.h"
#include "foundation/PercentEncoding.h"
#include "foundation/String.h"
#include "foundation/Url.h"
#include "foundation/UrlParts.h"
#include "text/FileNameText.h"
#include "text/Utf16.h"

namespace {

using namespace tallowmere::foundation;

using Bytes = std::optional<std::string>;

// A new string of a file name or path. Null when `name` is nullopt or contains a NUL, which no name
// does.
CFStringRef CreateFileNameString(const Bytes& name) {
  if (!name || name->find('\0') != name->npos) return nullptr;
  return CreateString(tallowmere::text::TextOfFileName(*name));
}

// REQUIRES: the style is not POSIX.
Bytes LinuxPath(const std::string& path, CFURLPathStyle style) {
  switch (style) {
    case kCFURLHFSPathStyle:
      return LinuxPathOfHfsPath(path);
    case kCFURLWindowsPathStyle:
      return LinuxPathOfWindowsPath(path);
    default:
      return std::nullopt;
  }
}

// REQUIRES: the style is not POSIX.
Bytes PathInStyle(const std::string& path, bool folder, CFURLPathStyle style) {
  switch (style) {
    case kCFURLHFSPathStyle:
      return HfsPathOfLinuxPath(path, folder);
    case kCFURLWindowsPathStyle:
      return WindowsPathOfLinuxPath(path);
    default:
      return std::nullopt;
  }
}

std::string_view EncodedPath(CFURLRef url) {
  return UrlOf(url).Parts().path;
}

// Another reference to the path of a URL. Null when it has none.
CFStringRef SharedPath(CFURLRef url) {
  const String* const path = UrlOf(url).Path();
  if (path == nullptr) return nullptr;
  return static_cast<CFStringRef>(CFRetain(ReferenceTo(path)));
}

Bytes DecodedLastComponent(CFURLRef url) {
  const auto component = LastComponent(EncodedPath(url));
  if (!component) return std::nullopt;
  return PercentDecode(*component);
}

CFURLRef CreateUrlWithPath(CFURLRef url, std::string_view path) {
  return CreateUrl(WithPath(UrlOf(url).Text(), path), UrlOf(url).Base());
}

}  // namespace

// --- Making -----------------------------------------------------------------------------------

CFURLRef CFURLCreateWithFileSystemPath(CFAllocatorRef, CFStringRef path, CFURLPathStyle style,
                                       Boolean isDirectory) {
  return OrZero([&]() -> CFURLRef {
    if (style == kCFURLPOSIXPathStyle) return CreateUrlOfPath(StringOf(path), isDirectory);
    const auto bytes = tallowmere::text::FileNameOfText(StringOf(path).Text());
    if (!bytes) return nullptr;
    const auto linuxPath = LinuxPath(*bytes, style);
    return linuxPath ? CreateUrlOfPath(*linuxPath, isDirectory) : nullptr;
  });
}

CFURLRef CFURLCreateWithBytes(CFAllocatorRef, const UInt8* bytes, CFIndex length,
                              CFStringEncoding encoding, CFURLRef) {
  const Encoding* const found = FindEncoding(encoding);
  if (found == nullptr || length <= 0) return nullptr;
  return OrZero([&]() -> CFURLRef {
    const auto text =
        found->decode({reinterpret_cast<const char*>(bytes), static_cast<std::size_t>(length)});
    if (!text || !std::all_of(text->begin(), text->end(), tallowmere::text::IsAscii))
      return nullptr;
    std::string url(text->begin(), text->end());
    return IsUrl(url) ? CreateUrl(std::move(url), "") : nullptr;
  });
}

// --- Paths ------------------------------------------------------------------------------------

CFStringRef CFURLCopyFileSystemPath(CFURLRef url, CFURLPathStyle style) {
  return OrZero([&]() -> CFStringRef {
    if (style == kCFURLPOSIXPathStyle) return SharedPath(url);
    const auto path = PathOfUrl(url);
    if (!path) return nullptr;
    return CreateFileNameString(PathInStyle(*path, CFURLHasDirectoryPath(url), style));
  });
}

CFStringRef CFURLCopyStrictPath(CFURLRef url, Boolean* isAbsolute) {
  const String* const path = UrlOf(url).Path();
  if (isAbsolute != nullptr) *isAbsolute = path != nullptr && path->Text().starts_with(u'/');
  return SharedPath(url);
}

// --- Components -------------------------------------------------------------------------------

CFStringRef CFURLCopyLastPathComponent(CFURLRef url) {
  return OrZero([&] { return CreateFileNameString(DecodedLastComponent(url)); });
}

CFStringRef CFURLCopyPathExtension(CFURLRef url) {
  return OrZero([&]() -> CFStringRef {
    const auto component = DecodedLastComponent(url);
    const auto extension = component ? Extension(*component) : std::nullopt;
    return extension ? CreateFileNameString(std::string(*extension)) : nullptr;
  });
}

Boolean CFURLHasDirectoryPath(CFURLRef url) {
  return OrZero([&] { return HasFolderMark(EncodedPath(url)); });
}

CFURLRef CFURLCreateCopyDeletingLastPathComponent(CFAllocatorRef, CFURLRef url) {
  return OrZero([&]() -> CFURLRef {
    const std::string_view path = EncodedPath(url);
    return path.empty() ? nullptr : CreateUrlWithPath(url, ParentPath(path));
  });
}

CFURLRef CFURLCreateCopyAppendingPathComponent(CFAllocatorRef, CFURLRef url, CFStringRef component,
                                               Boolean isDirectory) {
  if (component == nullptr) return nullptr;
  return OrZero([&]() -> CFURLRef {
    const auto bytes = tallowmere::text::FileNameOfText(StringOf(component).Text());
    if (!bytes) return nullptr;
    const UrlParts& parts = UrlOf(url).Parts();
    // After an authority, an empty path means the root.
    const std::string_view path = parts.path.empty() && parts.authority ? "/" : parts.path;
    std::string joined = JoinPath(path, "");
    AppendPercentEncodedPath(joined, *bytes, path.empty());
    return joined.empty() ? nullptr : CreateUrlWithPath(url, WithFolderMark(joined, isDirectory));
  });
}
