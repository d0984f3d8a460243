#include "files/Specs.h"

#include <fcntl.h>

#include <algorithm>

#include "files/HFSNames.h"
#include "files/NodeID.h"
#include "foundation/PathText.h"

namespace tallowmere::files {

using foundation::JoinPath;
using foundation::LastComponent;

namespace {

void FillSpecOfRoot(FSSpec& spec, const Volume& volume) {
  FillSpec(spec, volume.Number(), kParentOfRootID, volume.Name());
}

// `item` is not its volume's root folder.
OSErr FillSpecInFolder(FSSpec& spec, const Folder& folder, const Place& item) {
  const auto name = HFSNameOf(folder, item, kLongestSpecName);
  if (!name) return fnfErr;
  FillSpec(spec, folder.volume->Number(), folder.ID(), *name);
  return noErr;
}

}  // namespace

VolumePointer VolumeOf(const Place& item, const VolumePointer& near) {
  if (near && near->Root() && near->IsMountedAs(item.item.mount)) return near;
  return MountTable::OfThisProcess().OfItem(item.item, item.path);
}

bool IsRootOf(const VolumePointer& volume, const Place& item) {
  return volume && volume->Root() && AreEqual(*volume->Root(), item.item);
}

OSErr OnTheWay(OSErr error) {
  if (error == fnfErr) return dirNFErr;
  return error;
}

OSErr HoldingFolder(const Place& item, const VolumePointer& near, Folder& folder) {
  if (item.path == "/") return fnfErr;
  auto found = OpenHolderOf(item.path);
  if (!found) return ErrorOfSystem();
  folder = {*std::move(found), nullptr};
  folder.volume = VolumeOf(folder.place, near);
  return folder.volume && folder.volume->Root() ? noErr : nsvErr;
}

OSErr SpecOfPlace(const Place& item, FSSpec& spec) {
  const VolumePointer volume = VolumeOf(item, nullptr);
  if (IsRootOf(volume, item)) {
    if (!IsAt(item.item, AT_FDCWD, item.path.c_str())) return fnfErr;
    FillSpecOfRoot(spec, *volume);
    return noErr;
  }
  Folder folder;
  if (const OSErr error = HoldingFolder(item, volume, folder)) return error;
  const std::string_view name = *LastComponent(item.path);
  if (!Holds(folder, item.item, name)) return fnfErr;
  RememberPlace({JoinPath(folder.place.path, name), item.item});
  return FillSpecInFolder(spec, folder, item);
}

OSErr SpecInFolder(const Folder& folder, const Place& item, FSSpec& spec) {
  const VolumePointer volume = VolumeOf(item, folder.volume);
  if (!IsRootOf(volume, item)) return FillSpecInFolder(spec, folder, item);
  FillSpecOfRoot(spec, *volume);
  return noErr;
}

OSErr FolderWithID(SInt16 vRefNum, UInt32 id, Folder& folder) {
  folder.volume = MountTable::OfThisProcess().WithNumber(vRefNum);
  if (!folder.volume) return nsvErr;
  auto found = OpenWithID(folder.volume, id);
  if (!found) return dirNFErr;
  folder = {*std::move(found), folder.volume};
  // One that moved before it was first looked at was found by what the table says of it now.
  if (!folder.volume->Root()) {
    folder.volume = MountTable::OfThisProcess().OfItem(folder.place.item, folder.place.path);
  }
  return folder.volume && folder.volume->Root() ? noErr : nsvErr;
}

void FillSpec(FSSpec& spec, SInt16 vRefNum, UInt32 parID, std::string_view name) {
  name = name.substr(0, kLongestSpecName);
  spec = {};
  spec.vRefNum = vRefNum;
  spec.parID = static_cast<SInt32>(parID);
  spec.name[0] = static_cast<unsigned char>(name.size());
  std::copy(name.begin(), name.end(), spec.name + 1);
}

}  // namespace tallowmere::files
