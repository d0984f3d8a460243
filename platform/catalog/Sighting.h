// How sure the catalog is of a place, as types:
//
//   type         what is known
//   ---------------------------------------------------------------------------------------------
//   a lead       a path that somebody remembers or found in passing: just a std::string
//   Sighting     the item was at that path, at one moment
//   HeldFolder   the folder is open, so that device, number and mount stay its own; its volume
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

// The node id of an item of a volume, seen at its canonical path. Where numbers do not tell items
// apart, one that shares the root folder's without being the root gets kNoVolumeID.
std::uint32_t IDOf(const volumes::Volume& volume, const Sighting& seen);

// Whether two sightings are of one item.
bool AreSame(const volumes::Volume& volume, const Sighting& first, const Sighting& second);

// The item of a sighting, just seen at a spot, with what proves its identity from now on: birth,
// the handle, or on a volume whose numbers do not tell items apart its place, as a digest of the
// canonical path where else is the handle. Such a reference does not survive a rename.
kernel::Item Proved(const Sighting& seen, const volumes::Volume& volume, const kernel::Spot& spot);
bool IsProvedByPlace(const kernel::Item& item);

// Whether two references are to one item: by number, and where both are proved by it by their
// place.
bool AreToSameItem(const kernel::Item& first, const kernel::Item& second);

// The digest of an item that is proved by its place.
std::uint64_t PlaceDigest(const kernel::Item& item);

// Whether an item seen just now at a spot is that of a reference. REQUIRES: its path is canonical.
bool IsItemOf(const kernel::Item& reference, const Sighting& seen, const kernel::Spot& spot);

// Whether the item of a reference is at a spot now. REQUIRES: `path` is the canonical path of the
// spot.
bool IsItemAt(const kernel::Item& reference, const kernel::Spot& spot, std::string_view path);

}  // namespace tallowmere::catalog
