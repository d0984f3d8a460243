#include "catalog/Sighting.h"

#include <cstring>
#include <utility>

namespace tallowmere::catalog {
namespace {

// A handle type that no file system uses: the kernel's types are positive (FILEID_INVALID is 0xFF).
constexpr std::int32_t kPlaceProof = -2;

struct Digest {
  std::uint64_t words[2];
};

// FNV-1a, 64 bits, with two offset bases: the published one and its complement.
Digest DigestOf(std::string_view path) {
  constexpr std::uint64_t kBegin = 0xCBF29CE484222325;
  constexpr std::uint64_t kPrime = 0x100000001B3;
  Digest digest{{kBegin, ~kBegin}};
  for (std::uint64_t& word : digest.words) {
    for (const char byte : path) word = (word ^ static_cast<unsigned char>(byte)) * kPrime;
  }
  return digest;
}

void ProveByPlace(kernel::Item& item, std::string_view path) {
  const Digest digest = DigestOf(path);
  item.handle = {};
  item.handle.type = kPlaceProof;
  item.handle.size = sizeof digest;
  std::memcpy(item.handle.bytes.data(), &digest, sizeof digest);
}

}  // namespace

HeldFolder::HeldFolder(Sighting place, kernel::Descriptor descriptor,
                       volumes::VolumePointer volume) {
  const bool isRoot = volume->IsRoot(place.item, place.path);
  const std::uint32_t id = IDOf(*volume, place);
  mState = std::make_shared<const State>(
      State{std::move(place), std::move(descriptor), std::move(volume), isRoot, id});
}

std::uint32_t IDOf(const volumes::Volume& volume, const Sighting& seen) {
  const std::uint32_t id = volume.IDOf(seen.item);
  const bool isFalseRoot = id == names::kRootFolderID && !volume.IsRoot(seen.item, seen.path);
  return isFalseRoot ? names::kNoVolumeID : id;
}

bool AreSame(const volumes::Volume& volume, const Sighting& first, const Sighting& second) {
  return kernel::HaveSameNumbers(first.item, second.item) &&
         (volume.NumbersIdentifyItems() || first.path == second.path);
}

kernel::Item Proved(const Sighting& seen, const volumes::Volume& volume, const kernel::Spot& spot) {
  kernel::Item item = seen.item;
  if (!volume.NumbersIdentifyItems()) {
    ProveByPlace(item, seen.path);
  } else if (item.handle.size == 0) {
    kernel::ReadProof(item, spot);
  }
  return item;
}

bool IsProvedByPlace(const kernel::Item& item) {
  return item.handle.type == kPlaceProof && item.handle.size == sizeof(Digest);
}

bool ReferToSameItem(const kernel::Item& first, const kernel::Item& second) {
  if (!kernel::HaveSameNumbers(first, second)) return false;
  const bool isByPlace = IsProvedByPlace(first) || IsProvedByPlace(second);
  return !isByPlace || first.handle == second.handle;
}

std::uint64_t PlaceDigest(const kernel::Item& item) {
  Digest digest;
  std::memcpy(&digest, item.handle.bytes.data(), sizeof digest);
  return digest.words[0];
}

bool IsItemOf(const kernel::Item& reference, const Sighting& seen, const kernel::Spot& spot) {
  if (!kernel::HaveSameNumbers(seen.item, reference)) return false;
  kernel::Item found = seen.item;
  found.handle = {};
  if (IsProvedByPlace(reference)) {
    ProveByPlace(found, seen.path);
  } else if (reference.handle.size != 0) {
    found.handle = kernel::HandleAt(spot);
  }
  return kernel::IsProvedSame(found, reference);
}

bool IsItemAt(const kernel::Item& reference, const kernel::Spot& spot, std::string_view path) {
  if (!IsProvedByPlace(reference)) return kernel::IsAt(reference, spot);
  const auto status = kernel::ReadStatus(spot);
  return status && IsItemOf(reference, {std::string(path), status->item}, spot);
}

}  // namespace tallowmere::catalog
