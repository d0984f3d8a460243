// The File Manager's questions about existing items.

#include <CoreServices/CoreServices.h>

#include <algorithm>
#include <optional>
#include <string>
#include <utility>

#include "calls/Process.h"
#include "calls/References.h"
#include "calls/ResultCodes.h"
#include "catalog/Finding.h"
#include "catalog/NameLookup.h"
#include "catalog/StoredNames.h"
#include "foundation/ColonsAndSlashes.h"
#include "foundation/NoThrow.h"
#include "foundation/PathText.h"
#include "kernel/Paths.h"
#include "names/HFSNames.h"
#include "names/PascalNames.h"
#include "text/FileNameText.h"
#include "text/MacRoman.h"

using namespace tallowmere;
using namespace tallowmere::calls;

namespace {

constexpr std::size_t kLongestUnicodeName = 255;

// An item seen now: in its parent, or on its own if it is "/" or its parent is on no volume.
class Subject {
 public:
  explicit Subject(catalog::Look look) : mLook(std::move(look)) {}
  explicit Subject(catalog::Sighting alone) : mAlone(std::move(alone)) {}

  const catalog::Sighting& Seen() const { return mLook ? mLook->Seen() : mAlone; }
  const std::optional<catalog::Look>& Look() const { return mLook; }

 private:
  std::optional<catalog::Look> mLook;
  catalog::Sighting mAlone{};
};

// The answers that the caller asked for.
struct Description {
  FSCatalogInfoBitmap whichInfo;
  FSCatalogInfo* info;
  HFSUniStr255* name;
  FSSpec* spec;
  FSRef* parent;

  bool IsOfVolumeAndNumberAlone() const {
    return name == nullptr && spec == nullptr && parent == nullptr;
  }
};

// Reads an item of another volume than its folder's once more if its id depends on its handle.
UInt32 IDOnVolume(const volumes::Volume& volume, const catalog::Sighting& seen) {
  if (!volume.NeedsHandleForID(seen.item)) return catalog::IDOf(volume, seen);
  catalog::Sighting proved = seen;
  kernel::ReadProof(proved.item, kernel::AtPath(seen.path.c_str()));
  return catalog::IDOf(volume, proved);
}

// The volume and the id of an item. A file mounted by itself, and the mount point of a kernel
// interface, are on no volume: they get their folder's volume and an id that leads nowhere.
OSErr FillInfo(catalog::Moment& moment, const Subject& item, FSCatalogInfo& info) {
  const auto volume = moment.VolumeOf(item.Seen());
  if (volume) {
    info = {(*volume)->Number(), IDOnVolume(**volume, item.Seen())};
    return noErr;
  }
  if (!item.Look()) return nsvErr;
  info = {item.Look()->Folder().Volume()->Number(), names::kNoVolumeID};
  return noErr;
}

OSErr FillInfo(catalog::Moment& moment, const Subject& item, const Description& wanted) {
  constexpr FSCatalogInfoBitmap kBoth = kFSCatInfoVolume | kFSCatInfoNodeID;
  if (wanted.info == nullptr || (wanted.whichInfo & kBoth) == 0) return noErr;
  FSCatalogInfo info;
  if (const OSErr error = FillInfo(moment, item, info)) return error;
  if ((wanted.whichInfo & kFSCatInfoVolume) != 0) wanted.info->volume = info.volume;
  if ((wanted.whichInfo & kFSCatInfoNodeID) != 0) wanted.info->nodeID = info.nodeID;
  return noErr;
}

OSErr FillName(catalog::Moment& moment, const Subject& item, HFSUniStr255& name) {
  std::u16string text;
  if (const auto volume = VolumeOfRoot(moment, item.Seen())) {
    const auto volumeName = volume->Listed().Name();
    if (!volumeName) return ResultCodeOf(volumeName.Error());
    text = text::DecodeMacRoman(*volumeName);
  } else {
    const std::string path =
        item.Look() ? catalog::AsStored(moment, *item.Look()).Path() : item.Seen().path;
    text = foundation::ExchangeColonsAndSlashes(
        text::TextOfFileName(*foundation::LastComponent(path)));
  }
  text.resize(std::min(text.size(), kLongestUnicodeName));
  name.length = static_cast<UInt16>(text.size());
  std::copy(text.begin(), text.end(), name.unicode);
  return noErr;
}

OSErr FillSpec(catalog::Moment& moment, const Subject& item, FSSpec& spec) {
  const auto record = item.Look() ? RecordOf(moment, *item.Look())
                                  : RecordOfRoot(VolumeOfRoot(moment, item.Seen()));
  if (!record) return ResultCodeOf(record.Error());
  spec = *record;
  return noErr;
}

OSErr FillParent(catalog::Moment& moment, const Subject& item, FSRef& parent) {
  parent = {};
  if (VolumeOfRoot(moment, item.Seen())) return noErr;
  if (!item.Look()) return nsvErr;
  parent = ReferenceTo(moment, item.Look()->Folder());
  return noErr;
}

OSErr Describe(catalog::Moment& moment, const Subject& item, const Description& wanted) {
  OSErr error = FillInfo(moment, item, wanted);
  if (error == noErr && wanted.name != nullptr) error = FillName(moment, item, *wanted.name);
  if (error == noErr && wanted.spec != nullptr) error = FillSpec(moment, item, *wanted.spec);
  if (error == noErr && wanted.parent != nullptr) error = FillParent(moment, item, *wanted.parent);
  return error;
}

// A reference's item at a path, following links on the way.
kernel::Result<Subject> SeeAt(catalog::Moment& moment, const kernel::Item& reference,
                              const std::string& path) {
  const auto look = catalog::LookAgain(moment, reference, path);
  if (look) return Subject(*look);
  const bool hasHolder = path != "/" && look.Error() != kernel::kNoVolume;
  if (hasHolder) return look.Error();
  const auto seen = moment.See(path);
  if (!seen) return seen.Error();
  if (!catalog::IsItemOf(reference, *seen, kernel::AtPath(seen->path.c_str()))) {
    return kernel::kNotThere;
  }
  return Subject(*seen);
}

// The item as this moment has seen it already.
std::optional<Subject> Known(const catalog::Moment& moment, const kernel::Item& reference,
                             const Description& wanted) {
  if (const catalog::Look* const look = moment.LookFor(reference)) {
    return Subject(*look);
  }
  const catalog::HeldFolder* const held = moment.HeldFor(reference);
  if (held == nullptr || !wanted.IsOfVolumeAndNumberAlone()) return std::nullopt;
  return Subject(held->Place());
}

kernel::Result<Subject> FindSubject(catalog::Moment& moment, const kernel::Item& reference,
                                    const Description& wanted) {
  if (auto known = Known(moment, reference, wanted)) return *std::move(known);
  // If the kernel does not report the mount, only the canonical path gives the volume.
  const std::string last = catalog::LastPathOf(moment, reference);
  if (reference.mount != kernel::kNoMount && kernel::IsNormalized(last)) {
    auto subject = SeeAt(moment, reference, last);
    if (subject) return subject;
  }
  // It has moved, or its path led through a link of /proc, and another path has to be found.
  const auto path = catalog::FindPathOf(moment, reference);
  if (!path) return path.Error();
  return SeeAt(moment, reference, *path);
}

OSErr MakeReference(catalog::Moment& moment, const FSSpec& spec, FSRef& reference) {
  const std::string_view name = names::TextOfPascal(spec.name);
  const auto id = static_cast<UInt32>(spec.parID);
  if (id == names::kParentOfRootID) {
    const auto root = catalog::HoldFolderWithID(moment, spec.vRefNum, names::kRootFolderID);
    if (!root) return root.Error() == kernel::kNoVolume ? nsvErr : fnfErr;
    const auto own = root->Volume()->Listed().Name();
    if (!own) return ResultCodeOf(own.Error());
    if (*own != name) return fnfErr;
    reference = ReferenceTo(moment, *root);
    return noErr;
  }
  const auto folder = catalog::HoldFolderWithID(moment, spec.vRefNum, id);
  if (!folder) return ResultCodeOf(folder.Error());
  const auto item = catalog::LookUpHFSName(moment, *folder, name);
  if (!item) return ResultCodeOf(item.Error());
  reference = ReferenceTo(moment, *item);
  return noErr;
}

// The Linux name for a UTF-16 name; empty when no item can have it.
std::string LinuxNameOf(UniCharCount length, const UniChar* name) {
  if (length > kLongestUnicodeName) return {};
  const auto bytes = text::FileNameOfText(
      foundation::ExchangeColonsAndSlashes(std::u16string(name, name + length)));
  return bytes && names::CanBeLinuxName(*bytes) ? *bytes : std::string();
}

}  // namespace

