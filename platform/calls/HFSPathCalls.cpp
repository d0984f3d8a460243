// FSMakeFSSpec: the record of an item by an HFS path.

#include <CoreServices/CoreServices.h>

#include <optional>
#include <string>
#include <vector>

#include "calls/Process.h"
#include "calls/References.h"
#include "calls/ResultCodes.h"
#include "catalog/Finding.h"
#include "catalog/NameLookup.h"
#include "catalog/Views.h"
#include "foundation/NoThrow.h"
#include "foundation/PathText.h"
#include "kernel/Paths.h"
#include "names/HFSNames.h"
#include "names/PascalNames.h"

using namespace tallowmere;
using namespace tallowmere::calls;
using catalog::HeldFolder;
using catalog::Moment;

namespace {

constexpr char kSeparator = ':';

// An HFS path, parsed: the steps from its first folder, each the name of a folder, or empty for the
// parent.
struct Steps {
  std::string_view volume;  // of a full path, otherwise empty
  std::vector<std::string_view> folders;
  std::string_view item;  // empty when the path ends in a colon
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

kernel::Result<HeldFolder> CurrentFolder(Moment& moment) {
  const auto path = kernel::RealPath(".");
  if (!path) return path.Error();
  return moment.HoldFolder(*path);
}

kernel::Result<HeldFolder> StartingFolder(Moment& moment, SInt16 vRefNum, SInt32 dirID,
                                          std::string_view volumeName) {
  if (!volumeName.empty()) {
    const auto volume = moment.Volumes()->WithName(volumeName);
    if (!volume) return volume.Error();
    return catalog::HoldFolderWithID(moment, (*volume)->Number(), names::kRootFolderID);
  }
  if (vRefNum == 0 && dirID == 0) return CurrentFolder(moment);
  const UInt32 id = dirID == 0 ? names::kRootFolderID : static_cast<UInt32>(dirID);
  return catalog::HoldFolderWithID(moment, vRefNum, id);
}

kernel::Result<HeldFolder> StepUp(Moment& moment, const HeldFolder& folder) {
  if (folder.IsRoot()) return kernel::kNoFolder;
  auto above = moment.HoldParentOf(folder.Path());
  if (!above) return above;
  const auto look = moment.LookUp(*above, std::string(*foundation::LastComponent(folder.Path())));
  const bool isStillThere =
      look && catalog::AreSame(*folder.Volume(), look->Seen(), folder.Place());
  if (!isStillThere) return kernel::kNoFolder;
  return above;
}

// Enters the folder with a name, following a link, or for an empty name the parent.
kernel::Result<HeldFolder> Step(Moment& moment, const HeldFolder& folder, std::string_view name) {
  if (name.empty()) return StepUp(moment, folder);
  const auto item = catalog::LookUpHFSName(moment, folder, name);
  if (!item) return item.Error();
  return kernel::IsLink(item->Item()) ? moment.HoldTargetOf(*item) : moment.HoldFolderOf(*item);
}

// The path of the steps below a volume's root if each has the same name in Linux; otherwise empty.
std::string LinuxPathOf(const std::string& mountPoint, const std::vector<std::string_view>& names) {
  std::string path = mountPoint;
  for (const std::string_view name : names) {
    const std::string linuxName = names::SpellHFSName(name).precomposed;
    if (linuxName.empty()) return {};
    path = foundation::JoinPath(path, linuxName);
  }
  return path;
}

// The folder at the end of the steps from a volume's root, found by one walk of the kernel:
// possible if every folder has the same name in Linux, on the root's mount, without links. Not on a
// volume with several mounts, where a name can be that of an item that one of them hides.
std::optional<HeldFolder> HoldFolderAtOnce(Moment& moment, const Steps& steps) {
  if (steps.volume.empty() || steps.folders.empty()) return std::nullopt;
  const auto lead = moment.LastVolumes()->WithName(steps.volume);
  if (!lead) return std::nullopt;
  const std::string path = LinuxPathOf((*lead)->MountPoint(), steps.folders);
  auto folder =
      path.empty() ? kernel::Result<HeldFolder>(kernel::kNotThere) : moment.HoldFolder(path);
  if (!folder || !catalog::HasOneView(*folder)) return std::nullopt;
  // The mount table may have changed by now.
  const auto volume = moment.Volumes()->WithName(steps.volume);
  const bool isIt = volume && (*volume)->IsMountedAs(folder->Item().mount) &&
                    foundation::IsWithin(path, (*volume)->MountPoint()) &&
                    (*volume)->MountPoint() == (*lead)->MountPoint();
  return isIt ? std::optional(*std::move(folder)) : std::nullopt;
}

kernel::Result<HeldFolder> HoldFolder(Moment& moment, SInt16 vRefNum, SInt32 dirID,
                                      const Steps& steps) {
  if (auto folder = HoldFolderAtOnce(moment, steps)) return *std::move(folder);
  auto folder = StartingFolder(moment, vRefNum, dirID, steps.volume);
  for (const std::string_view name : steps.folders) {
    if (!folder) break;
    folder = Step(moment, *folder, name);
  }
  return folder;
}

kernel::Result<FSSpec> RecordOfFolder(Moment& moment, const HeldFolder& folder) {
  if (folder.IsRoot()) return RecordOfRoot(folder.Volume());
  const auto look = catalog::LookAgain(moment, folder.Item(), folder.Path());
  if (!look) return look.Error();
  return RecordOf(moment, *look);
}

OSErr Fill(const kernel::Result<FSSpec>& record, FSSpec& spec) {
  if (!record) return ResultCodeOf(record.Error());
  spec = *record;
  return noErr;
}

OSErr RecordOfName(Moment& moment, const HeldFolder& folder, std::string_view name, FSSpec& spec) {
  const auto item = catalog::LookUpHFSName(moment, folder, name);
  if (item) return Fill(RecordOf(moment, *item), spec);
  const OSErr error = ResultCodeOf(item.Error());
  if (error != fnfErr) return error;
  const bool isPossible =
      name.size() <= names::kLongestSpecName && !names::SpellHFSName(name).precomposed.empty();
  if (!isPossible) return bdNamErr;
  spec = MakeRecord(folder.Volume()->Number(), folder.ID(), name);
  return fnfErr;
}

// The record of a name in kParentOfRootID, which holds the volume's root folder only.
OSErr RecordInParentOfRoot(Moment& moment, SInt16 vRefNum, std::string_view name, FSSpec& spec) {
  const auto volume = moment.Volumes()->WithNumber(vRefNum);
  if (!volume) return nsvErr;
  if (name.empty()) return dirNFErr;
  if (name.size() > names::kLongestSpecName) return bdNamErr;
  const auto own = volume->Name();
  if (!own) return ResultCodeOf(own.Error());
  spec = MakeRecord(volume->Number(), names::kParentOfRootID, name);
  return *own == name ? noErr : fnfErr;
}

OSErr Make(Moment& moment, SInt16 vRefNum, SInt32 dirID, std::string_view path, FSSpec& spec) {
  const bool isName = path.find(kSeparator) == std::string_view::npos;
  if (dirID == static_cast<SInt32>(names::kParentOfRootID) && isName) {
    return RecordInParentOfRoot(moment, vRefNum, path, spec);
  }
  const Steps steps = ReadPath(path);
  const auto folder = HoldFolder(moment, vRefNum, dirID, steps);
  if (!folder) return ResultCodeOfFolder(folder.Error());
  return steps.item.empty() ? Fill(RecordOfFolder(moment, *folder), spec)
                            : RecordOfName(moment, *folder, steps.item, spec);
}

}  // namespace

OSErr FSMakeFSSpec(SInt16 vRefNum, SInt32 dirID, ConstStr255Param fileName, FSSpec* spec) {
  return foundation::OrError([&] {
    return InMoment([&](Moment& moment) {
      return Make(moment, vRefNum, dirID, names::TextOfPascal(fileName), *spec);
    });
  });
}
