#include "catalog/Question.h"

#include <algorithm>
#include <utility>

namespace tallowmere::catalog {

Question::Question(const SearchedItem& item, const volumes::Volume& volume, WalkNumber lastMissed)
    : mItem(item), mVolume(volume), mLastMissed(lastMissed) {}

bool Question::IsCertain() const {
  if (!mVolume.NumbersIdentifyItems()) return false;
  return mItem.reference != nullptr || mVolume.IsCertain(mItem.id);
}

bool Question::IsWorthALook(std::uint64_t inode, const kernel::Item& folder, bool isFolder) const {
  if (mItem.foldersOnly && !isFolder) return false;
  if (!mVolume.Kind().entriesTellNumbers && !isFolder) return true;
  return mVolume.IDOfEntry(inode, folder) == mItem.id;
}

bool Question::IsMeant(const kernel::Item& item, std::uint32_t id, const kernel::Spot& spot) {
  if (id != mItem.id) return false;
  mHasMet = true;
  if (mItem.foldersOnly && !kernel::IsFolder(item)) return false;
  return mItem.reference == nullptr || IsReferred(item, spot);
}

// Where numbers do not identify items, the caller compares places.
bool Question::IsReferred(const kernel::Item& item, const kernel::Spot& spot) const {
  if (mVolume.NumbersIdentifyItems()) return kernel::IsAt(*mItem.reference, spot);
  return kernel::HaveSameNumbers(item, *mItem.reference) && item.type == mItem.reference->type;
}

// Certainty is asked for after the item was seen, since the volume may have grown.
void Question::Take(const kernel::Item& item, std::string path) {
  Found taken{item, std::move(path)};
  const bool isKnown = std::any_of(mFound.begin(), mFound.end(),
                                   [&](const Found& found) { return AreSame(found, taken); });
  if (!isKnown) mFound.push_back(std::move(taken));
  mIsSettled = mFound.size() > 1 || IsCertain();
}

bool Question::AreSame(const Found& first, const Found& second) const {
  if (mVolume.NumbersIdentifyItems()) return kernel::HaveSameNumbers(first.item, second.item);
  return ShowsAt(first, second.path) && ShowsAt(second, first.path);
}

// Whether one of the volume's mounts shows the found item at `path` too.
bool Question::ShowsAt(const Found& found, const std::string& path) const {
  const auto paths = mVolume.Listed().PathsOf(found.path, found.item.mount);
  return std::find(paths.begin(), paths.end(), path) != paths.end();
}

// Items that are gone do not matter. Where numbers identify items, neither do folders that this
// process may not read and items without a path: a second item with the same id just there would be
// a coincidence.
void Question::NoteError(kernel::Error error) {
  if (kernel::MeansGone(error)) return;
  const bool isPassedOver = kernel::MeansRefused(error) || error.number == ENAMETOOLONG;
  if (!isPassedOver || !mVolume.NumbersIdentifyItems()) mIsHidden = true;
}

void Question::NoteHidden() {
  if (!mVolume.NumbersIdentifyItems()) mIsHidden = true;
}

std::optional<std::string> Question::Answer() const {
  if (mFound.size() != 1 || (!mIsSettled && mIsHidden)) return std::nullopt;
  return mFound.front().path;
}

}  // namespace tallowmere::catalog
