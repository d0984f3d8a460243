#include "catalog/Catalog.h"

#include <algorithm>

namespace tallowmere::catalog {
namespace {

// In bytes: some five thousand places with paths of usual length.
constexpr std::size_t kPlacesLimit = 1 << 20;
// Likewise: some fifteen thousand entries with names of usual length.
constexpr std::size_t kListingsLimit = 1 << 20;

// Mark the spaces of items without a node id, on top of their device number, which has fewer bits.
constexpr std::uint64_t kByInode = std::uint64_t{1} << 63;
constexpr std::uint64_t kByPlace = std::uint64_t{1} << 62;

// On a volume, items are remembered by node id, so that records find them too.
PlaceKey KeyOf(const kernel::Item& item, const volumes::Volume* volume) {
  if (IsProvedByPlace(item)) return {kByPlace | item.device, PlaceDigest(item)};
  const bool hasID =
      volume != nullptr && volume->NumbersIdentifyItems() && !volume->NeedsHandleForID(item);
  if (!hasID) return {kByInode | item.device, item.inode};
  return {volume->Root().device, volume->IDOf(item)};
}

// Whether an index made for one listing of a volume fits another: it depends on where the volume is
// mounted and on what is hidden.
bool IsSeenAlike(const volumes::ListedVolume& first, const volumes::ListedVolume& second) {
  return first.MountPoints() == second.MountPoints() && first.Covers() == second.Covers();
}

}  // namespace

Catalog::Catalog() : mPlaces(kPlacesLimit), mListings(kListingsLimit) {}

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
  return volume.NumbersIdentifyItems() ? mPlaces.Recall({volume.Root().device, id}) : nullptr;
}

std::optional<std::string> Catalog::SearchVolume(const volumes::VolumePointer& volume,
                                                 const SearchedItem& item,
                                                 const std::string& start) {
  return IndexOf(volume).Find(item, start, *mTable.AsLastRead());
}

// Creating an index drops those of volumes that are gone.
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
