#include "catalog/Climbing.h"

#include <optional>
#include <utility>

#include "catalog/Finding.h"
#include "catalog/NameLookup.h"
#include "catalog/Views.h"
#include "foundation/PathText.h"
#include "names/HFSNames.h"

namespace tallowmere::catalog {
namespace {

// Whether the path by which a folder was held tells the names of all folders above it up to the
// volume's root: the walk stayed on the mount of the root, which the table places above it.
bool PathTellsNames(const Moment& moment, const HeldFolder& folder) {
  const volumes::Volume& volume = *folder.Volume();
  return moment.IsTableAsBefore() && !folder.IsRoot() && HasOneView(folder) &&
         volume.NumbersTellItemsApart() && folder.Item().mount == volume.Root().mount &&
         foundation::IsWithin(folder.Path(), volume.MountPoint());
}

// The remembered id of the folder that holds the one at a path; none when it is not remembered, or
// from another place.
std::optional<std::uint32_t> RememberedParent(Moment& moment, const volumes::Volume& volume,
                                              std::string_view path, std::uint32_t id) {
  if (foundation::FolderOf(path) == volume.MountPoint()) return names::kRootFolderID;
  const auto* const place = moment.Knowledge().LastPlaceOf(id, volume);
  const bool isKnown = place != nullptr && place->path == path && place->parent != 0 &&
                       place->parent != names::kRootFolderID;
  return isKnown ? std::optional(place->parent) : std::nullopt;
}

// One step along the path of a held folder, without a look.
std::optional<ClimbedFolder> StepAlongPath(Moment& moment, Moment::Climb climb) {
  const volumes::Volume& volume = *climb.folder.Volume();
  const std::string_view path = std::string_view(climb.folder.Path()).substr(0, climb.length);
  const std::string_view linuxName = *foundation::LastComponent(path);
  auto name = names::UnmistakableHFSName(linuxName, names::kLongestStr255Name);
  if (!name) return std::nullopt;
  const auto parent = RememberedParent(moment, volume, path, climb.id);
  if (!parent) return std::nullopt;
  climb.length = foundation::FolderOf(path).size();
  climb.id = *parent;
  moment.OpenClimb() = std::move(climb);
  return ClimbedFolder{*std::move(name), *parent};
}

// A folder and the folder that holds it.
struct Step {
  HeldFolder folder;
  Look look;
};

kernel::Result<Step> LookInHolder(Moment& moment, const HeldFolder& folder) {
  const auto look = LookAgain(moment, folder.Item(), folder.Path());
  if (!look) return look.Error();
  return Step{folder, *look};
}

// Of the places of a folder one where its own volume holds it, if there is one: a part of a volume
// can be mounted by itself.
Step PreferItsVolume(Moment& moment, Step step) {
  const volumes::Volume& volume = *step.folder.Volume();
  if (step.look.Folder().Volume()->Number() == volume.Number()) return step;
  for (const std::string& path :
       volume.Listed().PathsOf(step.folder.Path(), step.folder.Item().mount)) {
    const auto other = moment.HoldFolder(path);
    if (!other || !kernel::HaveSameNumbers(other->Item(), step.folder.Item())) continue;
    auto otherStep = LookInHolder(moment, *other);
    if (otherStep && otherStep->look.Folder().Volume()->Number() == volume.Number()) {
      return *std::move(otherStep);
    }
  }
  return step;
}

kernel::Result<ClimbedFolder> StepByLook(Moment& moment, const HeldFolder& folder) {
  if (folder.IsRoot()) {
    const auto name = folder.Volume()->Listed().Name();
    if (!name) return name.Error();
    return ClimbedFolder{std::string(*name), names::kParentOfRootID};
  }
  auto found = LookInHolder(moment, folder);
  if (!found) return found.Error();
  const Step step = PreferItsVolume(moment, *std::move(found));
  const HeldFolder& holder = step.look.Folder();
  const auto name = HFSNameOf(moment, step.look, names::kLongestStr255Name);
  if (!name) return name.Error();
  if (holder.Volume()->Number() != folder.Volume()->Number()) {
    return ClimbedFolder{*name, names::kParentOfRootID};
  }
  moment.Knowledge().RememberParent(step.folder.Place(), *holder.Volume(), holder.ID());
  moment.OpenClimb().reset();
  if (PathTellsNames(moment, holder)) {
    moment.OpenClimb() = Moment::Climb{holder, holder.Path().size(), holder.ID()};
  }
  return ClimbedFolder{*name, holder.ID()};
}

}  // namespace

kernel::Result<ClimbedFolder> ClimbFrom(Moment& moment, volumes::VolumeNumber number,
                                        std::uint32_t id) {
  const auto& climb = moment.OpenClimb();
  const bool goesOn = climb && climb->id == id && climb->folder.Volume()->Number() == number;
  if (goesOn) {
    if (auto step = StepAlongPath(moment, *climb)) return *std::move(step);
  }
  const auto folder = HoldFolderWithID(moment, number, id);
  if (!folder) return folder.Error();
  if (PathTellsNames(moment, *folder)) {
    auto step = StepAlongPath(moment, {*folder, folder->Path().size(), folder->ID()});
    if (step) return *std::move(step);
  }
  return StepByLook(moment, *folder);
}

}  // namespace tallowmere::catalog
