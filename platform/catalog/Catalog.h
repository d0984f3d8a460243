// What a process knows of its volumes from one question to the next: the table of mounts, where
// items were seen, and what passes over volumes have learned. All of it is verified before it
// counts, so that it can be lost at any time.
//
// One thread. Everything may throw std::bad_alloc.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "catalog/FolderIndex.h"
#include "catalog/PlaceMemory.h"
#include "catalog/Sighting.h"
#include "volumes/Volumes.h"

namespace tallowmere::catalog {

class Catalog {
 public:
  Catalog();

  volumes::VolumeTable& Table() { return mTable; }

  // Remembers where an item was seen. `volume` is null for an item that is on none.
  void Remember(const kernel::Item& item, std::string_view path, const volumes::Volume* volume);

  // Remembers which folder held an item at its place.
  void RememberParent(const Sighting& seen, const volumes::Volume& volume, std::uint32_t parent);

  // Leads: where an item was last seen, null when that is not remembered. Valid until the next
  // Remember.
  const PlaceMemory::Place* LastPlaceOf(const kernel::Item& item, const volumes::Volume* volume);
  const PlaceMemory::Place* LastPlaceOf(std::uint32_t id, const volumes::Volume& volume);

  // Where anything was last seen; empty when nothing is remembered.
  std::string_view LatestPlace() const { return mPlaces.Latest(); }

  // A lead: whether what was last meant to be a folder was one. Most programs ask about many files
  // or about many folders.
  bool WasFolderMeantRightly() const { return mWasFolderMeantRightly; }
  void NoteFolderMeant(bool rightly) { mWasFolderMeantRightly = rightly; }

  // A lead from a pass over a volume: the folder, or the item, with an id, or one very item.
  // Folders near `start` are read first.
  std::optional<std::string> SearchVolume(const volumes::VolumePointer& volume,
                                          const SearchedItem& item, const std::string& start);

 private:
  FolderIndex& IndexOf(const volumes::VolumePointer& volume);

  volumes::VolumeTable mTable;
  PlaceMemory mPlaces;
  std::vector<FolderIndex> mIndexes;  // by volume
  bool mWasFolderMeantRightly = true;
};

}  // namespace tallowmere::catalog
