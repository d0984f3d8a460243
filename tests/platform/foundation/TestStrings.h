// Strings and URLs for tests, made through the public calls only.
#pragma once

#include <CoreFoundation/CoreFoundation.h>

#include <optional>
#include <string>
#include <string_view>

#include "Source/CFOwned.h"

namespace tallowmere::foundation::test {

inline CFOwned<CFStringRef> MakeString(std::u16string_view text) {
  const std::basic_string<UniChar> units(text.begin(), text.end());
  return CFOwned(CFStringCreateWithCharacters(kCFAllocatorDefault, units.data(),
                                              static_cast<CFIndex>(units.size())));
}

// Returns the string of a file name or path. REQUIRES: no NUL inside.
inline CFOwned<CFStringRef> MakeName(const std::string& bytes) {
  return CFOwned(CFStringCreateWithFileSystemRepresentation(kCFAllocatorDefault, bytes.c_str()));
}

inline CFRange Whole(CFStringRef string) {
  return CFRangeMake(0, CFStringGetLength(string));
}

inline std::u16string TextOf(CFStringRef string) {
  std::basic_string<UniChar> units(static_cast<std::size_t>(CFStringGetLength(string)), 0);
  CFStringGetCharacters(string, Whole(string), units.data());
  return {units.begin(), units.end()};
}

// Returns the file-system representation, or nullopt for null and for a string that has none.
inline std::optional<std::string> NameOf(CFStringRef string) {
  if (string == nullptr) return std::nullopt;
  std::string bytes(
      static_cast<std::size_t>(CFStringGetMaximumSizeOfFileSystemRepresentation(string)), '\0');
  if (!CFStringGetFileSystemRepresentation(string, bytes.data(),
                                           static_cast<CFIndex>(bytes.size()))) {
    return std::nullopt;
  }
  bytes.resize(bytes.find('\0'));
  return bytes;
}

// Returns the URL of a path in Linux bytes, or null.
inline CFOwned<CFURLRef> MakeUrl(const std::string& path, bool folder,
                                 CFURLPathStyle style = kCFURLPOSIXPathStyle) {
  const auto name = MakeName(path);
  return CFOwned(
      CFURLCreateWithFileSystemPath(kCFAllocatorDefault, name.Get(), style, folder ? 1 : 0));
}

// Returns the URL with this text, or null.
inline CFOwned<CFURLRef> ParseUrl(std::string_view text) {
  return CFOwned(
      CFURLCreateWithBytes(kCFAllocatorDefault, reinterpret_cast<const UInt8*>(text.data()),
                           static_cast<CFIndex>(text.size()), kCFStringEncodingUTF8, nullptr));
}

inline std::optional<std::string> PathIn(const CFOwned<CFURLRef>& url, CFURLPathStyle style) {
  return NameOf(CFOwned(CFURLCopyFileSystemPath(url.Get(), style)).Get());
}

inline std::optional<std::string> PathOf(const CFOwned<CFURLRef>& url) {
  return PathIn(url, kCFURLPOSIXPathStyle);
}

}  // namespace tallowmere::foundation::test
