#include "catalog/Sighting.h"

#include <cstring>
#include <utility>

namespace tallowmere::catalog {
namespace {

// Of no file system: the kernel's types are positive (FILEID_INVALID is 0xFF).
constexpr std::int32_t kPlaceProof = -2;

struct Digest {
  std::uint64_t words[2];
};

// FNV-1a, 64 bits, from two different beginnings: the published one and its complement.
Digest DigestOf(std::string_view path) {
  constexpr std::uint64_t kBegin = 0xCBF29CE484222325;
  constexpr std::uint64_t kPrime = 0x100000001B3;
  Digest digest{{kBegin, ~kBegin}};
  for (std::uint64_t& word : digest.words) {
    for (const char byte : path) word = (word ^ static_cast<unsigned char>(byte)) * kPrime;
  }
  return digest;
}

std::uint32_t IDOf(const Sighting& folder, const volumes::Volume& volume, bool isRoot) {
  const std::uint32_t id = volume.IDOf(folder.item);
  return id == names::kRootFolderID && !isRoot ? names::kNoVolumeID : id;
}

}  // namespace

HeldFolder::HeldFolder(Sighting place, kernel::Descriptor descriptor,
                       volumes::VolumePointer volume) {
  const bool isRoot = volume->IsRoot(place.item, place.path);
  const std::uint32_t id = IDOf(place, *volume, isRoot);
  mState = std::make_shared<const State>(
      State{std::move(place), std::move(descriptor), std::move(volume), isRoot, id});
}

bool AreSame(const volumes::Volume& volume, const Sighting& first, const Sighting& second) {
  return kernel::HaveSameNumbers(first.item, second.item) &&
         (volume.NumbersTellItemsApart() || first.path == second.path);
}

void ProveByPlace(kernel::Item& item, std::string_view path) {
  const Digest digest = DigestOf(path);
  item.handle = {};
  item.handle.type = kPlaceProof;
  item.handle.size = sizeof digest;
  std::memcpy(item.handle.bytes.data(), &digest, sizeof digest);
}

bool IsProvedByPlace(const kernel::Item& item) {
  return item.handle.type == kPlaceProof && item.handle.size == sizeof(Digest);
}

std::uint64_t PlaceDigest(const kernel::Item& item) {
  Digest digest;
  std::memcpy(&digest, item.handle.bytes.data(), sizeof digest);
  return digest.words[0];
}

bool IsItemAt(const kernel::Item& item, const kernel::Spot& spot, std::string_view path) {
  if (!IsProvedByPlace(item)) return kernel::IsAt(item, spot);
  const auto found = kernel::ReadStatus(spot);
  if (!found) return false;
  kernel::Item there = found->item;
  ProveByPlace(there, path);
  return kernel::IsProvedSame(there, item);
}

}  // namespace tallowmere::catalog
