// The File Manager's questions about existing items.

#include <CoreServices/CoreServices.h>
#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <string>

#include "files/HFSNames.h"
#include "files/NodeID.h"
#include "files/PascalName.h"
#include "files/Specs.h"
#include "foundation/ColonsAndSlashes.h"
#include "foundation/FileNameText.h"
#include "foundation/MacRoman.h"
#include "foundation/NoThrow.h"
#include "foundation/PathText.h"

using namespace tallowmere::files;
using namespace tallowmere::foundation;

namespace {

constexpr std::size_t kLongestUnicodeName = 255;

// The volume that an item counts to: its own, or for a file that is mounted alone and so is on
// none, that of the folder that holds it.
VolumePointer VolumeOfItem(const Place& item) {
  auto volume = VolumeOf(item, nullptr);
  if (volume && volume->Root()) return volume;
  Folder folder;
  return HoldingFolder(item, nullptr, folder) == noErr ? folder.volume : nullptr;
}

OSErr GiveReference(const Place& place, FSRef* reference) {
  ItemReference item = place.item;
  ReadProof(item, AT_FDCWD, place.path.c_str());
  RememberPlace(place);
  *reference = Pack(item);
  return noErr;
}

OSErr FillInfo(const Place& item, FSCatalogInfoBitmap whichInfo, FSCatalogInfo& info) {
  if ((whichInfo & (kFSCatInfoVolume | kFSCatInfoNodeID)) == 0) return noErr;
  const VolumePointer volume = VolumeOfItem(item);
  if (!volume) return nsvErr;
  if ((whichInfo & kFSCatInfoVolume) != 0) info.volume = volume->Number();
  if ((whichInfo & kFSCatInfoNodeID) != 0) info.nodeID = NodeIDOf(item.item, *volume->Root());
  return noErr;
}

void FillName(const Place& item, HFSUniStr255& name) {
  const VolumePointer volume = VolumeOf(item, nullptr);
  std::u16string text = IsRootOf(volume, item)
                            ? DecodeMacRoman(volume->Name())
                            : ExchangeColonsAndSlashes(TextOfFileName(*LastComponent(item.path)));
  text.resize(std::min(text.size(), kLongestUnicodeName));
  name.length = static_cast<UInt16>(text.size());
  std::copy(text.begin(), text.end(), name.unicode);
}

OSErr FillParent(const Place& item, FSRef& parent) {
  parent = {};
  const VolumePointer volume = VolumeOf(item, nullptr);
  if (IsRootOf(volume, item)) return noErr;
  Folder folder;
  const OSErr error = HoldingFolder(item, volume, folder);
  return error == noErr ? GiveReference(folder.place, &parent) : error;
}

// The item of a reference and where it is now, by a path that need not be canonical.
OSErr PlaceOfReference(const FSRef* reference, Place& place) {
  const auto item = Unpack(reference);
  if (!item) return fnfErr;
  auto path = FindPath(*item);
  if (!path) return fnfErr;
  place = {*std::move(path), *item};
  return noErr;
}

}  // namespace

OSErr FSGetCatalogInfo(const FSRef* ref, FSCatalogInfoBitmap whichInfo, FSCatalogInfo* catalogInfo,
                       HFSUniStr255* outName, FSSpec* fsSpec, FSRef* parentRef) {
  const auto describe = [&](const Place& item) -> OSErr {
    OSErr error = noErr;
    if (catalogInfo != nullptr) error = FillInfo(item, whichInfo, *catalogInfo);
    if (error == noErr && outName != nullptr) FillName(item, *outName);
    if (error == noErr && fsSpec != nullptr) error = SpecOfPlace(item, *fsSpec);
    if (error == noErr && parentRef != nullptr) error = FillParent(item, *parentRef);
    return error;
  };
  return OrError([&]() -> OSErr {
    Place item;
    OSErr error = PlaceOfReference(ref, item);
    if (error == noErr) error = describe(item);
    if (error == noErr || item.path.empty()) return error;
    // A link of /proc can lead to an item of which only other paths tell where it is.
    auto path = FindCanonicalPath(item.item);
    if (!path || *path == item.path) return error;
    return describe({*std::move(path), item.item});
  });
}

