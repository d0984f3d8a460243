// The known folders of one volume, each by its name in its parent or by a whole path. Pure; 40
// bytes plus the name each.
//
//   numbers             a folder is known by     another folder at its place
//   ---------------------------------------------------------------------------------------------
//   identify items      its numbers; it moves    is a different folder
//   do not              its parent and name      counts as the same one, to be read again
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "kernel/Clock.h"
#include "kernel/Item.h"

namespace tallowmere::catalog {

// The index of a folder in its tree.
using FolderNumber = std::uint32_t;
inline constexpr FolderNumber kNoParent = 0xFFFFFFFF;

// A name in a known folder; without a parent the name is a whole path.
struct FolderPlace {
  FolderNumber parent;
  std::string name;
};

// The number of a walk over the volume, from 1.
using WalkNumber = std::uint32_t;
inline constexpr WalkNumber kNoWalk = 0;

class FolderTree {
 public:
  enum class Identity { kByNumbers, kByPlace };

  struct Folder {
    std::uint64_t inode;
    kernel::Nanoseconds change;  // its change time when it was last looked at
    std::uint32_t id;            // 0: it is gone
    FolderNumber parent;
    std::uint32_t name;  // its offset in the names
    std::uint32_t region : 31;
    std::uint32_t isRead : 1;  // its content is known until its change time moves
    WalkNumber checked;        // the last walk that saw it in its present state
    WalkNumber read;           // the walk that first read it in its present state
  };
  static_assert(sizeof(Folder) == 40);

  explicit FolderTree(Identity identity) : mIdentity(identity) {}

  // All folder numbers are below this. Folders that are gone keep theirs.
  FolderNumber Count() const { return static_cast<FolderNumber>(mFolders.size()); }

  Folder& operator[](FolderNumber index) { return mFolders[index]; }
  const Folder& operator[](FolderNumber index) const { return mFolders[index]; }

  // A folder of the same mount and device, as it was learned, with its handle if it had one.
  const kernel::Item& RegionOf(FolderNumber index) const;

  // Whether an item has the same mount, device and inode number as a known folder.
  bool IsSame(FolderNumber index, const kernel::Item& item) const;

  // Records the folder found at a place. A folder known elsewhere has moved there.
  FolderNumber Learn(const FolderPlace& place, const kernel::Item& item, std::uint32_t id);

  // Marks a folder as gone. Folders below it stay known.
  void Forget(FolderNumber index);

  // The known folders with an id. REQUIRES: Identity::kByNumbers.
  std::vector<FolderNumber> WithID(std::uint32_t id) const;

  std::string_view NameOf(FolderNumber index) const { return mNames.data() + mFolders[index].name; }

  // Empty for folders that seem to contain each other: they were exchanged, and only half of that
  // was noticed.
  std::string PathOf(FolderNumber index) const;
  std::string PathOf(const FolderPlace& place) const;

  // Whether most name bytes belong to folders that were renamed or are gone.
  bool IsMostlyWaste() const { return mUnusedNames > mNames.size() / 2; }

  // Forgets everything and releases the memory.
  void Clear();

  // Bytes in use.
  std::size_t Size() const;

 private:
  FolderNumber Find(const FolderPlace& place, const kernel::Item& item, std::uint32_t id) const;
  bool IsIt(const Folder& folder, const FolderPlace& place, const kernel::Item& item,
            std::uint32_t id) const;
  bool IsKnownAt(FolderNumber index, const FolderPlace& place) const;
  void Replace(Folder& folder, const kernel::Item& item, std::uint32_t id);
  void Move(FolderNumber index, const FolderPlace& place);
  void NoteRegion(FolderNumber index, const kernel::Item& item);
  std::uint32_t HashOf(const Folder& folder) const;
  void Insert(FolderNumber index);
  void Put(FolderNumber index);

  static constexpr std::uint32_t kMostRegions = 0x7FFFFFFF;

  Identity mIdentity;
  std::vector<Folder> mFolders;
  std::vector<FolderNumber> mTable;    // open addressing
  std::string mNames;                  // each followed by a NUL
  std::vector<kernel::Item> mRegions;  // few
  std::size_t mUnusedNames = 0;        // bytes in mNames
};

// Reserves room, growing by a quarter at a time: containers double otherwise, which is much for one
// that holds every folder.
template <class Container>
void ReserveFor(Container& container, std::size_t more) {
  const std::size_t size = container.size() + more;
  if (size > container.capacity()) container.reserve(size + size / 4);
}

}  // namespace tallowmere::catalog
