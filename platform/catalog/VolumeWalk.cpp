#include "catalog/VolumeWalk.h"

#include <algorithm>
#include <iterator>
#include <utility>

#include "catalog/ChangeTimes.h"
#include "foundation/PathText.h"
#include "kernel/Clock.h"
#include "kernel/Paths.h"

namespace tallowmere::catalog {
namespace {

constexpr std::size_t kMostOpenFolders = 16;

constexpr std::uint32_t kLinksWithoutSubfolders = 2;

}  // namespace

VolumeWalk::VolumeWalk(const volumes::Volume& volume, const volumes::Volumes& volumes,
                       KnownFolders& known, Question& question)
    : mVolume(volume),
      mVolumes(volumes),
      mKnown(known),
      mTree(known.tree),
      mQuestion(question),
      mBegan(kernel::Now()) {
  ++mKnown.walks;
}

void VolumeWalk::CheckKnownWithID() {
  for (const FolderNumber number : mTree.WithID(mQuestion.ID())) {
    const std::string path = mTree.PathOf(number);
    const auto held = HoldAt(path);
    if (!held || !mTree.IsSame(number, held->item)) continue;
    const kernel::Spot spot = kernel::AtOpen(held->descriptor.Get());
    mQuestion.Offer(held->item, mTree[number].id, spot, [&path] { return std::string(path); });
  }
}

// `start`, the folders above it, and the volume's places. Only the volume's places where folders
// are known by place: a whole path would count as another place.
std::vector<std::string> VolumeWalk::StartsFrom(const std::string& start) const {
  const auto& mountPoints = mVolume.Listed().MountPoints();
  if (!mVolume.NumbersIdentifyItems()) return mountPoints;
  const auto isMountPoint = [&](const std::string& path) {
    return std::find(mountPoints.begin(), mountPoints.end(), path) != mountPoints.end();
  };
  std::vector<std::string> starts;
  for (std::string path = start;; path = foundation::FolderOf(path)) {
    starts.push_back(path);
    if (path == "/" || isMountPoint(path)) break;
  }
  starts.insert(starts.end(), mountPoints.begin(), mountPoints.end());
  return starts;
}

void VolumeWalk::Walk(const std::string& start) {
  std::vector<FolderPlace> left = std::exchange(mKnown.waiting, {});
  for (const std::string& path : StartsFrom(start)) {
    Visit({kNoParent, path});
    VisitWaiting();
    if (mQuestion.IsSettled()) return PutBack(std::move(left));
  }
  mKnown.waiting = std::move(left);
  VisitWaiting();
  const bool hasSeenAll = mQuestion.HasSeenAll() && !mHasMissedStart;
  if (!mQuestion.IsSettled() && hasSeenAll) mKnown.isWhole = true;
}

// After a walk that stopped early: keeps the folders that waited before, and adds those found in
// folders first read by this walk. The rest is known already.
void VolumeWalk::PutBack(std::vector<FolderPlace> left) {
  const auto isNews = [this](const FolderPlace& place) {
    return place.parent != kNoParent && mTree[place.parent].read == mKnown.walks;
  };
  auto& waiting = mKnown.waiting;
  std::erase_if(left, isNews);
  std::erase_if(waiting, [&](const FolderPlace& place) { return !isNews(place); });
  if (left.empty()) return;
  ReserveFor(left, waiting.size());
  std::move(waiting.begin(), waiting.end(), std::back_inserter(left));
  waiting = std::move(left);
}

void VolumeWalk::VisitWaiting() {
  while (!mKnown.waiting.empty() && !mQuestion.IsSettled()) {
    const FolderPlace next = std::move(mKnown.waiting.back());
    mKnown.waiting.pop_back();
    Visit(next);
  }
}

void VolumeWalk::Visit(const FolderPlace& place) {
  const auto spot = SpotOf(place);
  if (!spot) return Invalidate(place.parent);
  kernel::Descriptor descriptor;
  if (!mVolume.Kind().countsSubfolders) {
    if (auto opened = OpenToRead(*spot)) descriptor = *std::move(opened);
  }
  const auto status =
      kernel::ReadStatus(descriptor.IsOpen() ? kernel::AtOpen(descriptor.Get()) : *spot);
  if (!status) {
    mQuestion.NoteError(status.Error());
    return Invalidate(place.parent);
  }
  if (!kernel::IsFolder(status->item)) return;
  if (!IsOfVolume(status->item, place)) {
    mQuestion.NoteHidden();
    return Invalidate(place.parent);
  }
  VisitFolder({place, *spot, std::move(descriptor), *status});
}

// The spot of a folder. Nullopt when something is mounted there, and when its parent cannot be
// held.
std::optional<kernel::Spot> VolumeWalk::SpotOf(const FolderPlace& place) {
  if (place.parent == kNoParent) return kernel::AtPath(place.name.c_str());
  if (!EnterFolder(place.parent)) return std::nullopt;
  const OpenFolder& parent = mOpen.back();
  if (parent.holdsMountPoint && mVolumes.IsMountPoint(mTree.PathOf(place))) {
    mQuestion.NoteHidden();
    return std::nullopt;
  }
  return kernel::Spot{parent.descriptor.Get(), place.name.c_str()};
}

// Whether a folder belongs to the walk: a start is on the volume, any other folder on its parent's
// mount. Mounts further down have starts of their own.
bool VolumeWalk::IsOfVolume(const kernel::Item& item, const FolderPlace& place) const {
  if (place.parent == kNoParent) {
    const auto volume = mVolumes.OfItem(item, place.name);
    return volume && volume->Number() == mVolume.Number();
  }
  if (item.mount == kernel::kNoMount) return item.device == mVolume.Root().device;
  return item.mount == mTree.RegionOf(place.parent).mount;
}

void VolumeWalk::VisitFolder(Visited visited) {
  kernel::Item& item = visited.status.item;
  const auto id = IDOf(item, visited.place.parent, visited.spot);
  if (!id) return Invalidate(visited.place.parent);
  const FolderNumber number = mTree.Learn(visited.place, item, *id);
  mQuestion.Offer(item, *id, visited.spot, [&] { return mTree.PathOf(number); });
  if (IsSeen(number)) return;
  FolderTree::Folder& folder = mTree[number];
  if (folder.change != visited.status.change) folder.isRead = false;
  folder.change = visited.status.change;
  if (folder.isRead && !mQuestion.HasToRead(folder.read)) return MarkAsSeen(number);
  if (mQuestion.IsSettled()) {
    mKnown.waiting.push_back(visited.place);
    return;
  }
  ReadFolder(number, std::move(visited));
}

void VolumeWalk::ReadFolder(FolderNumber folder, Visited visited) {
  const kernel::Status& status = visited.status;
  const kernel::Nanoseconds now = kernel::Now();
  const bool isLeaf = mVolume.Kind().countsSubfolders && status.links == kLinksWithoutSubfolders;
  if (isLeaf && mQuestion.WantsFoldersOnly()) return MarkAsRead(folder, status.change, now);

  if (!visited.descriptor.IsOpen()) {
    auto opened = OpenAgain(visited);
    if (!opened) {
      // Permission can come without a change of the folder, from a server or with a new ticket.
      if (kernel::MeansRefused(opened.Error())) MarkAsSeen(folder);
      mTree[folder].isRead = false;
      return;
    }
    visited.descriptor = *std::move(opened);
  }
  auto& waiting = mKnown.waiting;
  const std::size_t before = waiting.size();
  const Reading reading = ReadEntries(folder, visited.descriptor);
  if (reading == Reading::kStopped) {
    waiting.resize(before);
    waiting.push_back(visited.place);
    return;
  }
  MarkAsRead(folder, status.change, now);
  if (reading == Reading::kPartly) Invalidate(folder);
  if (waiting.size() > before) KeepOpen(folder, std::move(visited.descriptor));
}

// Opens the folder that was seen. Another one may have taken its place meanwhile.
kernel::Result<kernel::Descriptor> VolumeWalk::OpenAgain(const Visited& visited) {
  auto opened = OpenToRead(visited.spot);
  const auto status = opened ? kernel::ReadStatus(kernel::AtOpen(opened->Get()))
                             : kernel::Result<kernel::Status>(opened.Error());
  if (!status) {
    mQuestion.NoteError(status.Error());
    return status.Error();
  }
  if (kernel::HaveSameNumbers(status->item, visited.status.item)) return opened;
  mQuestion.NoteHidden();
  return kernel::kNotThere;
}

// Reads a folder's entries until the question is settled.
VolumeWalk::Reading VolumeWalk::ReadEntries(FolderNumber folder,
                                            const kernel::Descriptor& descriptor) {
  const bool isNew = !mTree[folder].isRead || mQuestion.HasToReadAll();
  const kernel::Item region = mTree.RegionOf(folder);
  Reading reading = Reading::kWhole;
  kernel::FolderReader reader(descriptor);
  while (const kernel::Entry* const entry = reader.Next()) {
    Seen seen = entry->kind == kernel::Entry::Kind::kFolder ? Seen::kFolder : Seen::kOther;
    if (entry->kind == kernel::Entry::Kind::kUnknown ||
        mQuestion.IsWorthALook(entry->inode, region, seen == Seen::kFolder)) {
      seen = SeeEntry(folder, {descriptor.Get(), entry->name});
      if (mQuestion.IsSettled()) return Reading::kStopped;
    }
    if (seen == Seen::kHidden) reading = Reading::kPartly;
    // Subfolders found by an earlier reading are known or waiting already.
    if (seen == Seen::kFolder && isNew) mKnown.waiting.push_back({folder, entry->name});
  }
  if (reader.FailedBy().number == 0) return reading;
  mQuestion.NoteError(reader.FailedBy());
  return Reading::kPartly;
}

// Offers the item at an entry of an open folder. Returns kHidden when something is mounted over it
// and when it cannot be examined.
VolumeWalk::Seen VolumeWalk::SeeEntry(FolderNumber folder, const kernel::Spot& spot) {
  const std::string path = foundation::JoinPath(mTree.PathOf(folder), spot.name);
  if (mVolumes.IsMountPoint(path)) {
    mQuestion.NoteHidden();
    return Seen::kHidden;
  }
  auto status = kernel::ReadStatus(spot);
  if (!status) {
    mQuestion.NoteError(status.Error());
    return Seen::kHidden;
  }
  const bool isOfMount = status->item.mount == mTree.RegionOf(folder).mount;
  if (!isOfMount) mQuestion.NoteHidden();
  const auto id = isOfMount ? IDOf(status->item, folder, spot) : std::nullopt;
  if (!id) return Seen::kHidden;
  mQuestion.Offer(status->item, *id, spot, [&path] { return std::string(path); });
  return kernel::IsFolder(status->item) ? Seen::kFolder : Seen::kOther;
}

// A folder counts as gone only when it is still missing after all others have been checked: it may
// have moved.
void VolumeWalk::CheckKnown() {
  for (const bool isLast : {false, true}) {
    for (FolderNumber number = 0; number < mTree.Count() && !mQuestion.IsSettled(); ++number) {
      if (mTree[number].id == 0 || IsSeen(number) || CheckUnchanged(number)) continue;
      const FolderNumber parent = mTree[number].parent;
      if (parent == kNoParent || EnterFolder(parent)) {
        Visit({parent, std::string(mTree.NameOf(number))});
        VisitWaiting();
      }
      if (isLast && !IsSeen(number) && !mQuestion.IsSettled()) ForgetIfGone(number);
    }
  }
}

bool VolumeWalk::IsSteady() const {
  for (FolderNumber number = 0; number < mTree.Count(); ++number) {
    if (!IsSeen(number)) continue;
    const std::string path = mTree.PathOf(number);
    const auto status = kernel::ReadStatus(kernel::AtPath(path.c_str()));
    const bool isAsSeen =
        status && mTree.IsSame(number, status->item) && status->change == mTree[number].change;
    if (!isAsSeen) return false;
  }
  return true;
}

bool VolumeWalk::MayHaveMissedChanges() const {
  for (FolderNumber number = 0; number < mTree.Count(); ++number) {
    if (IsSeen(number) && MayChangeUnseen(mTree[number].change, mBegan)) return true;
  }
  return false;
}

// Whether the folder is at its known place, unchanged since it was read, and need not be read for
// this question. If so, marks it as seen.
bool VolumeWalk::CheckUnchanged(FolderNumber number) {
  const FolderTree::Folder& folder = mTree[number];
  if (!folder.isRead || mQuestion.HasToRead(folder.read)) return false;
  // If its parent has moved, the path may lead through a link.
  if (folder.parent != kNoParent && !IsSeen(folder.parent)) return false;
  const std::string path = mTree.PathOf(number);
  if (path.empty() || !mVolumes.IsReachable(mVolume.Listed(), path)) return false;
  const kernel::Spot spot = kernel::AtPath(path.c_str());
  const auto status = kernel::ReadStatus(spot);
  if (!status || !mTree.IsSame(number, status->item) || status->change != folder.change) {
    return false;
  }
  mQuestion.Offer(status->item, folder.id, spot, [&path] { return std::string(path); });
  MarkAsSeen(number);
  return true;
}

// Forgets a folder that does not exist any more. One that is only covered, or cannot be examined,
// may come back unchanged; one that is gone may, with the mount that it is on.
void VolumeWalk::ForgetIfGone(FolderNumber folder) {
  mTree[folder].isRead = false;
  const std::string path = mTree.PathOf(folder);
  if (!path.empty()) {
    const auto held = HoldAt(path);
    const bool isThere = held ? mTree.IsSame(folder, held->item) : !kernel::MeansGone(held.Error());
    if (isThere) return;
  }
  Invalidate(mTree[folder].parent);
  mTree.Forget(folder);
}

// Nullopt when the handle that the id needs cannot be read. An item in another subvolume than its
// parent gets its handle.
std::optional<std::uint32_t> VolumeWalk::IDOf(kernel::Item& item, FolderNumber parent,
                                              const kernel::Spot& spot) const {
  if (parent != kNoParent && mTree.RegionOf(parent).device == item.device) {
    return mVolume.IDOfEntry(item.inode, mTree.RegionOf(parent));
  }
  if (mVolume.Kind().upperIDs == names::UpperIDs::kSubvolumes) kernel::ReadProof(item, spot);
  if (!mVolume.NeedsHandleForID(item)) return mVolume.IDOf(item);
  mQuestion.NoteError({EIO});
  return std::nullopt;
}

// `change` and `now` are the times before it was read.
void VolumeWalk::MarkAsRead(FolderNumber number, kernel::Nanoseconds change,
                            kernel::Nanoseconds now) {
  MarkAsSeen(number);
  FolderTree::Folder& folder = mTree[number];
  if (folder.isRead) return;
  folder.read = mKnown.walks;
  folder.isRead = !MayChangeUnseen(change, now);
}

// Has the folder read again next time, because something in it was not seen that may become visible
// without a change of the folder. For no folder: has the volume walked again from its places.
void VolumeWalk::Invalidate(FolderNumber folder) {
  if (folder == kNoParent) {
    mKnown.isWhole = false;
    mHasMissedStart = true;
    return;
  }
  mTree[folder].isRead = false;
  mTree[folder].checked = kNoWalk;
}

kernel::Result<kernel::Descriptor> VolumeWalk::OpenToRead(const kernel::Spot& spot) {
  ++mKnown.opened;
  return kernel::OpenForReading(spot);
}

// The folder at a known path, without links. Returns kNoVolume when something else is mounted
// there.
kernel::Result<VolumeWalk::HeldItem> VolumeWalk::HoldAt(const std::string& path) const {
  const bool isReachable = !path.empty() && mVolumes.IsReachable(mVolume.Listed(), path);
  if (!isReachable) return kernel::kNoVolume;
  auto held = kernel::HoldFolderWithoutLinks(path);
  if (!held) return held.Error();
  const auto status = kernel::ReadStatus(kernel::AtOpen(held->Get()));
  if (!status) return status.Error();
  return HeldItem{*std::move(held), status->item};
}

// Makes a folder the innermost open one. Returns false when it cannot be held, and when another has
// taken its place.
bool VolumeWalk::EnterFolder(FolderNumber folder) {
  while (!mOpen.empty() && mOpen.back().number != folder) mOpen.pop_back();
  if (!mOpen.empty()) return true;
  auto held = HoldAt(mTree.PathOf(folder));
  if (held && mTree.IsSame(folder, held->item)) {
    KeepOpen(folder, std::move(held->descriptor));
    return true;
  }
  if (held || held.Error() == kernel::kNoVolume) {
    mQuestion.NoteHidden();
  } else {
    mQuestion.NoteError(held.Error());
  }
  return false;
}

void VolumeWalk::KeepOpen(FolderNumber folder, kernel::Descriptor descriptor) {
  if (mOpen.size() == kMostOpenFolders) mOpen.erase(mOpen.begin());
  const bool holds = mVolumes.HoldsMountPoint(mTree.PathOf(folder));
  mOpen.push_back({folder, std::move(descriptor), holds});
}

}  // namespace tallowmere::catalog
