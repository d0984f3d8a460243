// What a process remembers between questions: the mount table, where items were last seen, and what
// passes over volumes have learned. All of it is verified before use, so any of it may be dropped
// at any time.
//
// One thread. Everything may throw std::bad_alloc.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "catalog/FolderIndex.h"
#include "catalog/FolderListings.h"
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

  // Leads: where an item was last seen, or null when that is not remembered. Valid until the next
  // Remember.
  const PlaceMemory::Place* LastPlaceOf(const kernel::Item& item, const volumes::Volume* volume);
  const PlaceMemory::Place* LastPlaceOf(std::uint32_t id, const volumes::Volume& volume);

  // The path most recently remembered or recalled; empty when nothing is remembered.
  std::string_view LatestPlace() const { return mPlaces.Latest(); }

  // A lead: whether the last path with a folder mark was indeed a folder's. Programs tend to ask
  // about many files in a row, or about many folders.
  bool WasFolderMarkRight() const { return mWasFolderMarkRight; }
  void NoteFolderMark(bool isRight) { mWasFolderMarkRight = isRight; }

  // Searches a volume for the item that `item` describes and returns its path as a lead. Reads
  // folders near `start` first.
  std::optional<std::string> SearchVolume(const volumes::VolumePointer& volume,
                                          const SearchedItem& item, const std::string& start);

  FolderListings& Listings() { return mListings; }

 private:
  FolderIndex& IndexOf(const volumes::VolumePointer& volume);

  volumes::VolumeTable mTable;
  PlaceMemory mPlaces;
  FolderListings mListings;
  std::vector<FolderIndex> mIndexes;  // by volume
  bool mWasFolderMarkRight = true;
};

}  // namespace tallowmere::catalog
