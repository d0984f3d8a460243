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
  const auto holder = moment.HoldParentOf(path);
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

// How many passes to make when the item that a pass found has moved before it was verified.
constexpr int kMostPasses = 3;

// The canonical path of a reference's item, if it is at `path`.
std::optional<std::string> Verified(Moment& moment, const kernel::Item& reference,
                                    const std::string& path) {
  auto held = moment.HoldItem(path);
  const bool isThere =
      held && IsItemAt(reference, kernel::AtOpen(held->descriptor.Get()), held->path);
  if (!isThere) return std::nullopt;
  return std::move(held->path);
}

// Whether an item has the id now.
bool HasID(Moment& moment, const volumes::Volume& volume, std::uint32_t id, bool foldersOnly,
           Sighting& seen) {
  if (foldersOnly && !kernel::IsFolder(seen.item)) return false;
  if (volume.NeedsHandleForID(seen.item)) {
    kernel::ReadProof(seen.item, kernel::AtPath(seen.path.c_str()));
  }
  return volume.IDOf(seen.item) == id && moment.IsOnVolume(volume, seen);
}

// The item at a path, if it has the id.
std::optional<Sighting> SeeWithID(Moment& moment, const volumes::Volume& volume, std::uint32_t id,
                                  bool foldersOnly, const std::string& path) {
  auto seen = moment.See(path);
  if (!seen || !HasID(moment, volume, id, foldersOnly, *seen)) return std::nullopt;
  return *std::move(seen);
}

// The innermost folder of a former place, that place included, that still exists on the volume;
// otherwise the volume's root folder. Never looks at other volumes, by spelling or through links:
// their servers may not answer.
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

// Makes passes until `check` accepts the path that one finds, and returns its result. Reads folders
// near `near` first. Each pass restarts the moment.
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

// A volume and its root folder, at their present place.
struct LocatedVolume {
  volumes::VolumePointer volume;
  Sighting root;
};

// Reads the table once more if needed: the kernel does not signal that a folder above a mount point
// was renamed, perhaps leaving a link.
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

// Finds a reference's item that is no longer at its former place.
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

// The item with an id at its remembered place, for ids that only one item can have.
std::optional<Sighting> AtRememberedPlace(Moment& moment, const volumes::Volume& volume,
                                          std::uint32_t id) {
  if (!volume.IsCertain(id)) return std::nullopt;
  const auto* const place = moment.Knowledge().LastPlaceOf(id, volume);
  return place == nullptr ? std::nullopt
                          : SeeWithID(moment, volume, id, false, std::string(place->path));
}

// The file system's answer about an id.
struct FoundByID {
  std::optional<Sighting> item;  // if exactly one
  bool isSettled;                // an item not given does not exist
};

// With `foldersOnly`, a file that has the id settles the question too.
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

// The folder with an id at its remembered place, by the mount table as last read: holding the
// folder verifies both.
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
