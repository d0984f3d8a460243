// Node ids: the 32-bit numbers by which the File Manager knows the items of a volume. An id is a
// pure function of what the kernel says of the item and of the kind of the volume's file system.
//
// Ids are on record with other programs, so none of this may ever change. The first row that fits:
//
//   Item                                                Id
//   ---------------------------------------------------------------------------------------------
//   the volume's root folder                            kRootFolderID
//   root folder's device, number 16 to 0x7FFFFFFF       the number
//   root folder's device, number 1 to 15                0xFFFFFFEF + the number
//   kFolded, number above 0x7FFFFFFF                    0x80000000 + the lowest 31 bits of: number
//                                                       + 0x1E3779B1 * (number / 2^31 - 1); 0x10
//                                                       less where that is above 0xFFFFFFEF
//   kSubvolumes, another subvolume than the root        0x80000000 + (subvolume - 256) * 2^22 + the
//   folder's: subvolume 256 to 639, number below 2^22   number
//   kSubvolumes, everything else                        mixed: 0xE0000000 to 0xFFFFFFEF
//   everything else                                     mixed: 0x80000000 to 0xFFFFFFEF
#pragma once

#include <cstdint>
#include <optional>
#include <vector>

namespace tallowmere::names {

inline constexpr std::uint32_t kParentOfRootID = 1;  // the parent of every root folder
inline constexpr std::uint32_t kRootFolderID = 2;
inline constexpr std::uint32_t kNoVolumeID = 3;  // of an item on no volume; never an item's own

// How a kind of file system fills the upper half of the ids.
enum class UpperIDs : std::uint8_t {
  kMixed,       // by device and number
  kFolded,      // by number: the numbers that share an id can be listed
  kSubvolumes,  // by subvolume and number, as on btrfs
};

// What the kernel says of an item.
struct ItemNumbers {
  std::uint64_t inode;  // never 0 where numbers identify items
  std::uint64_t device;
  std::uint64_t subvolume;  // 0 when not asked for: see NeedsSubvolume

  bool operator==(const ItemNumbers&) const = default;
};

// What the ids of a volume depend on.
struct NodeIDRule {
  ItemNumbers root;  // the volume's root folder, its subvolume included on kSubvolumes
  UpperIDs upper;
};

// Whether the id of an item depends on its subvolume.
bool NeedsSubvolume(const ItemNumbers& item, const NodeIDRule& rule);

// The id of an item of the volume. REQUIRES: its subvolume is given if NeedsSubvolume.
std::uint32_t NodeIDOf(const ItemNumbers& item, const NodeIDRule& rule);

// Whether an item of some volume can have the id.
bool CanBeNodeID(std::uint32_t id);

// Whether the id is an inode number itself, so that only the item with that number on the root
// folder's device can have it.
bool IsInodeNumber(std::uint32_t id);

// An inode number of a volume. `subvolume` is 0 for the root folder's own.
struct Candidate {
  std::uint64_t inode;
  std::uint64_t subvolume;

  bool operator==(const Candidate&) const = default;
};

// Longer lists of candidates are never built.
inline constexpr std::size_t kMostCandidates = 1024;

// The numbers that have the id, lowest first: at most one for most ids, none for an id that no item
// of the volume can have. Nullopt when they cannot be listed: for mixed ids, and when there could
// be more than kMostCandidates.
//
// `highestInode` is the highest inode number that the volume can have.
std::optional<std::vector<Candidate>> CandidatesOf(std::uint32_t id, const NodeIDRule& rule,
                                                   std::uint64_t highestInode);

// Whether at most one number of the volume has the id. Where numbers identify items, at most one
// item then has it.
bool IsCertain(std::uint32_t id, const NodeIDRule& rule, std::uint64_t highestInode);

}  // namespace tallowmere::names
