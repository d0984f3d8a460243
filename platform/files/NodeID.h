// Which number has an item: 32-bit node ids as the File Manager knows them, a pure function of what
// the kernel says of the item and of its volume's root folder.
//
// The lower half of the ids are inode numbers as they are. What does not fit there (numbers below
// 16, which HFS reserves, numbers beyond 31 bits, items of a device other than the root's) is mixed
// into the upper half, where two items of one volume can share an id.
#pragma once

#include <cstdint>

#include "files/ItemReference.h"

namespace tallowmere::files {

// The id of a volume's root folder, and of the parent that every root has.
inline constexpr std::uint32_t kRootFolderID = 2;
inline constexpr std::uint32_t kParentOfRootID = 1;

// The id of an item on the volume with that root folder: never 0, 1 or 0xFFFFFFFF.
std::uint32_t NodeIDOf(const ItemReference& item, const ItemReference& root);

// The same for an inode number of a device, without the rest of an item.
std::uint32_t NodeIDOf(std::uint64_t inode, std::uint64_t device, const ItemReference& root);

// Whether an item of some volume can have the id.
bool CanBeNodeID(std::uint32_t id);

// Whether only one item of a volume can have the id: the one on the root's device that has it for
// its inode number. Not so for the root folder's id, which is no inode number.
bool IsInodeNumber(std::uint32_t id);

}  // namespace tallowmere::files
