#include "catalog/FolderTree.h"

#include <algorithm>
#include <climits>

#include "catalog/Spread.h"
#include "foundation/PathText.h"

namespace tallowmere::catalog {
namespace {

// The most components that a path can have: a "/" and one byte each.
constexpr std::size_t kMostComponents = PATH_MAX / 2;

constexpr std::size_t kSmallestTable = 64;

bool IsInRegion(const kernel::Item& item, const kernel::Item& region) {
  return item.device == region.device && item.mount == region.mount;
}

std::uint32_t HashOfPlace(FolderNumber parent, std::string_view name) {
  std::uint64_t hash = parent * kSpread;
  for (const char byte : name) hash = (hash ^ static_cast<unsigned char>(byte)) * kSpread;
  return static_cast<std::uint32_t>(hash >> 32);
}

}  // namespace

const kernel::Item& FolderTree::RegionOf(FolderNumber index) const {
  return mRegions[mFolders[index].region];
}

bool FolderTree::IsSame(FolderNumber index, const kernel::Item& item) const {
  return mFolders[index].inode == item.inode && IsInRegion(item, RegionOf(index));
}

FolderNumber FolderTree::Learn(const FolderPlace& place, const kernel::Item& item,
                               std::uint32_t id) {
  FolderNumber index = Find(place, item, id);
  if (index == kNoParent) {
    index = Count();
    ReserveFor(mFolders, 1);
    mFolders.push_back({item.inode, 0, id, kNoParent, 0, 0, false, kNoWalk, kNoWalk});
    Move(index, place);
    NoteRegion(index, item);
    Insert(index);
    return index;
  }
  const bool isSeenAlike = IsInRegion(item, RegionOf(index));
  if (isSeenAlike && IsKnownAt(index, place)) return index;
  if (mIdentity == Identity::kByPlace) {
    Replace(mFolders[index], item, id);
  } else if (mFolders[index].parent != place.parent || NameOf(index) != place.name) {
    mUnusedNames += NameOf(index).size() + 1;
    Move(index, place);
  }
  NoteRegion(index, item);
  return index;
}

// Updates the folder that is known at a place.
void FolderTree::Replace(Folder& folder, const kernel::Item& item, std::uint32_t id) {
  if (folder.inode != item.inode || folder.id != id) folder.isRead = false;
  folder.inode = item.inode;
  folder.id = id;
}

// Whether a folder met by its whole path is already known there under its parent. It then stays so,
// and follows when the parent moves.
bool FolderTree::IsKnownAt(FolderNumber index, const FolderPlace& place) const {
  return mIdentity == Identity::kByNumbers && place.parent == kNoParent &&
         mFolders[index].parent != kNoParent && PathOf(index) == place.name;
}

void FolderTree::Move(FolderNumber index, const FolderPlace& place) {
  ReserveFor(mNames, place.name.size() + 1);
  mFolders[index].name = static_cast<std::uint32_t>(mNames.size());
  mFolders[index].parent = place.parent;
  mNames.append(place.name).push_back('\0');
}

void FolderTree::Forget(FolderNumber index) {
  mUnusedNames += NameOf(index).size() + 1;
  mFolders[index].id = 0;
  mFolders[index].isRead = false;
}

std::vector<FolderNumber> FolderTree::WithID(std::uint32_t id) const {
  std::vector<FolderNumber> found;
  if (mTable.empty()) return found;
  const std::size_t mask = mTable.size() - 1;
  for (std::size_t slot = FirstSlot(id, mTable.size()); mTable[slot] != kNoParent;
       slot = (slot + 1) & mask) {
    if (mFolders[mTable[slot]].id == id) found.push_back(mTable[slot]);
  }
  return found;
}

FolderNumber FolderTree::Find(const FolderPlace& place, const kernel::Item& item,
                              std::uint32_t id) const {
  if (mTable.empty()) return kNoParent;
  const bool byNumbers = mIdentity == Identity::kByNumbers;
  const std::uint32_t hash = byNumbers ? id : HashOfPlace(place.parent, place.name);
  const std::size_t mask = mTable.size() - 1;
  for (std::size_t slot = FirstSlot(hash, mTable.size()); mTable[slot] != kNoParent;
       slot = (slot + 1) & mask) {
    if (IsIt(mFolders[mTable[slot]], place, item, id)) return mTable[slot];
  }
  return kNoParent;
}

bool FolderTree::IsIt(const Folder& folder, const FolderPlace& place, const kernel::Item& item,
                      std::uint32_t id) const {
  if (mIdentity == Identity::kByNumbers) {
    return folder.id == id && folder.inode == item.inode &&
           mRegions[folder.region].device == item.device;
  }
  return folder.id != 0 && folder.parent == place.parent &&
         mNames.data() + folder.name == place.name;
}

void FolderTree::NoteRegion(FolderNumber index, const kernel::Item& item) {
  const FolderNumber parent = mFolders[index].parent;
  if (parent != kNoParent && IsInRegion(item, RegionOf(parent))) {
    mFolders[index].region = mFolders[parent].region;
    return;
  }
  // A device number can be reused for another subvolume.
  const auto found = std::find_if(mRegions.begin(), mRegions.end(), [&](const auto& region) {
    return IsInRegion(item, region) &&
           kernel::SubvolumeOf(item.handle) == kernel::SubvolumeOf(region.handle);
  });
  const auto number = static_cast<std::uint32_t>(found - mRegions.begin());
  if (number == mRegions.size()) mRegions.push_back(item);
  mFolders[index].region = number & kMostRegions;
}

std::uint32_t FolderTree::HashOf(const Folder& folder) const {
  if (mIdentity == Identity::kByNumbers) return folder.id;
  return HashOfPlace(folder.parent, mNames.data() + folder.name);
}

// Grows the table at three quarters, which also drops the slots of folders that are gone.
void FolderTree::Insert(FolderNumber index) {
  if (mFolders.size() * 4 <= mTable.size() * 3) return Put(index);
  mTable.assign(std::max(kSmallestTable, mTable.size() * 2), kNoParent);
  for (FolderNumber known = 0; known <= index; ++known) {
    if (mFolders[known].id != 0) Put(known);
  }
}

void FolderTree::Put(FolderNumber index) {
  const std::size_t mask = mTable.size() - 1;
  std::size_t slot = FirstSlot(HashOf(mFolders[index]), mTable.size());
  while (mTable[slot] != kNoParent) slot = (slot + 1) & mask;
  mTable[slot] = index;
}

std::string FolderTree::PathOf(FolderNumber index) const {
  std::vector<std::string_view> names;
  for (; index != kNoParent; index = mFolders[index].parent) {
    names.push_back(NameOf(index));
    if (names.size() > kMostComponents) return {};
  }
  std::string path(names.back());
  for (auto name = names.rbegin() + 1; name != names.rend(); ++name) {
    if (path.back() != '/') path.push_back('/');
    path.append(*name);
  }
  return path;
}

std::string FolderTree::PathOf(const FolderPlace& place) const {
  if (place.parent == kNoParent) return place.name;
  return foundation::JoinPath(PathOf(place.parent), place.name);
}

void FolderTree::Clear() {
  *this = FolderTree(mIdentity);
}

std::size_t FolderTree::Size() const {
  return mFolders.capacity() * sizeof(Folder) + mTable.capacity() * sizeof(mTable[0]) +
         mNames.capacity() + mRegions.capacity() * sizeof(mRegions[0]);
}

}  // namespace tallowmere::catalog
