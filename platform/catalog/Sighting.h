// How certain the catalog is of an item's place, as types:
//
//   type         what is known
//   ---------------------------------------------------------------------------------------------
//   a lead       an unverified path, remembered or found in passing: a plain std::string
//   Sighting     the item was at that path at one moment
//   HeldFolder   the folder is open, so its device, number and mount cannot be reused; its volume
//
// That a path led to a folder, or that a folder had an item under a name, holds for one moment
// only. Two such facts may be combined only if both are about the same held folder or item.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include "kernel/Descriptor.h"
#include "kernel/Item.h"
#include "volumes/Volume.h"

namespace tallowmere::catalog {

// An item and its absolute path; if the item is a link, it is not followed. Unless said otherwise,
// the path was canonical when the item was seen. The item need not have its handle.
struct Sighting {
  std::string path;
  kernel::Item item;
};

// A folder on a volume, held by an O_PATH descriptor: names are looked up in this very folder even
// after it has moved. Copies share the descriptor.
class HeldFolder {
 public:
  // REQUIRES: `place` is the folder's, and its mount belongs to `volume`.
  HeldFolder(Sighting place, kernel::Descriptor descriptor, volumes::VolumePointer volume);

  const Sighting& Place() const { return mState->place; }
  const std::string& Path() const { return mState->place.path; }
  const kernel::Item& Item() const { return mState->place.item; }
  const volumes::VolumePointer& Volume() const { return mState->volume; }

  std::uint32_t ID() const { return mState->id; }

  bool IsRoot() const { return mState->isRoot; }

  // The spots of a name in the folder, and of the folder itself.
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

// The node id of an item of a volume. Where numbers do not identify items, an item with the root
// folder's number that is not the root gets kNoVolumeID. REQUIRES: the path of `seen` is canonical.
std::uint32_t IDOf(const volumes::Volume& volume, const Sighting& seen);

// Whether two sightings are of the same item.
bool AreSame(const volumes::Volume& volume, const Sighting& first, const Sighting& second);

// The item of a sighting just made at a spot, with what proves its identity from now on: its birth,
// its handle, or, on a volume whose numbers do not identify items, its place: a digest of the
// canonical path, stored instead of the handle. A reference proved by place does not survive a
// rename.
kernel::Item Proved(const Sighting& seen, const volumes::Volume& volume, const kernel::Spot& spot);
bool IsProvedByPlace(const kernel::Item& item);

// Whether two references refer to the same item: by number, and by place if both are proved by
// place.
bool ReferToSameItem(const kernel::Item& first, const kernel::Item& second);

// The digest in an item that is proved by its place.
std::uint64_t PlaceDigest(const kernel::Item& item);

// Whether an item seen just now at a spot is a reference's. REQUIRES: its path is canonical.
bool IsItemOf(const kernel::Item& reference, const Sighting& seen, const kernel::Spot& spot);

// Whether a reference's item is at a spot now. REQUIRES: `path` is the canonical path of the spot.
bool IsItemAt(const kernel::Item& reference, const kernel::Spot& spot, std::string_view path);

}  // namespace tallowmere::catalog
