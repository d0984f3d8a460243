#include "catalog/Moment.h"

#include <algorithm>
#include <climits>
#include <utility>

#include "foundation/PathText.h"
#include "kernel/Paths.h"

namespace tallowmere::catalog {
namespace {

// More are not kept beyond the call that holds them.
constexpr std::size_t kMostHeld = 8;
constexpr std::size_t kMostLooks = 8;

bool MeansNoDescriptors(kernel::Error error) {
  return error.number == EMFILE || error.number == ENFILE;
}

// Whether an error of a path without links says that there may be one.
bool MayBeALink(kernel::Error error) {
  return error.number == ELOOP || error.number == ENOTDIR;
}

// How often the item of a name may be replaced between a look at it and the reading of its handle.
constexpr int kMostReadings = 8;

// Whether an item of the folder shows another file system than the folder's: then its handle tells
// nothing of an id on the folder's volume, and it may have none.
bool IsOfAnother(const HeldFolder& folder, const kernel::Item& item) {
  const bool isMountedThere = item.mount == kernel::kNoMount || item.mount != folder.Item().mount;
  return isMountedThere && !kernel::SubvolumeOf(item.handle);
}

// The item at a spot in a folder, with its handle where its id follows from it. ENOENT where it has
// none.
kernel::Result<kernel::Item> ReadForID(const HeldFolder& folder, const kernel::Spot& spot) {
  const volumes::Volume& volume = *folder.Volume();
  for (int reading = 0; reading < kMostReadings; ++reading) {
    auto status = kernel::ReadStatus(spot);
    if (!status) return status.Error();
    if (!volume.NeedsHandleForID(status->item)) return status->item;
    kernel::ReadProof(status->item, spot);
    if (!volume.NeedsHandleForID(status->item)) return status->item;
    if (IsOfAnother(folder, status->item)) return status->item;
    if (status->item.handle.size == 0) break;
  }
  return kernel::kNotThere;
}

}  // namespace

Look::Look(HeldFolder folder, Sighting seen) {
  const std::size_t nameAt = seen.path.rfind('/') + 1;
  mState = std::make_shared<const State>(State{std::move(folder), std::move(seen), nameAt});
}

void Moment::Restart() {
  mClimb.reset();
  mLooks.clear();
  mHeld.clear();
  mVolumes = nullptr;
  mIsTableNew = false;
}

// --- Volumes ------------------------------------------------------------------------------------

void Moment::Poll() {
  const auto before = mCatalog.Table().AsLastRead();
  mVolumes = mCatalog.Table().Now();
  mIsTableNew = mIsTableNew || mVolumes != before;
}

volumes::VolumesPointer Moment::Volumes() {
  if (!mVolumes) Poll();
  return mVolumes;
}

volumes::VolumesPointer Moment::LastVolumes() {
  const auto& last = mCatalog.Table().AsLastRead();
  return last ? last : Volumes();
}

void Moment::InvalidateVolumes() {
  mCatalog.Table().Invalidate();
  mVolumes = nullptr;
}

// The kernel does not signal that a folder above a mount point was renamed: then the table is read
// once more.
kernel::Result<volumes::VolumePointer> Moment::VolumeWithNumber(volumes::VolumeNumber number) {
  for (const bool isLast : {false, true}) {
    const auto listed = Volumes()->WithNumber(number);
    if (!listed) return kernel::kNoVolume;
    auto entered = listed->Enter();
    if (entered || isLast || entered.Error() != volumes::ListedVolume::kMoved) return entered;
    InvalidateVolumes();
  }
  return kernel::kNoVolume;
}

bool Moment::IsMountHeld(int mount) const {
  return mount != kernel::kNoMount &&
         std::any_of(mHeld.begin(), mHeld.end(),
                     [mount](const auto& held) { return held.fact.Item().mount == mount; });
}

// As VolumeWithNumber reads the table once more.
kernel::Result<volumes::VolumePointer> Moment::FindVolume(const Sighting& seen) {
  for (const bool isLast : {false, true}) {
    const auto listed = mVolumes->OfItem(seen.item, seen.path);
    if (!listed) break;
    auto entered = listed->Enter();
    if (entered) return entered;
    if (isLast || entered.Error() != volumes::ListedVolume::kMoved) break;
    mCatalog.Table().Invalidate();
    Poll();
  }
  return kernel::kNoVolume;
}

kernel::Result<volumes::VolumePointer> Moment::VolumeOf(const Sighting& seen) {
  if (!mVolumes || !IsMountHeld(seen.item.mount)) Poll();
  return FindVolume(seen);
}

bool Moment::IsOnVolume(const volumes::Volume& volume, const Sighting& seen) {
  const auto found = VolumeOf(seen);
  return found && (*found)->Number() == volume.Number();
}

// --- Folders ------------------------------------------------------------------------------------

const HeldFolder* Moment::HeldAt(const std::string& path) const {
  for (const auto& held : mHeld) {
    if (held.fact.Path() == path) return &held.fact;
  }
  return nullptr;
}

const HeldFolder* Moment::HeldWithID(volumes::VolumeNumber volume, std::uint32_t id) const {
  for (const auto& held : mHeld) {
    const volumes::Volume& own = *held.fact.Volume();
    if (held.fact.ID() == id && own.Number() == volume && own.IsCertain(id)) return &held.fact;
  }
  return nullptr;
}

const HeldFolder* Moment::HeldFor(const kernel::Item& reference) const {
  for (const auto& held : mHeld) {
    const kernel::Item& known = held.reference.value_or(held.fact.Item());
    if (known.mount == reference.mount && kernel::IsProvedSame(known, reference)) {
      return &held.fact;
    }
  }
  return nullptr;
}

// Without descriptors a new moment begins.
template <class Call>
kernel::Result<kernel::Descriptor> Moment::Open(const Call& call) {
  auto descriptor = call();
  if (descriptor || !MeansNoDescriptors(descriptor.Error())) return descriptor;
  Restart();
  return call();
}

kernel::Result<HeldFolder> Moment::HoldFolder(const std::string& path) {
  if (!kernel::IsNormalized(path)) return kernel::Error{ELOOP};
  if (const HeldFolder* const held = HeldAt(path)) return *held;
  auto descriptor = Open([&] { return kernel::HoldFolderWithoutLinks(path); });
  if (!descriptor) return descriptor.Error();
  return Keep(path, *std::move(descriptor));
}

// Looks up the volume after the folder is held.
kernel::Result<HeldFolder> Moment::Keep(std::string path, kernel::Descriptor descriptor) {
  const kernel::Spot spot = kernel::AtOpen(descriptor.Get());
  auto status = kernel::ReadStatus(spot);
  if (!status) return status.Error();
  Sighting place{std::move(path), status->item};
  auto volume = VolumeOf(place);
  if (!volume) return volume.Error();
  if ((*volume)->NeedsHandleForID(place.item)) kernel::ReadProof(place.item, spot);
  HeldFolder held(std::move(place), std::move(descriptor), *std::move(volume));
  mCatalog.Remember(held.Item(), held.Path(), held.Volume().get());
  if (mHeld.size() < kMostHeld) mHeld.push_back({held, std::nullopt});
  return held;
}

kernel::Result<HeldFolder> Moment::HoldHolderOf(const std::string& path) {
  if (path == "/") return kernel::kNotThere;
  const std::string folder = foundation::FolderOf(path);
  auto held = HoldFolder(folder);
  if (held || !MayBeALink(held.Error())) return held;
  auto found = Open([&] { return kernel::HoldFollowing(kernel::AtPath(folder.c_str())); });
  return HoldAtRealPath(std::move(found), folder);
}

kernel::Result<HeldFolder> Moment::HoldFolderOf(const Look& folder) {
  if (const HeldFolder* const held = HeldAt(folder.Path())) return *held;
  auto descriptor = Open([&] { return kernel::HoldFolderIn(folder.Spot()); });
  if (!descriptor) return descriptor.Error();
  return Keep(folder.Path(), *std::move(descriptor));
}

kernel::Result<HeldFolder> Moment::HoldTargetOf(const Look& link) {
  auto found = Open([&] { return kernel::HoldFollowing(link.Spot()); });
  return HoldAtRealPath(std::move(found), link.Path());
}

// The folder that was found by following an absolute path, at its canonical path. A path that leads
// through a link of /proc can spell another folder than the one it leads to.
kernel::Result<HeldFolder> Moment::HoldAtRealPath(kernel::Result<kernel::Descriptor> found,
                                                  const std::string& path) {
  if (!found) return found.Error();
  const auto status = kernel::ReadStatus(kernel::AtOpen(found->Get()));
  if (!status) return status.Error();
  if (!kernel::IsFolder(status->item)) return kernel::Error{ENOTDIR};
  const auto real = kernel::RealPath(path);
  if (!real) return real.Error();
  auto held = HoldFolder(*real);
  if (!held) return held;
  const bool isSame = kernel::HaveSameNumbers(held->Item(), status->item) &&
                      held->Item().mount == status->item.mount;
  if (!isSame) return kernel::kNotThere;
  return held;
}

// --- Items --------------------------------------------------------------------------------------

kernel::Result<Look> Moment::LookUp(const HeldFolder& folder, std::string_view name) {
  std::string path = foundation::JoinPath(folder.Path(), name);
  if (path.size() >= PATH_MAX) return kernel::Error{ENAMETOOLONG};
  for (const auto& [look, reference] : mLooks) {
    const bool isSame =
        look.Path() == path && kernel::HaveSameNumbers(look.Folder().Item(), folder.Item());
    if (isSame) return look;
  }
  const kernel::Spot spot = folder.SpotOf(path.c_str() + path.size() - name.size());
  auto item = ReadForID(folder, spot);
  if (!item) return item.Error();
  Look look(folder, {std::move(path), *item});
  if (mLooks.size() == kMostLooks) mLooks.pop_back();
  mLooks.push_back({look, std::nullopt});
  return look;
}

kernel::Result<Moment::HeldItem> Moment::HoldItem(const std::string& path) {
  HeldItem held{path, {}};
  const auto hold = [&] { return kernel::HoldWithoutLinks(held.path); };
  auto item = kernel::IsNormalized(path) ? Open(hold)
                                         : kernel::Result<kernel::Descriptor>(kernel::Error{ELOOP});
  if (!item) {
    auto canonical = kernel::CanonicalPath(path);
    if (!canonical) return canonical.Error();
    held.path = *std::move(canonical);
    item = Open(hold);
  }
  if (!item) return item.Error();
  held.descriptor = *std::move(item);
  return kernel::Result<HeldItem>(std::move(held));
}

kernel::Result<Sighting> Moment::See(const std::string& path) {
  auto held = HoldItem(path);
  if (!held) return held.Error();
  const auto status = kernel::ReadStatus(kernel::AtOpen(held->descriptor.Get()));
  if (!status) return status.Error();
  return Sighting{std::move(held->path), status->item};
}

const Look* Moment::LookFor(const kernel::Item& reference) const {
  for (const auto& look : mLooks) {
    const kernel::Item& known = look.reference.value_or(look.fact.Item());
    if (known.mount == reference.mount && kernel::IsProvedSame(known, reference)) {
      return &look.fact;
    }
  }
  return nullptr;
}

// --- References ---------------------------------------------------------------------------------

kernel::Item Moment::Prove(const Look& look) {
  const kernel::Item reference = Proved(look.Seen(), *look.Folder().Volume(), look.Spot());
  const auto known = std::find_if(mLooks.begin(), mLooks.end(), [&](const auto& noted) {
    return noted.fact.Path() == look.Path() &&
           kernel::HaveSameNumbers(noted.fact.Item(), look.Item());
  });
  if (known != mLooks.end()) {
    known->reference = reference;
    std::rotate(mLooks.begin(), known, known + 1);
  }
  return reference;
}

kernel::Item Moment::Prove(const HeldFolder& folder) {
  const kernel::Item reference = Proved(folder.Place(), *folder.Volume(), folder.OwnSpot());
  for (auto& known : mHeld) {
    const bool isIt = known.fact.Path() == folder.Path() &&
                      kernel::HaveSameNumbers(known.fact.Item(), folder.Item());
    if (isIt) known.reference = reference;
  }
  return reference;
}

}  // namespace tallowmere::catalog
