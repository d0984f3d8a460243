#include "cli/SameItem.h"

#include <CoreFoundation/CoreFoundation.h>
#include <CoreServices/CoreServices.h>

#include <memory>
#include <mutex>
#include <optional>

namespace tallowmere::cli {
namespace {

struct Release {
  void operator()(const void* object) const { CFRelease(object); }
};
using Owned = std::unique_ptr<const void, Release>;

std::optional<FSRef> ReferenceTo(const std::string& path) {
  const CFStringRef text =
      CFStringCreateWithFileSystemRepresentation(kCFAllocatorDefault, path.c_str());
  const Owned textOwner(text);
  if (text == nullptr) return std::nullopt;
  const CFURLRef url =
      CFURLCreateWithFileSystemPath(kCFAllocatorDefault, text, kCFURLPOSIXPathStyle, false);
  const Owned urlOwner(url);
  FSRef reference;
  if (url == nullptr || !CFURLGetFSRef(url, &reference)) return std::nullopt;
  return reference;
}

}  // namespace

bool IsSameItem(const std::string& first, const std::string& second) {
  if (first == second) return true;
  // The host's calls belong to one thread at a time.
  static std::mutex host;
  const std::lock_guard lock(host);
  const auto firstItem = ReferenceTo(first);
  const auto secondItem = ReferenceTo(second);
  return firstItem && secondItem && FSCompareFSRefs(&*firstItem, &*secondItem) == noErr;
}

}  // namespace tallowmere::cli
