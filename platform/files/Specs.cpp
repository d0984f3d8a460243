#include "files/Specs.h"

#include <sys/stat.h>

#include <algorithm>

#include "files/HFSNames.h"
#include "files/NodeID.h"

namespace tallowmere::files {

VolumePointer VolumeOfRoot(const Place& item) {
  auto volume = MountTable::OfThisProcess().OfItem(item.item, item.path);
  const bool isRoot = volume && volume->Root() && AreEqual(*volume->Root(), item.item);
  return isRoot ? volume : nullptr;
}

OSErr HoldingFolder(const Place& item, Folder& folder) {
  if (item.path == "/") return fnfErr;
  auto found = PlaceAt(FolderOf(item.path));
  if (!found) return ErrorOfSystem();
  if (!S_ISDIR(found->item.type)) return fnfErr;
  folder.place = *std::move(found);
  folder.volume = MountTable::OfThisProcess().OfItem(folder.place.item, folder.place.path);
  if (!folder.volume || !folder.volume->Root()) return nsvErr;
  RememberPlace(folder.place);
  return noErr;
}

OSErr SpecOfPlace(const Place& item, FSSpec& spec) {
  if (const VolumePointer volume = VolumeOfRoot(item)) {
    FillSpec(spec, volume->Number(), kParentOfRootID, volume->Name());
    return noErr;
  }
  Folder folder;
  if (const OSErr error = HoldingFolder(item, folder)) return error;
  const auto name = HFSNameOf(folder, item, kLongestSpecName);
  if (!name) return fnfErr;
  FillSpec(spec, folder.volume->Number(), folder.ID(), *name);
  return noErr;
}

OSErr FolderWithID(SInt16 vRefNum, UInt32 id, Folder& folder) {
  folder.volume = MountTable::OfThisProcess().WithNumber(vRefNum);
  if (!folder.volume) return nsvErr;
  auto place = FindItem(folder.volume, id, true);
  if (!place) return dirNFErr;
  folder.place = *std::move(place);
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
