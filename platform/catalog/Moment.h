// One question, or all questions of one request, as one moment: what was looked at once serves all
// of it, and the answer is one that a single walk of the kernel could have given meanwhile.
//
//   fact                                           serves
//   ---------------------------------------------------------------------------------------------
//   held: device, number and mount of a folder     as long as the folder is held
//   timed: a path led to that folder; that         with the held folder as the pivot; a path in an
//   folder had that item under that name           answer takes one more look along the whole path
//   that nothing was there                         never: it is looked again
//
// The table of mounts is polled after the first folder is held: the kernel does not give a mount id
// away while something on that mount is held, but at once afterwards. A mount that is met later is
// looked up by a poll of its own, made after its folder is held, or after what is not held was
// seen.
//
// A pass over a volume ends a moment, since held folders keep umount(2) from working, and begins
// another: nothing is carried over.
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

// An item seen under a name in a held folder. Copies share it.
class Look {
 public:
  // REQUIRES: the path of `seen` is that of the folder and one component more.
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

// A folder as a climb comes to it.
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

  // Lets go of everything, as a new moment begins.
  void Restart();

  // --- Volumes --------------------------------------------------------------------------------

  // The volumes as they were at some time in this moment, never null. A later question may have
  // others.
  volumes::VolumesPointer Volumes();

  // The volumes as last read, a lead: what they say is verified by a folder held on them.
  volumes::VolumesPointer LastVolumes();

  // The volume with a number, its root folder seen. 0 is the volume of "/". kNoVolume when none has
  // the number; the kernel's error where the root folder cannot be seen.
  kernel::Result<volumes::VolumePointer> VolumeWithNumber(volumes::VolumeNumber number);

  // The volume of an item seen just now; kNoVolume for one of a kernel interface. REQUIRES: the
  // path is canonical, or the kernel told the mount.
  kernel::Result<volumes::VolumePointer> VolumeOf(const Sighting& seen);

  // Whether an item seen just now is on that volume, whatever the table says of it by now.
  bool IsOnVolume(const volumes::Volume& volume, const Sighting& seen);

  // Makes the next question read the table of mounts anew.
  void InvalidateVolumes();

  // --- Folders --------------------------------------------------------------------------------

  // The folder at a path without links on the way. ELOOP or ENOTDIR where there is a link, or no
  // folder; kNoVolume.
  kernel::Result<HeldFolder> HoldFolder(const std::string& path);

  // The folder in which the kernel finds the last component of an absolute path, links on the way
  // followed, at its own canonical path. ENOENT for "/".
  kernel::Result<HeldFolder> HoldHolderOf(const std::string& path);

  // The folder of a look. ENOTDIR for anything else.
  kernel::Result<HeldFolder> HoldFolderOf(const Look& folder);

  // The folder to which a link leads, at its own canonical path.
  kernel::Result<HeldFolder> HoldTargetOf(const Look& link);

  // A folder held in this moment; null when there is none.
  const HeldFolder* HeldWithID(volumes::VolumeNumber volume, std::uint32_t id) const;
  const HeldFolder* HeldFor(const kernel::Item& reference) const;

  // --- Items ----------------------------------------------------------------------------------

  // The item with a name in a held folder, its handle read where its id follows from it.
  // ENAMETOOLONG where no path could tell where it is.
  kernel::Result<Look> LookUp(const HeldFolder& folder, std::string_view name);

  // Holds the item at a path, links on the way followed, at its canonical path; for as long as the
  // caller keeps it.
  struct HeldItem {
    std::string path;
    kernel::Descriptor descriptor;
  };
  kernel::Result<HeldItem> HoldItem(const std::string& path);

  // The item at a path, links on the way followed, at its canonical path.
  kernel::Result<Sighting> See(const std::string& path);

  // The look of this moment that saw the item of a reference, by the name for which a reference was
  // made last; null when there is none.
  const Look* LookFor(const kernel::Item& reference) const;

  // --- Climbs ---------------------------------------------------------------------------------

  // Where a climb goes on.
  struct Climb {
    HeldFolder folder;                 // where it began; while nothing is left, the next one itself
    std::uint32_t id;                  // of the next folder
    std::vector<ClimbedFolder> along;  // what the path tells of the folders left, the next one last
  };
  std::optional<Climb>& OpenClimb() { return mClimb; }

  // Whether the table of mounts is still the one that was known before the first folder was held.
  bool IsTableAsBefore() const { return !mIsTableNew; }

  // --- References -----------------------------------------------------------------------------

  // The item of a look, or a held folder, with its proof: what is known of it when the moment is
  // over.
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

  // A fact of this moment and the reference that was made of its item, if any was.
  template <class Fact>
  struct Noted {
    Fact fact;
    std::optional<kernel::Item> reference;
  };

  Catalog& mCatalog;
  volumes::VolumesPointer mVolumes;      // null until polled
  std::vector<Noted<HeldFolder>> mHeld;  // few: they keep volumes from being unmounted
  std::vector<Noted<Look>> mLooks;  // those with references first, the last one made before all
  std::optional<Climb> mClimb;
  bool mIsTableNew = false;
};

}  // namespace tallowmere::catalog
