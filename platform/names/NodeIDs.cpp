#include "names/NodeIDs.h"

#include <algorithm>

namespace tallowmere::names {
namespace {

// The lower half: inode numbers themselves. HFS reserves the ids below 16.
constexpr std::uint64_t kLowestOwnNumber = 16;
constexpr std::uint64_t kHighestOwnNumber = 0x7FFFFFFF;

constexpr std::uint32_t kLowestUpper = 0x80000000;
constexpr std::uint32_t kHighestUpper = 0xFFFFFFEF;

// The top of the upper half: the numbers 1 to 15 as 0xFFFFFFF0 to 0xFFFFFFFE.
constexpr std::uint64_t kHighestSmallNumber = kLowestOwnNumber - 1;
constexpr std::uint32_t kHighestID = kHighestUpper + kHighestSmallNumber;

// Folding keeps the lowest 31 bits, shifted once for each 2^31 in the number beyond the first: the
// groups of a large xfs volume begin at multiples of 2^31 and number their items alike. The shift
// is the golden ratio of 2^31, which keeps any few of them well apart. A result among the ids of
// the numbers 1 to 15 is then moved down.
constexpr std::uint64_t kFold = std::uint64_t{1} << 31;
constexpr std::uint64_t kShift = 0x1E3779B1;
constexpr std::uint32_t kMovedDown = 0x10;

// 256 is the first id of a btrfs subvolume: BTRFS_FIRST_FREE_OBJECTID in <linux/btrfs_tree.h>.
constexpr std::uint64_t kLowestSubvolume = 256;
constexpr std::uint64_t kHighestSubvolume = 639;
constexpr unsigned kSubvolumeShift = 22;
constexpr std::uint64_t kNumbersOfSubvolume = std::uint64_t{1} << kSubvolumeShift;
constexpr std::uint32_t kLowestMixedOfSubvolumes = 0xE0000000;
static_assert(kLowestUpper + ((kHighestSubvolume - kLowestSubvolume + 1) << kSubvolumeShift) ==
              kLowestMixedOfSubvolumes);

// The finalizer of SplitMix64: every input bit affects every output bit.
std::uint64_t Mix(std::uint64_t value) {
  value = (value ^ value >> 30) * 0xBF58476D1CE4E5B9;
  value = (value ^ value >> 27) * 0x94D049BB133111EB;
  return value ^ value >> 31;
}

std::uint32_t MixInto(std::uint32_t lowest, std::uint64_t origin, std::uint64_t inode) {
  const std::uint64_t mixed = Mix(inode ^ Mix(origin));
  return static_cast<std::uint32_t>(lowest + mixed % (kHighestUpper - lowest + 1));
}

bool IsOnRootsDevice(const ItemNumbers& item, const NodeIDRule& rule) {
  return item.device == rule.root.device;
}

bool HasOwnNumber(const ItemNumbers& item, const NodeIDRule& rule) {
  return IsOnRootsDevice(item, rule) && item.inode > 0 && item.inode <= kHighestOwnNumber;
}

std::uint64_t ShiftOf(std::uint64_t fold) {
  return (fold - 1) * kShift;
}

// REQUIRES: the number is above kHighestOwnNumber.
std::uint32_t Fold(std::uint64_t inode) {
  const std::uint64_t kept = (inode + ShiftOf(inode / kFold)) % kFold;
  const auto folded = static_cast<std::uint32_t>(kLowestUpper + kept);
  return folded > kHighestUpper ? folded - kMovedDown : folded;
}

// The number whose 31 bits these are after its shift.
std::uint64_t Unfold(std::uint64_t kept, std::uint64_t fold) {
  return fold * kFold + (kept - ShiftOf(fold)) % kFold;
}

bool HasPlace(std::uint64_t subvolume, std::uint64_t inode) {
  return subvolume >= kLowestSubvolume && subvolume <= kHighestSubvolume &&
         inode < kNumbersOfSubvolume;
}

std::uint32_t UpperIDInSubvolumes(const ItemNumbers& item, const NodeIDRule& rule) {
  if (IsOnRootsDevice(item, rule) || !HasPlace(item.subvolume, item.inode)) {
    return MixInto(kLowestMixedOfSubvolumes, item.subvolume, item.inode);
  }
  const std::uint64_t place = (item.subvolume - kLowestSubvolume) << kSubvolumeShift;
  return static_cast<std::uint32_t>(kLowestUpper + place + item.inode);
}

// The root folder's device differs from mount to mount on file systems without a disk of their own,
// so its ids do not depend on it.
std::uint32_t UpperID(const ItemNumbers& item, const NodeIDRule& rule) {
  if (rule.upper == UpperIDs::kSubvolumes) return UpperIDInSubvolumes(item, rule);
  if (rule.upper == UpperIDs::kFolded && item.inode > kHighestOwnNumber) return Fold(item.inode);
  return MixInto(kLowestUpper, IsOnRootsDevice(item, rule) ? 0 : item.device, item.inode);
}

using Candidates = std::vector<Candidate>;

// The numbers on the root folder's device, up to the highest one, that fold into the id.
std::optional<Candidates> FoldedInto(std::uint32_t id, std::uint64_t rootInode,
                                     std::uint64_t highestInode) {
  const std::uint64_t folds = highestInode / kFold;  // each with at most two candidates
  if (folds > kMostCandidates / 2) return std::nullopt;
  std::vector<std::uint64_t> inodes;
  for (std::uint64_t fold = 1; fold <= folds; ++fold) {
    inodes.push_back(Unfold(id, fold));
    const std::uint64_t movedDown = Unfold(std::uint64_t{id} + kMovedDown, fold);
    if (Fold(movedDown) == id) inodes.push_back(movedDown);
  }
  std::sort(inodes.begin(), inodes.end());
  Candidates candidates;
  for (const std::uint64_t inode : inodes) {
    if (inode <= highestInode && inode != rootInode) candidates.push_back({inode, 0});
  }
  return candidates;
}

std::optional<Candidates> InSubvolumes(std::uint32_t id, const NodeIDRule& rule) {
  if (id >= kLowestMixedOfSubvolumes) return std::nullopt;
  const std::uint32_t place = id - kLowestUpper;
  const Candidate candidate{place % kNumbersOfSubvolume,
                            kLowestSubvolume + (place >> kSubvolumeShift)};
  if (candidate.subvolume == rule.root.subvolume) return Candidates{};
  return Candidates{candidate};
}

Candidates OneUnlessRoot(std::uint64_t inode, const NodeIDRule& rule) {
  return inode == rule.root.inode ? Candidates{} : Candidates{{inode, 0}};
}

}  // namespace

bool NeedsSubvolume(const ItemNumbers& item, const NodeIDRule& rule) {
  return rule.upper == UpperIDs::kSubvolumes && !HasOwnNumber(item, rule);
}

std::uint32_t NodeIDOf(const ItemNumbers& item, const NodeIDRule& rule) {
  if (IsOnRootsDevice(item, rule) && item.inode == rule.root.inode) return kRootFolderID;
  if (!HasOwnNumber(item, rule)) return UpperID(item, rule);
  const auto number = static_cast<std::uint32_t>(item.inode);
  return number < kLowestOwnNumber ? kHighestUpper + number : number;
}

bool CanBeNodeID(std::uint32_t id) {
  return id == kRootFolderID || (id >= kLowestOwnNumber && id <= kHighestID);
}

bool IsInodeNumber(std::uint32_t id) {
  return id >= kLowestOwnNumber && id <= kHighestOwnNumber;
}

std::optional<Candidates> CandidatesOf(std::uint32_t id, const NodeIDRule& rule,
                                       std::uint64_t highestInode) {
  if (!CanBeNodeID(id)) return Candidates{};
  if (id == kRootFolderID) return Candidates{{rule.root.inode, 0}};
  if (IsInodeNumber(id)) return OneUnlessRoot(id, rule);
  if (id > kHighestUpper) return OneUnlessRoot(id - kHighestUpper, rule);
  switch (rule.upper) {
    case UpperIDs::kFolded:
      return FoldedInto(id, rule.root.inode, highestInode);
    case UpperIDs::kSubvolumes:
      return InSubvolumes(id, rule);
    case UpperIDs::kMixed:
      break;
  }
  return std::nullopt;
}

bool IsCertain(std::uint32_t id, const NodeIDRule& rule, std::uint64_t highestInode) {
  const auto candidates = CandidatesOf(id, rule, highestInode);
  return candidates && candidates->size() <= 1;
}

}  // namespace tallowmere::names
