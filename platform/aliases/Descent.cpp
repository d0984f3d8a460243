#include "aliases/Descent.h"

#include <algorithm>
#include <cerrno>
#include <string_view>
#include <utility>
#include <vector>

#include "catalog/OwnNames.h"
#include "catalog/StoredNames.h"
#include "foundation/PathText.h"
#include "kernel/Contents.h"

namespace tallowmere::aliases {
namespace {

using catalog::HeldFolder;
using catalog::Look;
using catalog::Sighting;
using kernel::Result;

// As many as the kernel follows: path_resolution(7).
constexpr int kMostLinks = 40;

// The next step would leave the mount. It is no folder that is missing.
constexpr kernel::Error kOutside{-6};

kernel::Error OnTheWay(kernel::Error error) {
  if (error == kOutside) return kernel::kNotThere;
  const bool isMissing = kernel::MeansGone(error) || error.number == ENAMETOOLONG;
  return isMissing ? kernel::kNoFolder : error;
}

kernel::Error AtTheEnd(kernel::Error error) {
  return error == kOutside || error.number == ENAMETOOLONG ? kernel::kNotThere : error;
}

}  // namespace

Descent::Descent(catalog::Moment& moment, HeldFolder start)
    : mMoment(moment), mStart(std::move(start)) {}

// A kernel that tells no mounts tells devices, which change with each mount but for folders that
// are mounted a second time.
bool Descent::IsOnMount(const kernel::Item& item) const {
  const kernel::Item& start = mStart.Item();
  if (item.mount != start.mount) return false;
  return item.mount != kernel::kNoMount || item.device == start.device;
}

Result<HeldFolder> Descent::Above(const HeldFolder& folder) {
  auto above = Climb(folder);
  if (!above) return AtTheEnd(above.Error());
  return above;
}

Result<HeldFolder> Descent::Climb(const HeldFolder& folder) {
  if (folder.Path() == "/") return kOutside;
  auto above = mMoment.HoldFolder(foundation::FolderOf(folder.Path()));
  const bool isOutside = above ? !IsOnMount(above->Item()) : above.Error() == kernel::kNoVolume;
  if (isOutside) return kOutside;
  return above;
}

// The composed and the decomposed form, where the name itself is not there: the one item that has
// either.
Result<Look> Descent::LookUpOtherForms(const HeldFolder& folder, const std::string& name) {
  std::vector<Look> found;
  for (const std::string& form : OtherFormsOf(name)) {
    auto look = mMoment.LookUp(folder, form);
    if (catalog::IsMissing(look)) continue;
    if (!look) return look;
    found.push_back(*std::move(look));
  }
  const bool isCertain = std::all_of(found.begin(), found.end(), [&](const Look& look) {
    return catalog::AreSame(*folder.Volume(), found.front().Seen(), look.Seen());
  });
  if (found.empty() || !isCertain) return kernel::kNotThere;
  return found.back();
}

Result<Look> Descent::LookUp(const HeldFolder& folder, const std::string& name,
                             Way::Spelling spelling) {
  auto look = spelling == Way::Spelling::kHFS ? catalog::FindByOwnName(mMoment, folder, name)
                                              : mMoment.LookUp(folder, name);
  if (catalog::IsMissing(look) && spelling == Way::Spelling::kLinux) {
    look = LookUpOtherForms(folder, name);
  }
  return OnMount(std::move(look));
}

// What was found, under its stored name.
Result<Look> Descent::OnMount(Result<Look> look) {
  if (!look) return look;
  if (!IsOnMount(look->Item())) return kOutside;
  return catalog::AsStoredByFolder(mMoment, *look);
}

Result<HeldFolder> Descent::Enter(const Look& item) {
  if (kernel::IsLink(item.Item())) return Follow(item);
  if (!kernel::IsFolder(item.Item())) return kernel::kNoFolder;
  auto folder = mMoment.HoldFolderOf(item);
  if (folder && !IsOnMount(folder->Item())) return kOutside;
  return folder;
}

// A link's text has the kernel's meaning: empty components and "." stay where they are.
Result<HeldFolder> Descent::Follow(const Look& link) {
  if (++mLinks > kMostLinks) return kernel::Error{ELOOP};
  const auto text = kernel::ReadLink(link.Spot());
  if (!text) return text.Error();
  if (text->empty() || text->front() == '/') return kOutside;
  Result<HeldFolder> at = link.Folder();
  std::string_view rest = *text;
  while (at && !rest.empty()) {
    const std::string name(rest.substr(0, rest.find('/')));
    rest.remove_prefix(std::min(name.size() + 1, rest.size()));
    if (name.empty() || name == ".") continue;
    if (name == "..") {
      at = Climb(HeldFolder(*at));
      continue;
    }
    const auto next = OnMount(mMoment.LookUp(*at, name));
    at = next ? Enter(*next) : Result<HeldFolder>(next.Error());
  }
  return at;
}

Result<Sighting> Descent::Find(const Way& way) {
  mLinks = 0;
  HeldFolder at = mStart;
  if (way.components.empty()) return at.Place();
  const std::size_t last = way.components.size() - 1;
  for (std::size_t i = 0; i < last; ++i) {
    const auto item = LookUp(at, way.components[i], way.spelling);
    if (!item) return OnTheWay(item.Error());
    auto folder = Enter(*item);
    if (!folder) return OnTheWay(folder.Error());
    at = *std::move(folder);
  }
  const auto item = LookUp(at, way.components[last], way.spelling);
  if (!item) return AtTheEnd(item.Error());
  return item->Seen();
}

}  // namespace tallowmere::aliases
