// The observations behind one answer, shared by all host calls of one request. The answer is one
// that a single walk of the kernel could have given during the moment.
//
//   fact                                             may be reused
//   ---------------------------------------------------------------------------------------------
//   device, number and mount of a held folder        as long as the folder is held
//   a path led to a folder; a folder had an item     with other facts about that held folder; a
//   under a name                                     path in an answer is walked once more, whole
//   nothing was there                                never
//
// The mount table is polled after the first folder is held: the kernel does not reuse a mount id
// while something on that mount is held, but may at once afterwards. A mount met later is looked up
// after a poll of its own, which follows the holding of its folder, or the look at an item that is
// not held.
//
// Held folders keep umount(2) from working, so a pass over a volume restarts the moment: nothing is
// carried over.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "catalog/Catalog.h"
#include "catalog/Sighting.h"
#include "kernel/Result.h"
#include "volumes/Volumes.h"

namespace tallowmere::catalog {

// An item seen under a name in a held folder. Copies share their state.
class Look {
 public:
  // REQUIRES: the path of `seen` is the folder's path plus one component.
  Look(HeldFolder folder, Sighting seen);

  const HeldFolder& Folder() const { return mState->folder; }
  const Sighting& Seen() const { return mState->seen; }
  const std::string& Path() const { return mState->seen.path; }
  const kernel::Item& Item() const { return mState->seen.item; }

  // The last component of the path.
  const char* Name() const { return Path().c_str() + mState->nameAt; }

  // Where it was seen: the name in the folder.
  kernel::Spot Spot() const { return Folder().SpotOf(Name()); }

 private:
  struct State {
    HeldFolder folder;
    Sighting seen;
    std::size_t nameAt;
  };
  std::shared_ptr<const State> mState;
};

// One step of a climb.
struct ClimbedFolder {
  std::string name;      // in HFS form, at most 255 bytes
  std::uint32_t parent;  // id of the folder that holds it; kParentOfRootID at the top
};

class Moment {
 public:
  // REQUIRES: `catalog` outlives the moment.
  explicit Moment(Catalog& catalog) : mCatalog(catalog) {}
  Moment(const Moment&) = delete;
  Moment& operator=(const Moment&) = delete;

  Catalog& Knowledge() { return mCatalog; }

  // Releases everything and begins a new moment.
  void Restart();

  // --- Volumes --------------------------------------------------------------------------------

  // The volumes as they were at some time in this moment, never null. A later call may return
  // others.
  volumes::VolumesPointer Volumes();

  // The volumes as last read, as a lead: holding a folder on one verifies it.
  volumes::VolumesPointer LastVolumes();

  // The volume with a number, its root folder seen. 0 is the volume of "/". Returns kNoVolume when
  // none has the number, and the kernel's error when the root folder cannot be seen.
  kernel::Result<volumes::VolumePointer> VolumeWithNumber(volumes::VolumeNumber number);

  // The volume of an item seen just now. Returns kNoVolume for an item of a kernel interface.
  // REQUIRES: the path is canonical, or the kernel reported the mount.
  kernel::Result<volumes::VolumePointer> VolumeOf(const Sighting& seen);

  // Whether an item seen just now is on a volume, even if that has since left the mount table.
  bool IsOnVolume(const volumes::Volume& volume, const Sighting& seen);

  // Makes the next call that needs the mount table read it anew.
  void InvalidateVolumes();

  // --- Folders --------------------------------------------------------------------------------

  // The folder at a path without links. Returns ELOOP or ENOTDIR when there is a link or no folder,
  // and kNoVolume.
  kernel::Result<HeldFolder> HoldFolder(const std::string& path);

  // The folder in which the kernel looks up the last component of an absolute path, following links
  // on the way. It has its own canonical path. Returns ENOENT for "/".
  kernel::Result<HeldFolder> HoldParentOf(const std::string& path);

  // The folder that a look saw. Returns ENOTDIR for anything else.
  kernel::Result<HeldFolder> HoldFolderOf(const Look& folder);

  // The folder to which a link leads, with its own canonical path.
  kernel::Result<HeldFolder> HoldTargetOf(const Look& link);

  // A folder held in this moment, or null.
  const HeldFolder* HeldWithID(volumes::VolumeNumber volume, std::uint32_t id) const;
  const HeldFolder* HeldFor(const kernel::Item& reference) const;

  // --- Items ----------------------------------------------------------------------------------

  // The item with a name in a held folder, with its handle if its id depends on it. Returns
  // ENAMETOOLONG when its path would be too long.
  kernel::Result<Look> LookUp(const HeldFolder& folder, std::string_view name);

  // Holds the item at a path, following links on the way, for as long as the caller keeps it.
  // `path` is canonical.
  struct HeldItem {
    std::string path;
    kernel::Descriptor descriptor;
  };
  kernel::Result<HeldItem> HoldItem(const std::string& path);

  // The item at a path, following links on the way, with its canonical path.
  kernel::Result<Sighting> See(const std::string& path);

  // A look of this moment that saw a reference's item, or null. Of several, by different names, the
  // one last proved.
  const Look* LookFor(const kernel::Item& reference) const;

  // --- Climbs ---------------------------------------------------------------------------------

  // Where a climb continues.
  struct Climb {
    HeldFolder folder;                 // where it began; if `along` is empty, the next folder
    std::uint32_t id;                  // of the next folder
    std::vector<ClimbedFolder> along;  // the steps left, by the path; the next one last
  };
  std::optional<Climb>& OpenClimb() { return mClimb; }

  // Whether the mount table is still the one known before the first folder was held.
  bool IsTableAsBefore() const { return !mIsTableNew; }

  // --- References -----------------------------------------------------------------------------

  // The item of a look, or a held folder, with what proves its identity after the moment.
  kernel::Item Prove(const Look& look);
  kernel::Item Prove(const HeldFolder& folder);

 private:
  void Poll();
  kernel::Result<volumes::VolumePointer> FindVolume(const Sighting& seen);
  bool IsMountHeld(int mount) const;
  template <class Call>
  kernel::Result<kernel::Descriptor> Open(const Call& call);
  kernel::Result<HeldFolder> Keep(std::string path, kernel::Descriptor descriptor);
  const HeldFolder* HeldAt(const std::string& path) const;
  kernel::Result<HeldFolder> HoldAtRealPath(kernel::Result<kernel::Descriptor> found,
                                            const std::string& path);

  // A fact of this moment, with the reference made to its item, if any.
  template <class Fact>
  struct Noted {
    Fact fact;
    std::optional<kernel::Item> reference;
  };

  Catalog& mCatalog;
  volumes::VolumesPointer mVolumes;      // null until polled
  std::vector<Noted<HeldFolder>> mHeld;  // few, as each keeps its volume from being unmounted
  std::vector<Noted<Look>> mLooks;
  std::optional<Climb> mClimb;
  bool mIsTableNew = false;
};

}  // namespace tallowmere::catalog
