// One mounted volume: its number, its name, its places, and its root folder, which the node ids of
// its items depend on.
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

// Negative, unique while mounted, and the same in every process: minus the mount id of the volume's
// place.
using VolumeNumber = std::int16_t;

class ListedVolume;

// A volume whose root folder has been read; the ids of its items depend on that. It belongs to a
// ListedVolume and lives as long as that does.
class Volume {
 public:
  // REQUIRES: `root` was found at the mount point of `listed`.
  Volume(const ListedVolume& listed, const kernel::Item& root, const kernel::FileSystemKind& kind);

  const ListedVolume& Listed() const { return mListed; }
  VolumeNumber Number() const;
  const std::string& MountPoint() const;

  // The root folder as first read; its mount is the volume's place.
  const kernel::Item& Root() const { return mRoot; }

  const kernel::FileSystemKind& Kind() const { return mKind; }

  // Whether device and inode number identify one item while the volume is mounted. Where they do
  // not, only their places tell two items apart.
  bool NumbersIdentifyItems() const { return mKind.numbersTellItemsApart; }

  // Whether an item read without its handle needs it for IDOf, because the id depends on the
  // subvolume, which only the handle tells.
  bool NeedsHandleForID(const kernel::Item& item) const;

  // The node id of an item of the volume. REQUIRES: the item has its handle if NeedsHandleForID.
  std::uint32_t IDOf(const kernel::Item& item) const;

  // The same for an entry of a folder, from its inode number and the folder that holds it.
  // REQUIRES: the folder is on this volume; the entry is neither a mount point nor another
  // subvolume.
  std::uint32_t IDOfEntry(std::uint64_t inode, const kernel::Item& folder) const;

  // What ids are computed from.
  const names::NodeIDRule& IDRule() const { return mRule; }

  // The highest inode number that an item can have now; a volume may grow.
  std::uint64_t HighestInode() const;

  // Whether at most one item can have the id, so that a search can stop at the first one found.
  bool IsCertain(std::uint32_t id) const;

  // Whether the item at a path is the root folder. REQUIRES: the path is canonical.
  bool IsRoot(const kernel::Item& item, const std::string& path) const;

 private:
  const ListedVolume& mListed;
  kernel::Item mRoot;
  const kernel::FileSystemKind& mKind;
  names::NodeIDRule mRule;
};

// Stays valid for whoever holds it.
using VolumePointer = std::shared_ptr<const Volume>;

// A volume as the mount table lists it. Nothing is read before it is asked for, since the volume's
// server may be dead.
class ListedVolume : public std::enable_shared_from_this<ListedVolume> {
 public:
  struct Place {
    Mount mount;
    bool mayBeFile;  // a single file can be mounted
  };

  // `places` are the reachable mounts of one file system, the volume's place first; `covers` are
  // the mount points of all that is mounted on them.
  ListedVolume(VolumeNumber number, std::vector<Place> places, std::vector<std::string> covers);

  VolumeNumber Number() const { return mNumber; }

  // The path of the root folder, as this process sees it.
  const std::string& MountPoint() const { return mPlaces.front().mount.mountPoint; }

  // Every path at which a folder of the volume is mounted, MountPoint() first. A mount that may be
  // a file's is examined once.
  const std::vector<std::string>& MountPoints() const;

  // The mount points on the volume; what the volume has below them is hidden.
  const std::vector<std::string>& Covers() const { return mCovers; }

  // Whether this is the id of one of the volume's mounts, including those of single files.
  bool IsMountedAs(int mount) const;

  // Every path at which the volume shows the item that has the given path on one of its mounts, in
  // the order of the mounts, whatever else is mounted there. Just the path itself for a mount that
  // is not the volume's.
  std::vector<std::string> PathsOf(const std::string& path, int mount) const;

  // The name in HFS form, 1 to 63 bytes: the last component of the mount point. For "/" it is the
  // label of the file system, or "Root" when there is none or it may not be read. Not unique.
  // Returns an error when the process lacks descriptors or memory to find out.
  kernel::Result<std::string_view> Name() const;

  // The name without that limit, in UTF-16, of characters that Mac Roman lacks as well; but the
  // label of "/" as Name() has it.
  kernel::Result<std::u16string> FullName() const;

  // The type in the mount table: "ext4", "vfat", …
  const std::string& MountedType() const { return mPlaces.front().mount.type; }

  // The volume with its root folder, which is read on first use. Returns kMoved when something else
  // is at the mount point, otherwise the kernel's error.
  kernel::Result<VolumePointer> Enter() const;
  static constexpr kernel::Error kMoved{-4};

 private:
  const Place* PlaceWithID(int mount) const;

  VolumeNumber mNumber;
  std::vector<Place> mPlaces;
  std::vector<std::string> mCovers;
  // Filled in on demand.
  mutable std::vector<std::string> mMountPoints;
  mutable std::string mName;
  mutable bool mIsNameKnown = false;
  mutable std::optional<Volume> mEntered;
};

using ListedVolumePointer = std::shared_ptr<const ListedVolume>;

}  // namespace tallowmere::volumes
