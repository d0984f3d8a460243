#include "catalog/OwnNames.h"

#include <cstring>
#include <optional>

#include "foundation/PathText.h"
#include "kernel/FolderReader.h"
#include "kernel/Paths.h"
#include "names/HFSNames.h"

namespace tallowmere::catalog {
namespace {

// The only entry of a folder whose HFS form is `name`.
kernel::Result<Look> FindByForm(Moment& moment, const HeldFolder& folder, std::string_view name) {
  const auto open = kernel::OpenForReading(folder.SpotOf("."));
  if (!open) return open.Error();
  kernel::FolderReader reader(*open);
  std::optional<std::string> found;
  while (const kernel::Entry* const entry = reader.Next()) {
    if (names::PlainHFSName(entry->name, names::kLongestStr255Name) != name) continue;
    if (found) return kernel::kNotThere;
    found = entry->name;
  }
  if (reader.FailedBy().number != 0) return reader.FailedBy();
  if (!found) return kernel::kNotThere;
  return moment.LookUp(folder, *found);
}

}  // namespace

bool IsMissing(const kernel::Result<Look>& look) {
  return !look && (kernel::MeansGone(look.Error()) || look.Error().number == ENAMETOOLONG);
}

kernel::Result<Look> FindByOwnName(Moment& moment, const HeldFolder& folder,
                                   std::string_view name) {
  const names::SpelledNames spelled = names::SpellHFSName(name);
  if (spelled.precomposed.empty()) return kernel::kNotThere;
  auto look = moment.LookUp(folder, spelled.precomposed);
  if (spelled.decomposed.empty()) return look;
  if (IsMissing(look)) look = moment.LookUp(folder, spelled.decomposed);
  if (IsMissing(look)) look = FindByForm(moment, folder, name);
  return look;
}

bool HasOwnName(Moment& moment, const HeldFolder& folder, const Sighting& item, std::size_t limit) {
  const auto name = names::PlainHFSName(*foundation::LastComponent(item.path), limit);
  if (!name) return false;
  const auto found = FindByOwnName(moment, folder, *name);
  return found && AreSame(*folder.Volume(), found->Seen(), item);
}

}  // namespace tallowmere::catalog
