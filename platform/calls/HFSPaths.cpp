// FSMakeFSSpec: the record of an item by an HFS path.

#include <CoreServices/CoreServices.h>
#include <sys/stat.h>

#include <string>
#include <vector>

#include "files/HFSNames.h"
#include "files/NodeID.h"
#include "files/PascalName.h"
#include "files/Specs.h"
#include "foundation/NoThrow.h"
#include "foundation/PathText.h"

using namespace tallowmere::files;
using tallowmere::foundation::JoinPath;
using tallowmere::foundation::LastComponent;
using tallowmere::foundation::OrError;

namespace {

constexpr char kSeparator = ':';

// A path as steps from a folder to the folders on its way: each a name, or empty for a climb to the
// folder above.
struct Steps {
  std::string_view volume;  // of a full path, else empty
  std::vector<std::string_view> folders;
  std::string_view item;  // empty when the path ends in a folder, with a colon behind its name
};

Steps ReadPath(std::string_view path) {
  Steps steps;
  const std::size_t first = path.find(kSeparator);
  if (first != std::string_view::npos && first > 0) {
    steps.volume = path.substr(0, first);
    path.remove_prefix(first);
  }
  if (path.starts_with(kSeparator)) path.remove_prefix(1);
  for (std::size_t end; (end = path.find(kSeparator)) != std::string_view::npos;) {
    steps.folders.push_back(path.substr(0, end));
    path.remove_prefix(end + 1);
  }
  steps.item = path;
  return steps;
}

// A folder that was looked for, if it was found; else errno tells. `near` as for VolumeOf.
OSErr Use(std::optional<OpenFolder> found, const VolumePointer& near, Folder& folder) {
  if (!found) return OnTheWay(ErrorOfSystem());
  folder = {*std::move(found), nullptr};
  folder.volume = VolumeOf(folder.place, near);
  return folder.volume && folder.volume->Root() ? noErr : nsvErr;
}

OSErr CurrentFolder(Folder& folder) {
  const auto path = RealPath(".");
  return Use(path ? OpenFolderAt(*path) : std::nullopt, nullptr, folder);
}

OSErr RootOf(const VolumePointer& volume, Folder& folder) {
  if (!volume) return nsvErr;
  return FolderWithID(volume->Number(), kRootFolderID, folder);
}

OSErr StartingFolder(SInt16 vRefNum, SInt32 dirID, std::string_view volumeName, Folder& folder) {
  MountTable& table = MountTable::OfThisProcess();
  if (!volumeName.empty()) return RootOf(table.WithName(volumeName), folder);
  if (vRefNum == 0 && dirID == 0) return CurrentFolder(folder);
  if (dirID == 0) return RootOf(table.WithNumber(vRefNum), folder);
  return FolderWithID(vRefNum, static_cast<UInt32>(dirID), folder);
}

// Into the folder with a name, a link to it followed, or with an empty name to the folder above.
OSErr Step(std::string_view name, Folder& folder) {
  if (name.empty()) {
    if (IsRootOf(folder.volume, folder.place)) return dirNFErr;
    Folder above;
    const OSErr error = HoldingFolder(folder.place, folder.volume, above);
    if (error != noErr) return OnTheWay(error);
    if (!Holds(above, folder.place.item, *LastComponent(folder.place.path))) return dirNFErr;
    folder = std::move(above);
    return noErr;
  }
  Place item;
  const OSErr error = LookUpHFSName(folder, name, item);
  if (error != noErr) return OnTheWay(error);
  const bool isLink = S_ISLNK(item.item.type);
  return Use(isLink ? OpenBehindLink(SpotOf(item, folder), item.path) : Open(item), folder.volume,
             folder);
}

// The folder that steps from a volume's root lead to, when one look tells it: what has their names
// in Linux is on the very mount of the root, without a link on the way. Not on a volume with
// several mounts, where a name can be that of an item which one of them hides.
bool FindFolderAtOnce(const Steps& steps, Folder& folder) {
  if (steps.volume.empty() || steps.folders.empty()) return false;
  folder.volume = MountTable::OfThisProcess().WithName(steps.volume);
  if (!folder.volume || !folder.volume->Root()) return false;
  if (folder.volume->MountPoints().size() > 1) return false;
  std::string path = folder.volume->MountPoint();
  for (const std::string_view name : steps.folders) {
    const std::string linuxName = SpellHFSName(name).precomposed;
    if (linuxName.empty()) return false;
    path = JoinPath(path, linuxName);
  }
  auto found = OpenFolderAt(path);
  if (!found) return false;
  folder = {*std::move(found), folder.volume};
  return folder.volume->IsMountedAs(folder.place.item.mount);
}

OSErr FindFolder(SInt16 vRefNum, SInt32 dirID, const Steps& steps, Folder& folder) {
  if (FindFolderAtOnce(steps, folder)) return noErr;
  OSErr error = StartingFolder(vRefNum, dirID, steps.volume, folder);
  for (const std::string_view name : steps.folders) {
    if (error != noErr) break;
    error = Step(name, folder);
  }
  return error;
}

OSErr SpecOfName(const Folder& folder, std::string_view name, FSSpec& spec) {
  Place item;
  const OSErr error = LookUpHFSName(folder, name, item);
  if (error == noErr) {
    RememberPlace(item);
    RememberPlace(folder.place);
    return SpecInFolder(folder, item, spec);
  }
  if (error != fnfErr) return error;
  if (name.size() > kLongestSpecName || SpellHFSName(name).precomposed.empty()) return bdNamErr;
  RememberPlace(folder.place);
  FillSpec(spec, folder.volume->Number(), folder.ID(), name);
  return fnfErr;
}

OSErr MakeSpec(SInt16 vRefNum, SInt32 dirID, std::string_view path, FSSpec& spec) {
  // The record of a root: the volume's name in the parent that every root has.
  if (dirID == static_cast<SInt32>(kParentOfRootID) && path.find(kSeparator) == path.npos) {
    const VolumePointer volume = MountTable::OfThisProcess().WithNumber(vRefNum);
    if (!volume) return nsvErr;
    if (path.empty()) return dirNFErr;
    if (path.size() > kLongestSpecName) return bdNamErr;
    FillSpec(spec, volume->Number(), kParentOfRootID, path);
    return volume->Name() == path ? noErr : fnfErr;
  }
  const Steps steps = ReadPath(path);
  Folder folder;
  if (const OSErr error = FindFolder(vRefNum, dirID, steps, folder)) return error;
  return steps.item.empty() ? SpecOfPlace(folder.place, spec)
                            : SpecOfName(folder, steps.item, spec);
}

}  // namespace

OSErr FSMakeFSSpec(SInt16 vRefNum, SInt32 dirID, ConstStr255Param fileName, FSSpec* spec) {
  return OrError([&] { return MakeSpec(vRefNum, dirID, TextOfPascal(fileName), *spec); });
}
