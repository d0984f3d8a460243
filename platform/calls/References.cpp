#include "calls/References.h"

#include <algorithm>
#include <bit>

#include "catalog/NameLookup.h"
#include "foundation/PathText.h"
#include "names/HFSNames.h"

namespace tallowmere::calls {

static_assert(sizeof(kernel::Item) == sizeof(FSRef));

FSRef Pack(const kernel::Item& item) {
  return std::bit_cast<FSRef>(item);
}

std::optional<kernel::Item> Unpack(const FSRef* reference) {
  if (reference == nullptr) return std::nullopt;
  const auto item = std::bit_cast<kernel::Item>(*reference);
  if (item.type == 0 || item.handle.size > kernel::kLongestHandle) return std::nullopt;
  return item;
}

FSRef ReferenceTo(catalog::Moment& moment, const catalog::Look& look) {
  const kernel::Item reference = moment.Prove(look);
  moment.Knowledge().Remember(reference, look.Path(), look.Folder().Volume().get());
  return Pack(reference);
}

FSRef ReferenceTo(catalog::Moment& moment, const catalog::HeldFolder& folder) {
  const kernel::Item reference = moment.Prove(folder);
  // An item proved by its place is remembered by place, not by number.
  if (catalog::IsProvedByPlace(reference)) {
    moment.Knowledge().Remember(reference, folder.Path(), folder.Volume().get());
  }
  return Pack(reference);
}

FSRef ReferenceTo(catalog::Moment& moment, const catalog::Sighting& seen) {
  const auto volume = moment.VolumeOf(seen);
  const kernel::Spot spot = kernel::AtPath(seen.path.c_str());
  kernel::Item reference = seen.item;
  if (!volume) {
    kernel::ReadProof(reference, spot);
  } else if ((*volume)->NumbersIdentifyItems()) {
    reference = catalog::Proved(seen, **volume, spot);
  } else {
    const auto canonical = moment.See(seen.path);
    reference = catalog::Proved(canonical ? *canonical : seen, **volume, spot);
  }
  moment.Knowledge().Remember(reference, seen.path, volume ? volume->get() : nullptr);
  return Pack(reference);
}

volumes::VolumePointer VolumeOfRoot(catalog::Moment& moment, const catalog::Sighting& seen) {
  if (!kernel::IsFolder(seen.item)) return nullptr;
  const auto volume = moment.VolumeOf(seen);
  return volume && (*volume)->IsRoot(seen.item, seen.path) ? *volume : nullptr;
}

kernel::Result<FSSpec> RecordOfRoot(const volumes::VolumePointer& volume) {
  if (!volume) return kernel::kNoVolume;
  const auto name = volume->Listed().Name();
  if (!name) return name.Error();
  return MakeRecord(volume->Number(), names::kParentOfRootID, *name);
}

kernel::Result<FSSpec> RecordOf(catalog::Moment& moment, const catalog::Look& item) {
  if (const auto volume = VolumeOfRoot(moment, item.Seen())) return RecordOfRoot(volume);
  const auto name = catalog::HFSNameOf(moment, item, names::kLongestSpecName);
  if (!name) return name.Error();
  return MakeRecord(item.Folder().Volume()->Number(), item.Folder().ID(), *name);
}

FSSpec MakeRecord(SInt16 vRefNum, UInt32 parID, std::string_view name) {
  name = name.substr(0, names::kLongestSpecName);
  FSSpec spec = {};
  spec.vRefNum = vRefNum;
  spec.parID = static_cast<SInt32>(parID);
  spec.name[0] = static_cast<unsigned char>(name.size());
  std::copy(name.begin(), name.end(), spec.name + 1);
  return spec;
}

}  // namespace tallowmere::calls
