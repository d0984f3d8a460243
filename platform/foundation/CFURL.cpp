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
namespace text = tallowmere::text;

using Bytes = std::optional<std::string>;

// A new string of a file name or path, null for none and for one with a NUL, which no name has.
CFStringRef CreateFileNameString(const Bytes& name) {
  if (!name || name->find('\0') != name->npos) return nullptr;
  return CreateString(text::TextOfFileName(*name));
}

Bytes LinuxPath(const std::string& path, CFURLPathStyle style) {
  switch (style) {
    case kCFURLPOSIXPathStyle:
      return path;
    case kCFURLHFSPathStyle:
      return LinuxPathOfHfsPath(path);
    case kCFURLWindowsPathStyle:
      return LinuxPathOfWindowsPath(path);
    default:
      return std::nullopt;
  }
}

Bytes PathInStyle(const std::string& path, bool folder, CFURLPathStyle style) {
  switch (style) {
    case kCFURLPOSIXPathStyle:
      return path;
    case kCFURLHFSPathStyle:
      return HfsPathOfLinuxPath(path, folder);
    case kCFURLWindowsPathStyle:
      return WindowsPathOfLinuxPath(path);
    default:
      return std::nullopt;
  }
}

std::string_view EncodedPath(CFURLRef url) {
  return SplitUrl(UrlOf(url).Text()).path;
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
    const auto bytes = text::FileNameOfText(StringOf(path).Text());
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
    if (!text || !std::all_of(text->begin(), text->end(), text::IsAscii)) return nullptr;
    std::string url(text->begin(), text->end());
    return IsUrl(url) ? CreateUrl(std::move(url), "") : nullptr;
  });
}

// --- Paths ------------------------------------------------------------------------------------

CFStringRef CFURLCopyFileSystemPath(CFURLRef url, CFURLPathStyle style) {
  return OrZero([&]() -> CFStringRef {
    const auto path = PathOfUrl(url);
    if (!path) return nullptr;
    return CreateFileNameString(PathInStyle(*path, CFURLHasDirectoryPath(url), style));
  });
}

CFStringRef CFURLCopyStrictPath(CFURLRef url, Boolean* isAbsolute) {
  if (isAbsolute != nullptr) *isAbsolute = false;
  return OrZero([&]() -> CFStringRef {
    const auto path = PathOfUrl(url);
    if (!path) return nullptr;
    if (isAbsolute != nullptr) *isAbsolute = path->starts_with('/');
    return CreateFileNameString(path);
  });
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
    const auto bytes = text::FileNameOfText(StringOf(component).Text());
    if (!bytes) return nullptr;
    const UrlParts parts = SplitUrl(UrlOf(url).Text());
    // Behind an authority, an empty path is the root's.
    const std::string_view path = parts.path.empty() && parts.authority ? "/" : parts.path;
    const std::string joined = JoinPath(path, PercentEncodePath(*bytes, path.empty()));
    return joined.empty() ? nullptr : CreateUrlWithPath(url, WithFolderMark(joined, isDirectory));
  });
}
