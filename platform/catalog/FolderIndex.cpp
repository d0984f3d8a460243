#include "catalog/FolderIndex.h"

#include <algorithm>
#include <limits>
#include <utility>

namespace tallowmere::catalog {
namespace {

FolderTree::TellApart HowToTellApart(const volumes::Volume& volume) {
  return volume.NumbersTellItemsApart() ? FolderTree::TellApart::kNumbers
                                        : FolderTree::TellApart::kPlaces;
}

// How often a volume that changes while it is looked at is looked at again.
constexpr int kMostLooks = 3;

// Whether what is known of a folder holds until its change time moves. A server that promises
// nothing can show several folders as one, with the time of one of them.
bool HoldsUntilChange(const volumes::Volume& volume) {
  return volume.NumbersTellItemsApart() || volume.Kind().keepsNumbers;
}

}  // namespace

FolderIndex::FolderIndex(volumes::VolumePointer volume)
    : mVolume(std::move(volume)), mKnown{FolderTree(HowToTellApart(*mVolume)), {}} {}

std::optional<std::string> FolderIndex::Find(const SearchedItem& item, const std::string& start,
                                             const volumes::Volumes& volumes) {
  if (!volumes.WithNumber(mVolume->Number())) return std::nullopt;
  try {
    for (int look = 0; look < kMostLooks; ++look) {
      const bool isLast = mKnown.walks == std::numeric_limits<WalkNumber>::max();
      if (mKnown.tree.IsMostlyWaste() || isLast || !HoldsUntilChange(*mVolume)) Clear();
      Question question(item, *mVolume, LastMissed(item.id));
      const bool isProved = Run(question, start, volumes);
      if (mKnown.waiting.empty()) mKnown.waiting = {};
      if (isProved) return question.Answer();
    }
  } catch (...) {
    Clear();
    throw;
  }
  return std::nullopt;
}

// Whether the answer of the question is one. That there is only one place takes a volume that
// stayed as it was while it was looked at.
bool FolderIndex::Run(Question& question, const std::string& start,
                      const volumes::Volumes& volumes) {
  VolumeWalk walk(*mVolume, volumes, mKnown, question);
  if (question.IsCertain()) walk.LookAtKnown();
  if (question.IsSettled()) return true;
  if (!mKnown.isWhole || !mKnown.waiting.empty() || question.HasToReadAll()) walk.Walk(start);
  walk.CheckKnown();
  if (!question.IsSettled() && question.IsMissed()) NoteMissing(question.ID());
  return mVolume->NumbersTellItemsApart() || !question.Answer() || walk.IsSteady();
}

std::size_t FolderIndex::Size() const {
  std::size_t size = mKnown.tree.Size() + mKnown.waiting.capacity() * sizeof(FolderPlace) +
                     mMissing.capacity() * sizeof(Missing);
  for (const FolderPlace& place : mKnown.waiting) size += place.name.capacity();
  return size;
}

// Gives the memory back, too.
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

// What the walk did not see is not marked as read. Nothing is noted where a file can get the id
// without a change of its folder.
void FolderIndex::NoteMissing(std::uint32_t id) {
  if (!mVolume->Kind().keepsNumbers) return;
  std::erase_if(mMissing, [id](const Missing& missing) { return missing.id == id; });
  if (mMissing.size() == kMostMissing) mMissing.erase(mMissing.begin());
  mMissing.push_back({id, mKnown.walks});
}

}  // namespace tallowmere::catalog
