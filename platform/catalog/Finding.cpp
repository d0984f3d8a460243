#include "catalog/Finding.h"

#include <optional>
#include <utility>

#include "catalog/HandleLookup.h"
#include "foundation/PathText.h"
#include "kernel/Paths.h"

namespace tallowmere::catalog {

std::string LastPathOf(Moment& moment, const kernel::Item& reference) {
  const auto listed = moment.LastVolumes()->WithMount(reference.mount);
  const auto volume =
      listed ? listed->Enter() : kernel::Result<volumes::VolumePointer>(kernel::kNoVolume);
  const auto* const place =
      moment.Knowledge().LastPlaceOf(reference, volume ? volume->get() : nullptr);
  return place == nullptr ? std::string() : place->path;
}

kernel::Result<Look> LookAgain(Moment& moment, const kernel::Item& reference,
                               const std::string& path) {
  const auto holder = moment.HoldHolderOf(path);
  if (!holder) return holder.Error();
  const std::string name(*foundation::LastComponent(path));
  auto look = moment.LookUp(*holder, name);
  if (!look) return look;
  if (!IsItemOf(reference, look->Seen(), look->Spot())) {
    return kernel::kNotThere;
  }
  return look;
}

namespace {

// How often what a pass has found may be gone, or elsewhere, when it is looked at again.
constexpr int kMostPasses = 3;

// The canonical path if this very item is there.
std::optional<std::string> Verified(Moment& moment, const kernel::Item& reference,
                                    const std::string& path) {
  auto held = moment.HoldItem(path);
  const bool isThere =
      held && IsItemAt(reference, kernel::AtOpen(held->descriptor.Get()), held->path);
  if (!isThere) return std::nullopt;
  return std::move(held->path);
}

// Whether the item is the one with the id, now.
bool HasID(Moment& moment, const volumes::Volume& volume, std::uint32_t id, bool foldersOnly,
           Sighting& seen) {
  if (foldersOnly && !kernel::IsFolder(seen.item)) return false;
  if (volume.NeedsHandleForID(seen.item)) {
    kernel::ReadProof(seen.item, kernel::AtPath(seen.path.c_str()));
  }
  return volume.IDOf(seen.item) == id && moment.IsOnVolume(volume, seen);
}

// The item at a path if it is the one with the id.
std::optional<Sighting> SeeWithID(Moment& moment, const volumes::Volume& volume, std::uint32_t id,
                                  bool foldersOnly, const std::string& path) {
  auto seen = moment.See(path);
  if (!seen || !HasID(moment, volume, id, foldersOnly, *seen)) return std::nullopt;
  return *std::move(seen);
}

// The nearest folder to a former place, that place among them, that is still there and on the
// volume; else the volume's root folder. What is on another volume, by the spelling or behind a
// link, is not looked at: that one may not answer.
std::string NearestFolder(Moment& moment, const volumes::Volume& volume,
                          const std::string& formerPlace) {
  const auto volumes = moment.Volumes();
  const auto former = volumes->OfPath(formerPlace);
  const bool isNear =
      former && former->Number() == volume.Number() && kernel::IsNormalized(formerPlace);
  for (std::string path = formerPlace; isNear; path = foundation::FolderOf(path)) {
    if (volumes->IsReachable(*former, path)) {
      const auto held = moment.HoldFolder(path);
      if (held && held->Volume()->Number() == volume.Number()) return path;
    }
    if (path == "/") break;
  }
  return volume.MountPoint();
}

// What `check` makes of the path to an item that a pass finds; none when it finds none. The folders
// near a former place, of this item or another, are read first. A new moment begins with each pass.
template <class Check>
auto FindByPass(Moment& moment, const volumes::VolumePointer& volume, const SearchedItem& item,
                const std::string& near, const Check& check) -> decltype(check(near)) {
  for (int pass = 0; pass < kMostPasses; ++pass) {
    const std::string start = NearestFolder(moment, *volume, near);
    moment.Restart();
    const auto path = moment.Knowledge().SearchVolume(volume, item, start);
    if (!path) return std::nullopt;
    if (auto found = check(*path)) return found;
  }
  return std::nullopt;
}

// A volume and its root folder, where they are now.
struct LocatedVolume {
  volumes::VolumePointer volume;
  Sighting root;
};

// The kernel does not signal that a folder above a mount point was renamed, which can have left a
// link.
std::optional<LocatedVolume> LocateRoot(Moment& moment, volumes::VolumeNumber number) {
  for (const bool isLast : {false, true}) {
    const auto volume = moment.VolumeWithNumber(number);
    const auto root = volume ? kernel::HoldWithoutLinks((*volume)->MountPoint())
                             : kernel::Result<kernel::Descriptor>(volume.Error());
    const auto status = root ? kernel::ReadStatus(kernel::AtOpen(root->Get()))
                             : kernel::Result<kernel::Status>(root.Error());
    if (status && kernel::HaveSameNumbers(status->item, (*volume)->Root())) {
      Sighting seen{(*volume)->MountPoint(), status->item};
      if (moment.IsOnVolume(**volume, seen)) return LocatedVolume{*volume, std::move(seen)};
    }
    if (!isLast) moment.InvalidateVolumes();
  }
  return std::nullopt;
}

// Where the item of a reference is, when it is not where it was.
std::optional<std::string> SearchFor(Moment& moment, const kernel::Item& reference,
                                     const std::string& former) {
  const auto volume = moment.VolumeOf({former, reference});
  const auto located = volume ? LocateRoot(moment, (*volume)->Number()) : std::nullopt;
  if (!located) return std::nullopt;
  const HandleAnswer answer = AskForReference(*located->volume, reference);
  for (const Sighting& opened : answer.opened) {
    if (auto found = Verified(moment, reference, opened.path)) return found;
  }
  if (answer.isComplete && answer.opened.empty()) return std::nullopt;
  const SearchedItem wanted{located->volume->IDOf(reference), &reference,
                            kernel::IsFolder(reference)};
  return FindByPass(moment, located->volume, wanted, former,
                    [&](const std::string& path) { return Verified(moment, reference, path); });
}

void Remember(Moment& moment, const Sighting& seen) {
  const auto volume = moment.VolumeOf(seen);
  moment.Knowledge().Remember(seen.item, seen.path, volume ? volume->get() : nullptr);
}

// Of an id that only one item can have the place where it was seen last, if it is still there.
std::optional<Sighting> AtRememberedPlace(Moment& moment, const volumes::Volume& volume,
                                          std::uint32_t id) {
  if (!volume.IsCertain(id)) return std::nullopt;
  const auto* const place = moment.Knowledge().LastPlaceOf(id, volume);
  return place == nullptr ? std::nullopt
                          : SeeWithID(moment, volume, id, false, std::string(place->path));
}

// What a file system said of the items that have an id.
struct FoundByID {
  std::optional<Sighting> item;  // the only one
  bool isSettled;                // what is not told here is nowhere
};

// A file that was opened settles a question about folders.
FoundByID AskFileSystem(Moment& moment, const volumes::Volume& volume, std::uint32_t id,
                        bool foldersOnly) {
  const HandleAnswer answer = AskForID(volume, id);
  if (answer.opened.empty()) return {std::nullopt, answer.isComplete};
  const bool isOnly = answer.opened.size() == 1 && (answer.isComplete || volume.IsCertain(id));
  if (!isOnly) return {std::nullopt, false};
  const Sighting& opened = answer.opened.front();
  if (foldersOnly && !kernel::IsFolder(opened.item)) return {std::nullopt, true};
  auto seen = SeeWithID(moment, volume, id, foldersOnly, opened.path);
  const bool isSeen = seen.has_value();
  return {std::move(seen), isSeen};
}

std::optional<Sighting> FolderOnly(std::optional<Sighting> found, bool foldersOnly) {
  if (found && foldersOnly && !kernel::IsFolder(found->item)) return std::nullopt;
  return found;
}

std::optional<Sighting> LocateItem(Moment& moment, const volumes::VolumePointer& volume,
                                   std::uint32_t id, bool foldersOnly) {
  if (!names::CanBeNodeID(id) || id == names::kNoVolumeID) return std::nullopt;
  auto place = AtRememberedPlace(moment, *volume, id);
  if (place) return FolderOnly(std::move(place), foldersOnly);
  const auto located = LocateRoot(moment, volume->Number());
  if (!located) return std::nullopt;
  if (id == names::kRootFolderID) return located->root;
  FoundByID found = AskFileSystem(moment, *located->volume, id, foldersOnly);
  if (found.isSettled) return std::move(found.item);
  const std::string latest(moment.Knowledge().LatestPlace());
  return FindByPass(moment, located->volume, {id, nullptr, foldersOnly}, latest,
                    [&](const std::string& path) {
                      return SeeWithID(moment, *located->volume, id, foldersOnly, path);
                    });
}

// The folder with an id where it was last seen, by what the table said last: one folder held proves
// it.
std::optional<HeldFolder> HoldAtRememberedPlace(Moment& moment, volumes::VolumeNumber number,
                                                std::uint32_t id) {
  const auto listed = moment.LastVolumes()->WithNumber(number);
  const auto volume =
      listed ? listed->Enter() : kernel::Result<volumes::VolumePointer>(kernel::kNoVolume);
  if (!volume) return std::nullopt;
  if (const HeldFolder* const held = moment.HeldWithID((*volume)->Number(), id)) return *held;
  const auto* const place = moment.Knowledge().LastPlaceOf(id, **volume);
  if (place == nullptr) return std::nullopt;
  auto held = moment.HoldFolder(std::string(place->path));
  const bool isIt = held && held->ID() == id && held->Volume()->Number() == listed->Number() &&
                    held->Volume()->IsCertain(id);
  return isIt ? std::optional(*std::move(held)) : std::nullopt;
}

}  // namespace

kernel::Result<std::string> FindPathOf(Moment& moment, const kernel::Item& reference) {
  const std::string former = LastPathOf(moment, reference);
  auto path = former.empty() ? std::nullopt : Verified(moment, reference, former);
  if (!path) path = SearchFor(moment, reference, former);
  if (!path) return kernel::kNotThere;
  Remember(moment, {*path, reference});
  return *std::move(path);
}

kernel::Result<Sighting> FindItem(Moment& moment, const volumes::VolumePointer& volume,
                                  std::uint32_t id, bool foldersOnly) {
  auto found = LocateItem(moment, volume, id, foldersOnly);
  if (!found) return kernel::kNotThere;
  Remember(moment, *found);
  return *std::move(found);
}

kernel::Result<Sighting> FindItemWithoutPass(Moment& moment, const volumes::VolumePointer& volume,
                                             std::uint32_t id) {
  if (!names::CanBeNodeID(id)) return kernel::kNotThere;
  auto place = AtRememberedPlace(moment, *volume, id);
  if (!place) place = AskFileSystem(moment, *volume, id, false).item;
  if (!place) return kernel::kNotThere;
  Remember(moment, *place);
  return *std::move(place);
}

kernel::Result<HeldFolder> HoldFolderWithID(Moment& moment, volumes::VolumeNumber number,
                                            std::uint32_t id) {
  if (auto held = HoldAtRememberedPlace(moment, number, id)) return *std::move(held);
  const auto volume = moment.VolumeWithNumber(number);
  if (!volume) return volume.Error() == kernel::kNoVolume ? kernel::kNoVolume : kernel::kNoFolder;
  const auto place = FindItem(moment, *volume, id, true);
  if (!place) return kernel::kNoFolder;
  auto held = moment.HoldFolder(place->path);
  const bool isIt = held && held->ID() == id &&
                    kernel::HaveSameNumbers(held->Item(), place->item) &&
                    held->Item().mount == place->item.mount;
  if (!isIt) return kernel::kNoFolder;
  return held;
}

}  // namespace tallowmere::catalog
