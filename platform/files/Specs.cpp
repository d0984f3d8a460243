#include "files/Specs.h"

#include <sys/stat.h>

#include <algorithm>

#include "files/HFSNames.h"
#include "files/NodeID.h"

namespace tallowmere::files {
namespace {

std::optional<Place> FolderAtEndOf(const std::string& link) {
  const auto real = RealPath(link);
  return real ? PlaceAt(*real) : std::nullopt;
}

OSErr SpecOfRoot(const Volume& volume, FSSpec& spec) {
  FillSpec(spec, volume.Number(), kParentOfRootID, volume.Name());
  return noErr;
}

OSErr SpecInFolder(const Place& item, const Folder& folder, FSSpec& spec) {
  const auto name = HFSNameOf(folder, item, kLongestSpecName);
  if (!name) return fnfErr;
  FillSpec(spec, folder.volume->Number(), folder.ID(), *name);
  return noErr;
}

}  // namespace

VolumePointer VolumeOf(const Place& item, const VolumePointer& known) {
  if (known && known->IsMountedAs(item.item.mount)) return known;
  return MountTable::OfThisProcess().OfItem(item.item, item.path);
}

bool IsRootOf(const VolumePointer& volume, const Place& item) {
  return volume && volume->Root() && AreEqual(*volume->Root(), item.item);
}

OSErr HoldingFolder(const Place& item, const VolumePointer& known, Folder& folder) {
  if (item.path == "/") return fnfErr;
  auto found = PlaceAt(FolderOf(item.path));
  // Above a link its spelling does not lead to the folder that holds what it points to.
  if (found && S_ISLNK(found->item.type)) found = FolderAtEndOf(found->path);
  if (!found) return ErrorOfSystem();
  if (!S_ISDIR(found->item.type)) return fnfErr;
  folder.place = *std::move(found);
  folder.volume = VolumeOf(folder.place, known);
  if (!folder.volume || !folder.volume->Root()) return nsvErr;
  RememberPlace(folder.place);
  return noErr;
}

OSErr SpecOfPlace(const Place& item, FSSpec& spec) {
  const VolumePointer volume = VolumeOf(item, nullptr);
  if (IsRootOf(volume, item)) return SpecOfRoot(*volume, spec);
  Folder folder;
  const OSErr error = HoldingFolder(item, volume, folder);
  return error == noErr ? SpecInFolder(item, folder, spec) : error;
}

OSErr SpecOfPlace(const Place& item, const Folder& folder, FSSpec& spec) {
  const VolumePointer volume = VolumeOf(item, folder.volume);
  if (IsRootOf(volume, item)) return SpecOfRoot(*volume, spec);
  RememberPlace(folder.place);
  return SpecInFolder(item, folder, spec);
}

OSErr FolderWithID(SInt16 vRefNum, UInt32 id, Folder& folder) {
  folder.volume = MountTable::OfThisProcess().WithNumber(vRefNum);
  if (!folder.volume) return nsvErr;
  auto place = FindItem(folder.volume, id, true);
  if (!place) return dirNFErr;
  folder.place = *std::move(place);
  return noErr;
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
