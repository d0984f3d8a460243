#include "catalog/Views.h"

#include <algorithm>
#include <string>

namespace tallowmere::catalog {
namespace {

// The folder's path in the mount table: since it was held, folders on its path can have become
// links.
std::string CanonicalPathOf(Moment& moment, const HeldFolder& folder) {
  const auto seen = moment.See(folder.Path());
  const bool isStillThere = seen && kernel::HaveSameNumbers(seen->item, folder.Item()) &&
                            seen->item.mount == folder.Item().mount;
  return isStillThere ? seen->path : folder.Path();
}

bool HidesSomething(Moment& moment, const std::vector<std::string>& paths) {
  const auto volumes = moment.Volumes();
  return std::any_of(paths.begin(), paths.end(),
                     [&](const std::string& path) { return volumes->HoldsMountPoint(path); });
}

}  // namespace

bool HasOneView(const HeldFolder& folder) {
  return folder.Volume()->Listed().MountPoints().size() == 1;
}

std::vector<HeldFolder> ViewsOf(Moment& moment, const HeldFolder& folder) {
  if (HasOneView(folder)) return {folder};
  const std::string path = CanonicalPathOf(moment, folder);
  const auto paths = folder.Volume()->Listed().PathsOf(path, folder.Item().mount);
  if (paths.size() < 2 || !HidesSomething(moment, paths)) return {folder};
  std::vector<HeldFolder> views;
  for (const std::string& place : paths) {
    auto view = moment.HoldFolder(place);
    if (view && kernel::HaveSameNumbers(view->Item(), folder.Item())) {
      views.push_back(*std::move(view));
    }
  }
  if (views.empty()) views.push_back(folder);
  return views;
}

}  // namespace tallowmere::catalog
