#include "catalog/Climbing.h"

#include <algorithm>
#include <optional>
#include <utility>
#include <vector>

#include "catalog/Finding.h"
#include "catalog/NameLookup.h"
#include "catalog/Views.h"
#include "foundation/PathText.h"
#include "names/HFSNames.h"

namespace tallowmere::catalog {
namespace {

// Whether a held folder's path gives the names of all folders above it: the walk along it stayed on
// the mount of the volume's root, and letter case counts.
bool PathTellsNames(const Moment& moment, const HeldFolder& folder) {
  const volumes::Volume& volume = *folder.Volume();
  return moment.IsTableAsBefore() && !folder.IsRoot() && HasOneView(folder) &&
         volume.NumbersIdentifyItems() && !volume.Kind().ignoresCase &&
         folder.Item().mount == volume.Root().mount &&
         foundation::IsWithin(folder.Path(), volume.MountPoint());
}

// The path without its last component.
std::string_view ParentOf(std::string_view path) {
  return path.substr(0, std::max<std::size_t>(path.rfind('/'), 1));
}

// The remembered id of a folder's parent. Nullopt when it is not remembered, or for another path.
// The root must be remembered as a parent too, since the mount point can have been renamed.
std::optional<std::uint32_t> RememberedParent(Moment& moment, const volumes::Volume& volume,
                                              std::string_view path, std::uint32_t id) {
  const auto* const place = moment.Knowledge().LastPlaceOf(id, volume);
  const bool isInRoot = ParentOf(path) == volume.MountPoint();
  const bool isKnown = place != nullptr && place->path == path && place->parent != 0 &&
                       (place->parent == names::kRootFolderID) == isInRoot;
  return isKnown ? std::optional(place->parent) : std::nullopt;
}

// The steps of a climb from a held folder, the one below the root first, or nothing unless all are
// known. All or nothing, because a remembered parent can be another folder by now: looking that one
// up by its id, half-way, would leave the path.
std::vector<ClimbedFolder> StepsAlongPath(Moment& moment, const HeldFolder& folder) {
  if (!PathTellsNames(moment, folder)) return {};
  const volumes::Volume& volume = *folder.Volume();
  std::vector<ClimbedFolder> steps;
  std::uint32_t id = folder.ID();
  std::string_view path = folder.Path();
  for (; id != names::kRootFolderID; path = ParentOf(path)) {
    auto name =
        names::UnmistakableHFSName(path.substr(path.rfind('/') + 1), names::kLongestStr255Name);
    const auto parent = name ? RememberedParent(moment, volume, path, id) : std::nullopt;
    if (!parent) return {};
    steps.push_back({*std::move(name), *parent});
    id = *parent;
  }
  std::reverse(steps.begin(), steps.end());
  return steps;
}

// Takes the next step; the climb ends with the last. REQUIRES: a step is left.
ClimbedFolder TakeStep(std::optional<Moment::Climb>& climb) {
  ClimbedFolder step = std::move(climb->along.back());
  climb->along.pop_back();
  climb->id = step.parent;
  if (climb->along.empty()) climb.reset();
  return step;
}

// A folder, and the look at it in its parent.
struct Step {
  HeldFolder folder;
  Look look;
};

kernel::Result<Step> LookInHolder(Moment& moment, const HeldFolder& folder) {
  const auto look = LookAgain(moment, folder.Item(), folder.Path());
  if (!look) return look.Error();
  return Step{folder, *look};
}

// Prefers a place of the folder where its parent is on the same volume, if there is one: a part of
// a volume can be mounted by itself.
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
    moment.OpenClimb() = Moment::Climb{holder, holder.ID(), {}};
  }
  return ClimbedFolder{*name, holder.ID()};
}

}  // namespace

kernel::Result<ClimbedFolder> ClimbFrom(Moment& moment, volumes::VolumeNumber number,
                                        std::uint32_t id) {
  auto& climb = moment.OpenClimb();
  const bool goesOn = climb && climb->id == id && climb->folder.Volume()->Number() == number;
  if (goesOn && !climb->along.empty()) return TakeStep(climb);
  const auto folder =
      goesOn ? kernel::Result<HeldFolder>(climb->folder) : HoldFolderWithID(moment, number, id);
  if (!folder) return folder.Error();
  auto steps = StepsAlongPath(moment, *folder);
  if (steps.empty()) return StepByLook(moment, *folder);
  climb = Moment::Climb{*folder, id, std::move(steps)};
  return TakeStep(climb);
}

}  // namespace tallowmere::catalog
