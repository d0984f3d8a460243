// One mounted volume: its number, its name, its places, and its root folder, by which its items get
// their node ids.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "kernel/FileSystemKinds.h"
#include "kernel/Item.h"
#include "kernel/Result.h"
#include "names/NodeIDs.h"
#include "volumes/MountInfo.h"

namespace tallowmere::volumes {

// Below 0, unique while mounted, the same in every process: minus the mount id of the volume's
// place.
using VolumeNumber = std::int16_t;

class ListedVolume;

// A volume whose root folder was seen: what its items' ids follow from. It belongs to a
// ListedVolume and lives as long.
class Volume {
 public:
  // REQUIRES: `root` was found at the mount point of `listed`.
  Volume(const ListedVolume& listed, const kernel::Item& root, const kernel::FileSystemKind& kind);

  const ListedVolume& Listed() const { return mListed; }
  VolumeNumber Number() const;
  const std::string& MountPoint() const;

  // The root folder as it was when it was first seen; its mount is the volume's place.
  const kernel::Item& Root() const { return mRoot; }

  const kernel::FileSystemKind& Kind() const { return mKind; }

  // Whether device and inode number are one item's while the volume is mounted. Where they are not,
  // only the place tells two items apart.
  bool NumbersTellItemsApart() const { return mKind.numbersTellItemsApart; }

  // Whether an item read without its handle must get it before IDOf: the id follows from the
  // subvolume, which the handle tells.
  bool NeedsHandleForID(const kernel::Item& item) const;

  // The node id of an item of the volume. REQUIRES: it has its handle where it needs it.
  std::uint32_t IDOf(const kernel::Item& item) const;

  // The same for an entry of a folder, by its inode number and the folder that holds it, which is
  // on this volume. Not for what is mounted at the entry, nor for another subvolume at it.
  std::uint32_t IDOfEntry(std::uint64_t inode, const kernel::Item& folder) const;

  // What ids are computed with.
  const names::NodeIDRule& IDRule() const { return mRule; }

  // The highest inode number that an item can have now: a volume may grow.
  std::uint64_t HighestInode() const;

  // Whether one item at most can have the id, so that whoever finds it need not look any further.
  bool IsCertain(std::uint32_t id) const;

  // Whether an item at a path is the root folder. REQUIRES: the path is canonical.
  bool IsRoot(const kernel::Item& item, const std::string& path) const;

 private:
  const ListedVolume& mListed;
  kernel::Item mRoot;
  const kernel::FileSystemKind& mKind;
  names::NodeIDRule mRule;
};

// It stays valid for whoever holds it.
using VolumePointer = std::shared_ptr<const Volume>;

// A volume as the table of mounts lists it. Nothing is looked at until it is asked for, since its
// server may be dead.
class ListedVolume : public std::enable_shared_from_this<ListedVolume> {
 public:
  struct Place {
    Mount mount;
    bool mayBeFile;  // a file can be mounted by itself
  };

  // `places` are the reachable mounts of one file system, the volume's place first; `covers` are
  // the mount points of what is mounted on those.
  ListedVolume(VolumeNumber number, std::vector<Place> places, std::vector<std::string> covers);

  VolumeNumber Number() const { return mNumber; }

  // Where the root folder is, as this process sees it.
  const std::string& MountPoint() const { return mPlaces.front().mount.mountPoint; }

  // Everywhere that a folder of the volume is mounted; MountPoint() is the first. A mount that can
  // be a file's is looked at once.
  const std::vector<std::string>& MountPoints() const;

  // Where something is mounted on the volume, so that what lies below is hidden there.
  const std::vector<std::string>& Covers() const { return mCovers; }

  // Whether that is the id of one of its mounts, of a file as well.
  bool IsMountedAs(int mount) const;

  // Everywhere that the volume shows the item with that path on one of its mounts, the first mount
  // first, whatever else is mounted there. The path alone for another mount.
  std::vector<std::string> PathsOf(const std::string& path, int mount) const;

  // In HFS form, 1 to 63 bytes: the last component of the mount point; for "/" the label of the
  // file system, else "Root", also where the label may not be read. Two volumes can have the same
  // name. An error where the process lacks descriptors or memory to ask.
  kernel::Result<std::string_view> Name() const;

  // The volume with its root folder, which is looked at when first asked for. kMoved when something
  // else is found at the mount point; else the kernel's error.
  kernel::Result<VolumePointer> Enter() const;
  static constexpr kernel::Error kMoved{-4};

 private:
  const Place* PlaceWithID(int mount) const;

  VolumeNumber mNumber;
  std::vector<Place> mPlaces;
  std::vector<std::string> mCovers;
  // On demand.
  mutable std::vector<std::string> mMountPoints;
  mutable std::string mName;
  mutable bool mIsNameKnown = false;
  mutable std::optional<Volume> mEntered;
};

using ListedVolumePointer = std::shared_ptr<const ListedVolume>;

}  // namespace tallowmere::volumes
