// References to items by URL, and back.

#include <CoreServices/CoreServices.h>

#include <cerrno>
#include <optional>
#include <string>

#include "calls/Process.h"
#include "calls/References.h"
#include "catalog/Finding.h"
#include "catalog/StoredNames.h"
#include "foundation/NoThrow.h"
#include "foundation/PathText.h"
#include "foundation/Url.h"
#include "kernel/Paths.h"

using namespace tallowmere;
using namespace tallowmere::calls;

namespace {

// There is a link on the way, or the folder is on no volume: the path has to be examined by itself.
constexpr kernel::Error kOtherWay{ENOTDIR};

// Examines the item in a way that serves the rest of the moment: holds it if it is a folder,
// otherwise its parent. Returns ENOENT when it is missing, and kOtherWay or another error when that
// is uncertain.
kernel::Result<FSRef> ReferenceInMoment(catalog::Moment& moment, const std::string& path,
                                        bool isFolderMeant) {
  catalog::Catalog& known = moment.Knowledge();
  if (isFolderMeant && known.WasFolderMarkRight()) {
    const auto folder = moment.HoldFolder(path);
    if (folder) return ReferenceTo(moment, *folder);
    known.NoteFolderMark(folder.Error() != kernel::Error{ENOTDIR});
  }
  if (path == "/" || !kernel::IsNormalized(path)) return kOtherWay;
  const auto holder = moment.HoldFolder(foundation::FolderOf(path));
  if (!holder) return holder.Error() == kernel::kNotThere ? kernel::kNotThere : kOtherWay;
  const auto look = moment.LookUp(*holder, std::string(*foundation::LastComponent(path)));
  if (!look) return look.Error();
  if (!isFolderMeant || !kernel::IsFolder(look->Item())) return ReferenceTo(moment, *look);
  // The look serves the rest of the moment.
  known.NoteFolderMark(true);
  const auto folder = moment.HoldFolderOf(*look);
  return folder ? ReferenceTo(moment, *folder) : ReferenceTo(moment, *look);
}

// The path has no trailing "/", so a link at its end is not followed.
std::optional<FSRef> ReferenceAt(const std::string& path, bool isFolderMeant) {
  if (catalog::Moment* const moment = OpenMoment()) {
    const auto reference = ReferenceInMoment(*moment, path, isFolderMeant);
    if (reference) return *reference;
    if (reference.Error() == kernel::kNotThere) return std::nullopt;
  }
  const auto status = kernel::ReadStatus(kernel::AtPath(path.c_str()));
  if (!status) return std::nullopt;
  return InMoment([&](catalog::Moment& moment) {
    return ReferenceTo(moment, catalog::Sighting{path, status->item});
  });
}

// The path by which this moment saw the item, if it still leads there.
std::optional<std::string> PathSeen(const catalog::Moment& moment, const kernel::Item& reference) {
  const catalog::Look* const look = moment.LookFor(reference);
  const catalog::HeldFolder* const held = look == nullptr ? moment.HeldFor(reference) : nullptr;
  if (look == nullptr && held == nullptr) return std::nullopt;
  const std::string& path = look != nullptr ? look->Path() : held->Path();
  if (!catalog::IsItemAt(reference, kernel::AtPath(path.c_str()), path)) return std::nullopt;
  return path;
}

}  // namespace

Boolean CFURLGetFSRef(CFURLRef url, FSRef* item) {
  return foundation::OrZero([&]() -> Boolean {
    const auto path = foundation::AbsolutePathOfUrl(url);
    const auto reference =
        path ? ReferenceAt(*path, CFURLHasDirectoryPath(url)) : std::optional<FSRef>();
    if (!reference) return false;
    *item = *reference;
    return true;
  });
}

CFURLRef CFURLCreateFromFSRef(CFAllocatorRef, const FSRef* item) {
  return foundation::OrZero([&]() -> CFURLRef {
    const auto reference = Unpack(item);
    if (!reference) return nullptr;
    return InMoment([&](catalog::Moment& moment) -> CFURLRef {
      auto path = PathSeen(moment, *reference);
      if (!path) {
        const auto found = catalog::FindPathOf(moment, *reference);
        if (!found) return nullptr;
        path = *found;
      }
      const std::string stored = catalog::StoredPath(moment, *reference, *path);
      return foundation::CreateUrlOfPath(stored, kernel::IsFolder(*reference));
    });
  });
}

OSErr FSCompareFSRefs(const FSRef* first, const FSRef* second) {
  const auto firstItem = Unpack(first);
  const auto secondItem = Unpack(second);
  if (!firstItem || !secondItem) return errFSBadFSRef;
  return catalog::ReferToSameItem(*firstItem, *secondItem) ? noErr : errFSRefsDifferent;
}