OSErr FSResolveNodeID(SInt16 volume, UInt32 nodeID, FSRef* outRef) {
  return OrError([&]() -> OSErr {
    const VolumePointer found = MountTable::OfThisProcess().WithNumber(volume);
    if (!found) return nsvErr;
    const auto place = FindItem(found, nodeID, false);
    if (!place) return fnfErr;
    return GiveReference(*place, outRef);
  });
}

OSErr FSMakeFSRefUnicode(const FSRef* parentRef, UniCharCount nameLength, const UniChar* name,
                         TextEncoding, FSRef* newRef) {
  return OrError([&]() -> OSErr {
    Place parent;
    if (const OSErr error = PlaceOfReference(parentRef, parent)) return error;
    if (!S_ISDIR(parent.item.type)) return errFSNotAFolder;
    if (nameLength > kLongestUnicodeName) return fnfErr;
    const auto linuxName =
        FileNameOfText(ExchangeColonsAndSlashes(std::u16string(name, name + nameLength)));
    if (!linuxName || !CanBeLinuxName(*linuxName)) return fnfErr;
    const std::string path = JoinPath(parent.path, *linuxName);
    const auto item = ReadItem(AT_FDCWD, path.c_str());
    if (!item) return ErrorOfSystem();
    RememberSighting(*item, path);
    *newRef = Pack(*item);
    return noErr;
  });
}

OSErr FSpMakeFSRef(const FSSpec* spec, FSRef* newRef) {
  return OrError([&]() -> OSErr {
    if (spec->name[0] > kLongestSpecName) return fnfErr;
    const std::string_view name = TextOfPascal(spec->name);
    if (spec->parID == static_cast<SInt32>(kParentOfRootID)) {
      const VolumePointer volume = MountTable::OfThisProcess().WithNumber(spec->vRefNum);
      if (!volume) return nsvErr;
      if (volume->Name() != name) return fnfErr;
      const auto root = FindItem(volume, kRootFolderID, true);
      if (!root) return fnfErr;
      return GiveReference(*root, newRef);
    }
    Folder folder;
    const auto id = static_cast<UInt32>(spec->parID);
    if (const OSErr error = FolderWithID(spec->vRefNum, id, folder)) return error;
    Place item;
    if (const OSErr error = LookUpHFSName(folder, name, item)) return error;
    return GiveReference(item, newRef);
  });
}

OSErr PBGetCatInfoSync(CInfoPBPtr paramBlock) {
  return OrError([&]() -> OSErr {
    DirInfo& block = paramBlock->dirInfo;
    if (block.ioFDirIndex != -1) return paramErr;
    Folder folder;
    const auto id = static_cast<UInt32>(block.ioDrDirID);
    if (const OSErr error = FolderWithID(block.ioVRefNum, id, folder)) return error;

    std::string name = folder.volume->Name();
    UInt32 parentID = kParentOfRootID;
    if (id != kRootFolderID) {
      Folder holder;
      if (const OSErr error = HoldingFolder(folder.place, folder.volume, holder)) return error;
      const auto found = HFSNameOf(holder, folder.place, kLongestStr255Name);
      if (!found) return fnfErr;
      name = *found;
      // A folder that hangs in another volume is the top of what can be climbed on this one.
      const bool sameVolume = holder.volume->Number() == folder.volume->Number();
      if (sameVolume) parentID = holder.ID();
    }
    if (block.ioNamePtr != nullptr) CopyToPascal(name, block.ioNamePtr);
    block.ioDrParID = static_cast<SInt32>(parentID);
    return noErr;
  });
}
