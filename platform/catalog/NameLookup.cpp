#include "catalog/NameLookup.h"

#include <utility>
#include <vector>

#include "catalog/OwnNames.h"
#include "catalog/ShortForms.h"
#include "catalog/Views.h"
#include "foundation/PathText.h"
#include "names/HFSNames.h"

namespace tallowmere::catalog {
namespace {

kernel::Result<Look> LookUpInViews(Moment& moment, const std::vector<HeldFolder>& views,
                                   std::string_view name) {
  auto look = FindByOwnName(moment, views.front(), name);
  return IsMissing(look) ? ShortFormSearch(moment, views, name).Find() : look;
}

// Whether a short form can be no other item's, so that it need not be looked up: no two items have
// the id, and nothing is really called so.
bool IsItsAlone(Moment& moment, const std::vector<HeldFolder>& views, std::uint32_t id,
                std::string_view shortForm) {
  if (views.size() > 1 || !names::IsInodeNumber(id)) return false;
  if (!views.front().Volume()->NumbersTellItemsApart()) return false;
  const names::SpelledNames spelled = names::SpellHFSName(shortForm);
  return spelled.decomposed.empty() && IsMissing(moment.LookUp(views.front(), spelled.precomposed));
}

// The first short form by which the item is found.
kernel::Result<std::string> ShortFormOf(Moment& moment, const std::vector<HeldFolder>& views,
                                        const Look& item) {
  const volumes::Volume& volume = *item.Folder().Volume();
  const std::string_view linuxName = item.Name();
  const std::uint32_t id = IDInShortForm(moment, item);
  for (std::size_t marks = 1; marks <= names::kMostMarks; ++marks) {
    std::string name = names::ShortHFSName(linuxName, id, marks);
    if (IsItsAlone(moment, views, id, name)) return name;
    const auto found = LookUpInViews(moment, views, name);
    if (found && AreSame(volume, found->Seen(), item.Seen())) return name;
    // Another short form would be one for now.
    if (!found && !IsMissing(found)) return found.Error();
  }
  return kernel::kNotThere;
}

}  // namespace

kernel::Result<Look> LookUpHFSName(Moment& moment, const HeldFolder& folder,
                                   std::string_view name) {
  if (!HasOneView(folder)) return LookUpInViews(moment, ViewsOf(moment, folder), name);
  auto look = FindByOwnName(moment, folder, name);
  if (!IsMissing(look) || names::ReadShortHFSName(name).empty()) return look;
  const std::vector<HeldFolder> views{folder};
  return ShortFormSearch(moment, views, name).Find();
}

kernel::Result<std::string> HFSNameOf(Moment& moment, const Look& item, std::size_t limit) {
  const std::string_view linuxName = item.Name();
  auto unmistakable = names::UnmistakableHFSName(linuxName, limit);
  if (unmistakable && HasOneView(item.Folder())) return *std::move(unmistakable);
  const std::vector<HeldFolder> views = ViewsOf(moment, item.Folder());
  if (unmistakable && views.size() == 1) return *std::move(unmistakable);
  if (HasOwnName(moment, views.front(), item.Seen(), limit)) {
    return *names::PlainHFSName(linuxName, limit);
  }
  return ShortFormOf(moment, views, item);
}

}  // namespace tallowmere::catalog
