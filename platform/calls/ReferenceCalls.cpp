#include <CoreServices/CoreServices.h>
#include <fcntl.h>
#include <sys/stat.h>

#include <utility>

#include "files/Catalog.h"
#include "files/ItemReference.h"
#include "foundation/NoThrow.h"
#include "foundation/Url.h"

using namespace tallowmere::files;
using tallowmere::foundation::AbsolutePathOfUrl;
using tallowmere::foundation::CreateUrlOfPath;
using tallowmere::foundation::OrZero;

// One statx as a rule. The path is without "/" at its end, so a link in the last place is read
// itself.
Boolean CFURLGetFSRef(CFURLRef url, FSRef* item) {
  return OrZero([&]() -> Boolean {
    auto path = AbsolutePathOfUrl(url);
    if (!path) return false;
    const auto found = ReadItem(AT_FDCWD, path->c_str());
    if (!found) return false;
    RememberPlace({*std::move(path), *found});
    *item = Pack(*found);
    return true;
  });
}

CFURLRef CFURLCreateFromFSRef(CFAllocatorRef, const FSRef* item) {
  return OrZero([&]() -> CFURLRef {
    const auto wanted = Unpack(item);
    if (!wanted) return nullptr;
    const auto path = FindCanonicalPath(*wanted);
    return path ? CreateUrlOfPath(*path, S_ISDIR(wanted->type)) : nullptr;
  });
}

OSErr FSCompareFSRefs(const FSRef* first, const FSRef* second) {
  const auto firstItem = Unpack(first);
  const auto secondItem = Unpack(second);
  if (!firstItem || !secondItem) return errFSBadFSRef;
  return AreEqual(*firstItem, *secondItem) ? noErr : errFSRefsDifferent;
}
