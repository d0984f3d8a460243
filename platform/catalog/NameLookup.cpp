#include "catalog/NameLookup.h"

#include <utility>
#include <vector>

#include "catalog/OwnNames.h"
#include "catalog/ShortForms.h"
#include "catalog/StoredNames.h"
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

// Whether only one item can have a short form, so that it need not be looked up: the id is one
// item's, and no item's own name is the same.
bool IsUnambiguous(Moment& moment, const std::vector<HeldFolder>& views, std::uint32_t id,
                   std::string_view shortForm) {
  if (views.size() > 1 || !names::IsInodeNumber(id)) return false;
  if (!views.front().Volume()->NumbersIdentifyItems()) return false;
  const names::SpelledNames spelled = names::SpellHFSName(shortForm);
  return spelled.decomposed.empty() && IsMissing(moment.LookUp(views.front(), spelled.precomposed));
}

// The first short form that finds the item.
kernel::Result<std::string> ShortFormOf(Moment& moment, const std::vector<HeldFolder>& views,
                                        const Look& item) {
  const volumes::Volume& volume = *item.Folder().Volume();
  const std::string_view linuxName = item.Name();
  const std::uint32_t id = IDInShortForm(moment, item);
  for (std::size_t marks = 1; marks <= names::kMostMarks; ++marks) {
    std::string name = names::ShortHFSName(linuxName, id, marks);
    if (IsUnambiguous(moment, views, id, name)) return name;
    const auto found = LookUpInViews(moment, views, name);
    if (found && AreSame(volume, found->Seen(), item.Seen())) return name;
    // On any other error, a later short form would be valid only for now.
    if (!found && !IsMissing(found)) return found.Error();
  }
  return kernel::kNotThere;
}

kernel::Result<Look> FindByText(Moment& moment, const HeldFolder& folder, std::string_view name) {
  if (!HasOneView(folder)) return LookUpInViews(moment, ViewsOf(moment, folder), name);
  auto look = FindByOwnName(moment, folder, name);
  if (!IsMissing(look) || names::ReadShortHFSName(name).empty()) return look;
  const std::vector<HeldFolder> views{folder};
  return ShortFormSearch(moment, views, name).Find();
}

// The item whose name is the very bytes, when they are not UTF-8; else what is known already.
kernel::Result<Look> FindByBytes(Moment& moment, const HeldFolder& folder, std::string_view name,
                                 kernel::Result<Look> known) {
  const std::string bytes = names::NameInBytes(name);
  return bytes.empty() ? std::move(known) : moment.LookUp(folder, bytes);
}

}  // namespace

kernel::Result<Look> LookUpHFSName(Moment& moment, const HeldFolder& folder,
                                   std::string_view name) {
  auto look = FindByText(moment, folder, name);
  const bool canBeBytes = folder.Volume()->Kind().namesCanBeMacRoman && IsMissing(look);
  return canBeBytes ? FindByBytes(moment, folder, name, std::move(look)) : look;
}

kernel::Result<std::string> HFSNameOf(Moment& moment, const Look& found, std::size_t limit) {
  const Look item = AsStored(moment, found);
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
