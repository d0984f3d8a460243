#include "catalog/Catalog.h"

#include <algorithm>

namespace tallowmere::catalog {
namespace {

// Some five thousand places with paths of usual length, in bytes.
constexpr std::size_t kPlacesLimit = 1 << 20;

// Spaces of device numbers, which have fewer bits, for what has no node id of its own.
constexpr std::uint64_t kByInode = std::uint64_t{1} << 63;
constexpr std::uint64_t kByPlace = std::uint64_t{1} << 62;

// On a volume an item is remembered by its node id, so that its record finds it too.
PlaceKey KeyOf(const kernel::Item& item, const volumes::Volume* volume) {
  if (IsProvedByPlace(item)) return {kByPlace | item.device, PlaceDigest(item)};
  const bool hasID =
      volume != nullptr && volume->NumbersTellItemsApart() && !volume->NeedsHandleForID(item);
  if (!hasID) return {kByInode | item.device, item.inode};
  return {volume->Root().device, volume->IDOf(item)};
}

// What was learned hangs on the places where the volume was mounted, and on what was hidden.
bool IsSeenAlike(const volumes::ListedVolume& first, const volumes::ListedVolume& second) {
  return first.MountPoints() == second.MountPoints() && first.Covers() == second.Covers();
}

}  // namespace

Catalog::Catalog() : mPlaces(kPlacesLimit) {}

void Catalog::Remember(const kernel::Item& item, std::string_view path,
                       const volumes::Volume* volume) {
  mPlaces.Remember(KeyOf(item, volume), path);
}

void Catalog::RememberParent(const Sighting& seen, const volumes::Volume& volume,
                             std::uint32_t parent) {
  mPlaces.RememberParent(KeyOf(seen.item, &volume), seen.path, parent);
}

const PlaceMemory::Place* Catalog::LastPlaceOf(const kernel::Item& item,
                                               const volumes::Volume* volume) {
  return mPlaces.Recall(KeyOf(item, volume));
}

const PlaceMemory::Place* Catalog::LastPlaceOf(std::uint32_t id, const volumes::Volume& volume) {
  return volume.NumbersTellItemsApart() ? mPlaces.Recall({volume.Root().device, id}) : nullptr;
}

std::optional<std::string> Catalog::SearchVolume(const volumes::VolumePointer& volume,
                                                 const SearchedItem& item,
                                                 const std::string& start) {
  return IndexOf(volume).Find(item, start, *mTable.AsLastRead());
}

// Indexes of volumes that are gone go with the next new one.
FolderIndex& Catalog::IndexOf(const volumes::VolumePointer& volume) {
  for (FolderIndex& index : mIndexes) {
    const volumes::Volume& known = *index.OfVolume();
    if (known.Number() != volume->Number()) continue;
    if (!kernel::HaveSameNumbers(known.Root(), volume->Root())) continue;
    if (!IsSeenAlike(known.Listed(), volume->Listed())) index = FolderIndex(volume);
    return index;
  }
  const auto volumes = mTable.AsLastRead();
  std::erase_if(mIndexes, [&](const FolderIndex& index) {
    return !volumes->WithNumber(index.OfVolume()->Number());
  });
  return mIndexes.emplace_back(volume);
}

}  // namespace tallowmere::catalog
