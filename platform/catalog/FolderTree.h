// The folders of one volume, as far as they are known: each under its parent, or at a whole path.
// Pure, 40 bytes and the name for each.
//
// | Numbers               | A folder is known by    | What comes to its place             |
// |-----------------------|-------------------------|-------------------------------------|
// | tell items apart      | numbers, and can move   | is another folder                   |
// | do not tell them      | its parent and its name | is the same one, to be read again   |
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "kernel/Clock.h"
#include "kernel/Item.h"

namespace tallowmere::catalog {

// Which folder of a tree.
using FolderNumber = std::uint32_t;
inline constexpr FolderNumber kNoParent = 0xFFFFFFFF;

// A name in a known folder; without a parent the name is a whole path.
struct FolderPlace {
  FolderNumber parent;
  std::string name;
};

// Which walk over the volume, from 1 on.
using WalkNumber = std::uint32_t;
inline constexpr WalkNumber kNoWalk = 0;

class FolderTree {
 public:
  enum class TellApart { kNumbers, kPlaces };

  struct Folder {
    std::uint64_t inode;
    kernel::Nanoseconds change;  // its change time when it was last looked at
    std::uint32_t id;            // 0: it is gone
    FolderNumber parent;
    std::uint32_t name;  // where it begins among the names
    std::uint32_t region : 31;
    std::uint32_t isRead : 1;  // everything in it was seen and is known until its change time moves
    WalkNumber checked;        // the last walk that has seen it as it is
    WalkNumber read;           // the walk that first read it as it is
  };
  static_assert(sizeof(Folder) == 40);

  explicit FolderTree(TellApart tellApart) : mTellApart(tellApart) {}

  // Numbers are below this; folders that are gone keep theirs.
  FolderNumber Count() const { return static_cast<FolderNumber>(mFolders.size()); }

  Folder& operator[](FolderNumber index) { return mFolders[index]; }
  const Folder& operator[](FolderNumber index) const { return mFolders[index]; }

  // A folder of the mount and on the device that a folder is on, as it was learned: with its
  // handle, if it had one.
  const kernel::Item& RegionOf(FolderNumber index) const;

  // Whether an item has the numbers of a known folder, on the same mount.
  bool IsSame(FolderNumber index, const kernel::Item& item) const;

  // The folder that was found at a place. One that was known elsewhere has moved here.
  FolderNumber Learn(const FolderPlace& place, const kernel::Item& item, std::uint32_t id);

  // Takes a folder for gone. What is known below it stays.
  void Forget(FolderNumber index);

  // The folders that are known to have an id. REQUIRES: TellApart::kNumbers.
  std::vector<FolderNumber> WithID(std::uint32_t id) const;

  std::string_view NameOf(FolderNumber index) const { return mNames.data() + mFolders[index].name; }

  // Empty for folders that seem to hold each other: they changed places, and half of it was
  // noticed.
  std::string PathOf(FolderNumber index) const;
  std::string PathOf(const FolderPlace& place) const;

  // Whether most of the names in memory are of folders that were renamed or are gone.
  bool IsMostlyWaste() const { return mUnusedNames > mNames.size() / 2; }

  // Forgets everything and gives the memory back.
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

  TellApart mTellApart;
  std::vector<Folder> mFolders;
  std::vector<FolderNumber> mTable;    // open addressing
  std::string mNames;                  // each with a NUL behind it
  std::vector<kernel::Item> mRegions;  // few
  std::size_t mUnusedNames = 0;        // bytes in mNames
};

// Containers double when they are full. Those that hold something for every folder grow by less.
template <class Container>
void ReserveFor(Container& container, std::size_t more) {
  const std::size_t size = container.size() + more;
  if (size > container.capacity()) container.reserve(size + size / 4);
}

}  // namespace tallowmere::catalog
