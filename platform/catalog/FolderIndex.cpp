#include "catalog/FolderIndex.h"

#include <algorithm>
#include <limits>
#include <utility>

#include "catalog/ChangeTimes.h"

namespace tallowmere::catalog {
namespace {

FolderTree::Identity IdentityOn(const volumes::Volume& volume) {
  return volume.NumbersIdentifyItems() ? FolderTree::Identity::kByNumbers
                                       : FolderTree::Identity::kByPlace;
}

// How many walks to make while the volume keeps changing.
constexpr int kMostLooks = 3;

}  // namespace

FolderIndex::FolderIndex(volumes::VolumePointer volume)
    : mVolume(std::move(volume)), mKnown{FolderTree(IdentityOn(*mVolume)), {}} {}

std::optional<std::string> FolderIndex::Find(const SearchedItem& item, const std::string& start,
                                             const volumes::Volumes& volumes) {
  if (!volumes.WithNumber(mVolume->Number())) return std::nullopt;
  std::optional<std::string> likely;  // the answer of the look before
  try {
    for (int look = 0; look < kMostLooks; ++look) {
      const bool isLast = mKnown.walks == std::numeric_limits<WalkNumber>::max();
      if (mKnown.tree.IsMostlyWaste() || isLast || !HoldsUntilChange(*mVolume)) Clear();
      Question question(item, *mVolume, LastMissed(item.id));
      const Proof proof = Run(question, start, volumes);
      if (mKnown.waiting.empty()) mKnown.waiting = {};
      if (proof == Proof::kCertain) return question.Answer();
      if (proof == Proof::kLikely && likely == question.Answer()) return likely;
      likely = proof == Proof::kLikely ? question.Answer() : std::nullopt;
    }
  } catch (...) {
    Clear();
    throw;
  }
  return std::nullopt;
}

// That only one place has the id is certain only if the volume did not change during the walk.
FolderIndex::Proof FolderIndex::Run(Question& question, const std::string& start,
                                    const volumes::Volumes& volumes) {
  VolumeWalk walk(*mVolume, volumes, mKnown, question);
  if (question.IsCertain()) walk.CheckKnownWithID();
  if (question.IsSettled()) return Proof::kCertain;
  if (!mKnown.isWhole || !mKnown.waiting.empty() || question.HasToReadAll()) walk.Walk(start);
  walk.CheckKnown();
  if (!question.IsSettled() && question.IsMissed()) NoteMissing(question.ID());
  if (mVolume->NumbersIdentifyItems() || !question.Answer()) return Proof::kCertain;
  if (!walk.IsSteady()) return Proof::kNone;
  return walk.MayHaveMissedChanges() ? Proof::kLikely : Proof::kCertain;
}

std::size_t FolderIndex::Size() const {
  std::size_t size = mKnown.tree.Size() + mKnown.waiting.capacity() * sizeof(FolderPlace) +
                     mMissing.capacity() * sizeof(Missing);
  for (const FolderPlace& place : mKnown.waiting) size += place.name.capacity();
  return size;
}

// Releases the memory too.
void FolderIndex::Clear() {
  mKnown.tree.Clear();
  mKnown.waiting = {};
  mKnown.isWhole = false;
  mKnown.walks = kNoWalk;
  mMissing = {};
}

WalkNumber FolderIndex::LastMissed(std::uint32_t id) const {
  const auto noted = std::find_if(mMissing.begin(), mMissing.end(),
                                  [id](const Missing& missing) { return missing.id == id; });
  return noted == mMissing.end() ? kNoWalk : noted->walk;
}

// Notes nothing where a file can get the id without a change of its folder. Folders that the walk
// could not read are not marked as read, so the next question reads them.
void FolderIndex::NoteMissing(std::uint32_t id) {
  if (!mVolume->Kind().keepsNumbers) return;
  std::erase_if(mMissing, [id](const Missing& missing) { return missing.id == id; });
  if (mMissing.size() == kMostMissing) mMissing.erase(mMissing.begin());
  mMissing.push_back({id, mKnown.walks});
}

}  // namespace tallowmere::catalog
