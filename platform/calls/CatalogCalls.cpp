// The File Manager's questions about existing items.

#include <CoreServices/CoreServices.h>
#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <string>
#include <utility>

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

OSErr GiveReference(const Place& place, const Spot& spot, FSRef* reference) {
  ItemReference item = place.item;
  ReadProof(item, spot.folder, spot.name);
  RememberPlace(place);
  *reference = Pack(item);
  return noErr;
}

OSErr GiveReference(const Place& place, FSRef* reference) {
  return GiveReference(place, {AT_FDCWD, place.path.c_str()}, reference);
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
  if (const OSErr error = HoldingFolder(item, volume, folder)) return error;
  if (!Holds(folder, item.item, *LastComponent(item.path))) return fnfErr;
  return GiveReference(folder.place, {folder.descriptor->Get(), ""}, &parent);
}

// What was asked of an item, where one is told.
struct Description {
  FSCatalogInfoBitmap whichInfo;
  FSCatalogInfo* info;
  HFSUniStr255* name;
  FSSpec* spec;
  FSRef* parent;
};

// The path need not be canonical. fnfErr when the item is not there.
OSErr Describe(const Place& item, const Description& wanted) {
  // A record alone is made of what its folder holds.
  const bool isLookedAtLater =
      wanted.spec != nullptr && wanted.info == nullptr && wanted.name == nullptr;
  if (!isLookedAtLater && !IsAt(item.item, AT_FDCWD, item.path.c_str())) return fnfErr;
  OSErr error = noErr;
  if (wanted.info != nullptr) error = FillInfo(item, wanted.whichInfo, *wanted.info);
  if (error == noErr && wanted.name != nullptr) FillName(item, *wanted.name);
  if (error == noErr && wanted.spec != nullptr) error = SpecOfPlace(item, *wanted.spec);
  if (error == noErr && wanted.parent != nullptr) error = FillParent(item, *wanted.parent);
  return error;
}

// Sees the folder with an id, not its volume's root, in the folder that holds it by a path.
OSErr SeeInHolder(const VolumePointer& volume, UInt32 id, const std::string& path, Place& folder,
                  Folder& holder) {
  if (const OSErr error = HoldingFolder({path, {}}, volume, holder)) return OnTheWay(error);
  const std::string name(*LastComponent(path));
  const auto found = ReadStatus(holder.descriptor->Get(), name.c_str());
  if (!found || !S_ISDIR(found->item.type)) return dirNFErr;
  folder = {JoinPath(holder.place.path, name), found->item};
  const VolumePointer own = VolumeOf(folder, volume);
  const bool isIt = own && own->Root() && own->Number() == volume->Number() &&
                    NodeIDOf(folder.item, *own->Root()) == id;
  return isIt ? noErr : dirNFErr;
}

// Of the places of a folder one where its own volume holds it, if there is one: a part of a volume
// can be mounted by itself.
void PreferItsVolume(const VolumePointer& volume, UInt32 id, Place& folder, Folder& holder) {
  if (holder.volume->Number() == volume->Number()) return;
  for (const std::string& path : volume->PathsOf(folder.path, folder.item.mount)) {
    Place other;
    Folder otherHolder;
    if (SeeInHolder(volume, id, path, other, otherHolder) != noErr) continue;
    if (otherHolder.volume->Number() != volume->Number()) continue;
    folder = std::move(other);
    holder = std::move(otherHolder);
    return;
  }
}

// The folder with an id that is not its volume's root, and the folder that holds it.
OSErr FindInHolder(const VolumePointer& volume, UInt32 id, Place& folder, Folder& holder) {
  const auto last = LastPathOf(*volume, id);
  const bool isThere = last && SeeInHolder(volume, id, *last, folder, holder) == noErr;
  if (!isThere) {
    const auto found = FindItem(volume, id, true);
    if (!found) return dirNFErr;
    if (const OSErr error = SeeInHolder(volume, id, found->path, folder, holder)) return error;
  }
  PreferItsVolume(volume, id, folder, holder);
  return noErr;
}

}  // namespace

OSErr FSGetCatalogInfo(const FSRef* ref, FSCatalogInfoBitmap whichInfo, FSCatalogInfo* catalogInfo,
                       HFSUniStr255* outName, FSSpec* fsSpec, FSRef* parentRef) {
  const Description wanted{whichInfo, catalogInfo, outName, fsSpec, parentRef};
  return OrError([&]() -> OSErr {
    const auto item = Unpack(ref);
    if (!item) return fnfErr;
    const auto last = LastPathOf(*item);
    const OSErr error = last ? Describe({*last, *item}, wanted) : static_cast<OSErr>(fnfErr);
    if (error == noErr) return noErr;
    // It has moved; or a link of /proc led to it, and only other paths tell where it is.
    const auto path = FindCanonicalPath(*item);
    return path && path != last ? Describe({*path, *item}, wanted) : error;
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
    const auto parent = Unpack(parentRef);
    const auto parentPath = parent ? FindCanonicalPath(*parent) : std::nullopt;
    if (!parentPath) return fnfErr;
    if (!S_ISDIR(parent->type)) return errFSNotAFolder;
    if (nameLength > kLongestUnicodeName) return fnfErr;
    const auto linuxName =
        FileNameOfText(ExchangeColonsAndSlashes(std::u16string(name, name + nameLength)));
    if (!linuxName || !CanBeLinuxName(*linuxName)) return fnfErr;
    std::string path = JoinPath(*parentPath, *linuxName);
    const auto folder = OpenHolderOf(path);
    const bool isThere = folder && Holds(*folder, *parent, "");
    if (!isThere) return fnfErr;
    const auto item = ReadItem(folder->descriptor->Get(), linuxName->c_str());
    if (!item) return ErrorOfSystem();
    RememberPlace({std::move(path), *item});
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
    return GiveReference(item, SpotOf(item, folder), newRef);
  });
}

OSErr PBGetCatInfoSync(CInfoPBPtr paramBlock) {
  return OrError([&]() -> OSErr {
    DirInfo& block = paramBlock->dirInfo;
    if (block.ioFDirIndex != -1) return paramErr;
    const auto id = static_cast<UInt32>(block.ioDrDirID);
    std::string name;
    UInt32 parentID = kParentOfRootID;
    if (id == kRootFolderID) {
      Folder root;
      if (const OSErr error = FolderWithID(block.ioVRefNum, id, root)) return error;
      name = root.volume->Name();
    } else {
      const VolumePointer volume = MountTable::OfThisProcess().WithNumber(block.ioVRefNum);
      if (!volume) return nsvErr;
      Place folder;
      Folder holder;
      if (const OSErr error = FindInHolder(volume, id, folder, holder)) return error;
      const auto found = HFSNameOf(holder, folder, kLongestStr255Name);
      if (!found) return fnfErr;
      name = *found;
      // A folder that hangs in another volume is the top of what can be climbed on this one.
      const bool sameVolume = holder.volume->Number() == volume->Number();
      if (sameVolume) parentID = holder.ID();
    }
    if (block.ioNamePtr != nullptr) CopyToPascal(name, block.ioNamePtr);
    block.ioDrParID = static_cast<SInt32>(parentID);
    return noErr;
  });
}
