#include "files/NodeID.h"

namespace tallowmere::files {
namespace {

constexpr std::uint64_t kLowestInode = 16;
constexpr std::uint64_t kHighestInode = 0x7FFFFEFF;
constexpr std::uint32_t kLowestMixed = 0x80000000;
constexpr std::uint32_t kHighestMixed = 0xFFFFFFEF;

// The finishing step of SplitMix64: every bit of the input moves every bit of the result.
std::uint64_t Mix(std::uint64_t value) {
  value = (value ^ value >> 30) * 0xBF58476D1CE4E5B9;
  value = (value ^ value >> 27) * 0x94D049BB133111EB;
  return value ^ value >> 31;
}

}  // namespace

std::uint32_t NodeIDOf(std::uint64_t inode, std::uint64_t device, const ItemReference& root) {
  const bool onRootsDevice = device == root.device;
  if (onRootsDevice && inode == root.inode) return kRootFolderID;
  if (onRootsDevice && inode >= kLowestInode && inode <= kHighestInode) {
    return static_cast<std::uint32_t>(inode);
  }
  const std::uint64_t mixed = Mix(inode ^ (onRootsDevice ? 0 : Mix(device + 1)));
  return static_cast<std::uint32_t>(kLowestMixed + mixed % (kHighestMixed - kLowestMixed + 1));
}

std::uint32_t NodeIDOf(const ItemReference& item, const ItemReference& root) {
  return NodeIDOf(item.inode, item.device, root);
}

bool CanBeNodeID(std::uint32_t id) {
  return id == kRootFolderID || IsInodeNumber(id) || (id >= kLowestMixed && id <= kHighestMixed);
}

bool IsInodeNumber(std::uint32_t id) {
  return id >= kLowestInode && id <= kHighestInode;
}

}  // namespace tallowmere::files