OSErr FSGetCatalogInfo(const FSRef* ref, FSCatalogInfoBitmap whichInfo, FSCatalogInfo* catalogInfo,
                       HFSUniStr255* outName, FSSpec* fsSpec, FSRef* parentRef) {
  const Description wanted{whichInfo, catalogInfo, outName, fsSpec, parentRef};
  return foundation::OrError([&]() -> OSErr {
    const auto reference = Unpack(ref);
    if (!reference) return fnfErr;
    return InMoment([&](catalog::Moment& moment) -> OSErr {
      const auto subject = FindSubject(moment, *reference, wanted);
      return subject ? Describe(moment, *subject, wanted) : ResultCodeOf(subject.Error());
    });
  });
}

OSErr FSResolveNodeID(SInt16 volume, UInt32 nodeID, FSRef* outRef) {
  return foundation::OrError([&] {
    return InMoment([&](catalog::Moment& moment) -> OSErr {
      const auto found = moment.VolumeWithNumber(volume);
      if (!found) return found.Error() == kernel::kNoVolume ? nsvErr : fnfErr;
      const auto item = catalog::FindItem(moment, *found, nodeID, false);
      if (!item) return ResultCodeOf(item.Error());
      *outRef = ReferenceTo(moment, *item);
      return noErr;
    });
  });
}

OSErr FSMakeFSRefUnicode(const FSRef* parentRef, UniCharCount nameLength, const UniChar* name,
                         TextEncoding, FSRef* newRef) {
  return foundation::OrError([&]() -> OSErr {
    const auto parent = Unpack(parentRef);
    if (!parent) return fnfErr;
    return InMoment([&](catalog::Moment& moment) -> OSErr {
      const auto path = catalog::FindPathOf(moment, *parent);
      if (!path) return fnfErr;
      if (!kernel::IsFolder(*parent)) return errFSNotAFolder;
      const std::string linuxName = LinuxNameOf(nameLength, name);
      if (linuxName.empty()) return fnfErr;
      const auto folder = moment.HoldFolder(*path);
      const bool isIt = folder && catalog::IsItemOf(*parent, folder->Place(), folder->OwnSpot());
      if (!isIt) return fnfErr;
      const auto item = moment.LookUp(*folder, linuxName);
      if (!item) return ResultCodeOf(item.Error());
      *newRef = ReferenceTo(moment, *item);
      return noErr;
    });
  });
}

OSErr FSpMakeFSRef(const FSSpec* spec, FSRef* newRef) {
  return foundation::OrError([&]() -> OSErr {
    if (spec->name[0] > names::kLongestSpecName) return fnfErr;
    return InMoment([&](catalog::Moment& moment) { return MakeReference(moment, *spec, *newRef); });
  });
}
