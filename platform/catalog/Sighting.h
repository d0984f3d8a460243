// How sure the catalog is of a place, as types:
//
// | Type       | What is known                                                                     |
// |------------|-----------------------------------------------------------------------------------|
// | a lead     | a path that somebody remembers or found in passing: just a std::string            |
// | Sighting   | the item was at that path, at one moment                                          |
// | HeldFolder | the folder is open, so that device, number and mount stay its own, and its volume |
// |            | is known                                                                          |
//
// That a path led to a folder, or that a folder had an item under a name, is true of one moment
// only. Two such facts are put together only when the held folder or the item is the pivot.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include "kernel/Descriptor.h"
#include "kernel/Item.h"
#include "volumes/Volume.h"

namespace tallowmere::catalog {

// An item and its absolute path, the item itself not followed when it is a link. Where nothing else
// is said the path is canonical, as it was when the item was seen there. The item need not have its
// handle.
struct Sighting {
  std::string path;
  kernel::Item item;
};

// A folder on a volume, held for its path alone (O_PATH): names are looked up in this very folder,
// whatever is at its place by then. Copies share the descriptor.
class HeldFolder {
 public:
  // REQUIRES: `place` is the folder's, and `volume` the one that its mount belongs to.
  HeldFolder(Sighting place, kernel::Descriptor descriptor, volumes::VolumePointer volume);

  const Sighting& Place() const { return mState->place; }
  const std::string& Path() const { return mState->place.path; }
  const kernel::Item& Item() const { return mState->place.item; }
  const volumes::VolumePointer& Volume() const { return mState->volume; }

  // The node id. That of a folder that shares the root's number without being the root, where
  // numbers do not tell items apart, leads nowhere.
  std::uint32_t ID() const { return mState->id; }

  bool IsRoot() const { return mState->isRoot; }

  // Where to look for a name in the folder, and for the folder itself.
  kernel::Spot SpotOf(const char* name) const { return {mState->descriptor.Get(), name}; }
  kernel::Spot OwnSpot() const { return kernel::AtOpen(mState->descriptor.Get()); }

 private:
  struct State {
    Sighting place;
    kernel::Descriptor descriptor;
    volumes::VolumePointer volume;
    bool isRoot;
    std::uint32_t id;
  };
  std::shared_ptr<const State> mState;
};

// Whether two sightings are of one item.
bool AreSame(const volumes::Volume& volume, const Sighting& first, const Sighting& second);

// Makes the place a part of the proof of identity, for an item of a volume whose numbers do not tell
// items apart: the handle becomes a digest of the canonical path. Such a reference does not survive
// a rename.
void ProveByPlace(kernel::Item& item, std::string_view path);
bool IsProvedByPlace(const kernel::Item& item);

// The digest of an item that is proved by its place.
std::uint64_t PlaceDigest(const kernel::Item& item);

// Whether this very item is at a spot now. REQUIRES: `path` is the canonical path of the spot.
bool IsItemAt(const kernel::Item& item, const kernel::Spot& spot, std::string_view path);

}  // namespace tallowmere::catalog
