#include "aliases/Resolution.h"

#include <algorithm>
#include <array>
#include <functional>
#include <optional>
#include <utility>
#include <vector>

#include "aliases/Descent.h"
#include "catalog/Finding.h"
#include "names/NodeIDs.h"
#include "text/UnicodeForms.h"
#include "volumes/Volumes.h"

namespace tallowmere::aliases {
namespace {

using catalog::HeldFolder;
using catalog::Sighting;
using kernel::Result;
using volumes::ListedVolumePointer;

// What several searches for one target have found: their one item, or why there is none.
class Findings {
 public:
  void Add(Result<Resolved> found) {
    if (!found) {
      mError = Graver(mError, found.Error());
    } else if (!mItem) {
      mItem = std::move(*found);
    } else if (!AreSame(mItem->item, found->item)) {
      mIsUncertain = true;
    }
  }

  bool IsEmpty() const { return !mItem; }

  // The kernel may hide the item, and with it that there are two.
  bool IsSettled() const { return mItem || Rank(mError) == kOther; }

  Result<Resolved> Answer() const {
    if (mIsUncertain) return kernel::kNotThere;
    if (Rank(mError) == kOther || !mItem) return mError;
    return *mItem;
  }

 private:
  enum Gravity { kVolume, kItem, kFolder, kOther };
  static Gravity Rank(kernel::Error error) {
    if (error == kernel::kNoVolume) return kVolume;
    if (error == kernel::kNoFolder) return kFolder;
    return kernel::MeansGone(error) || error.number == ENAMETOOLONG ? kItem : kOther;
  }
  static kernel::Error Graver(kernel::Error one, kernel::Error other) {
    return Rank(other) > Rank(one) ? other : one;
  }

  // By their places too: there are volumes whose numbers do not tell items apart.
  static bool AreSame(const Sighting& first, const Sighting& second) {
    return kernel::HaveSameNumbers(first.item, second.item) && first.path == second.path;
  }

  std::optional<Resolved> mItem;
  bool mIsUncertain = false;
  kernel::Error mError = kernel::kNoVolume;
};

class Search {
 public:
  Search(catalog::Moment& moment, const Target& target) : mMoment(moment), mTarget(target) {}

  Findings Relative(const catalog::Look& file) {
    Findings findings;
    Descent descent(mMoment, file.Folder());
    Result<HeldFolder> top = file.Folder();
    for (std::size_t up = 1; top && up < mTarget.levels->up; ++up) top = descent.Above(*top);
    if (!top) {
      findings.Add(top.Error());
      return findings;
    }
    for (const Way& way : mTarget.ways) {
      const auto down = static_cast<std::ptrdiff_t>(mTarget.levels->down);
      const Way end{way.spelling, {way.components.end() - down, way.components.end()}};
      findings.Add(Admitted(Descent(mMoment, *top).Find(end), Found::kByLevels));
    }
    return findings;
  }

  Result<Resolved> OnVolumes() {
    const auto volumes = NamedVolumes();
    if (!volumes) return volumes.Error();
    Findings findings;
    for (const auto& volume : *volumes) findings.Add(OnVolume(*volume));
    return findings.Answer();
  }

 private:
  // The item, if it is of the target's kind.
  Result<Resolved> Admitted(Result<Sighting> found, Found by) const {
    if (!found) return found.Error();
    if (!mTarget.kinds.Admit(found->item)) return kernel::kNotThere;
    return Resolved{*std::move(found), by};
  }

  // --- Volumes ----------------------------------------------------------------------------------

  using Volumes = std::vector<ListedVolumePointer>;

  template <class AreEqual>
  Result<Volumes> VolumesNamed(const AreEqual& areEqual) {
    Volumes named;
    for (const auto& volume : mMoment.Volumes()->InOrder()) {
      const auto own = volume->FullName();
      if (!own) return own.Error();
      const auto& wanted = mTarget.volumeNames;
      const bool isNamed = std::any_of(wanted.begin(), wanted.end(),
                                       [&](const auto& name) { return areEqual(name, *own); });
      if (isNamed) named.push_back(volume);
    }
    return named;
  }

  // Of several, without those of a kind that the target's volume is not.
  Result<Volumes> NamedVolumes() {
    if (mTarget.volumeNames.empty()) return Volumes();
    auto named = VolumesNamed(std::equal_to<std::u16string_view>());
    if (named && named->empty()) named = VolumesNamed(text::EqualButForCase);
    if (named && named->size() > 1 && mTarget.isOnHFSPlus) {
      std::erase_if(*named, [](const auto& volume) { return IsForeign(volume->MountedType()); });
    }
    return named;
  }

  // Whether a file system is certainly none of HFS+.
  static bool IsForeign(const std::string& mountedType) {
    constexpr std::array kForeign = {"vfat", "msdos", "exfat", "ntfs", "ntfs3", "iso9660", "udf"};
    return std::find(kForeign.begin(), kForeign.end(), mountedType) != kForeign.end();
  }

  // The root folder where the table says that it is, else where it is by now.
  Result<HeldFolder> RootOf(const volumes::ListedVolume& volume) {
    auto root = mMoment.HoldFolder(volume.MountPoint());
    const bool isIt = root && root->Volume()->Number() == volume.Number();
    if (isIt || (!root && kernel::MeansRefused(root.Error()))) return root;
    root = catalog::HoldFolderWithID(mMoment, volume.Number(), names::kRootFolderID);
    return root ? root : kernel::kNoVolume;
  }

  Result<Resolved> OnVolume(const volumes::ListedVolume& volume) {
    const auto root = RootOf(volume);
    if (!root) return root.Error();
    Findings findings;
    for (const Way& way : mTarget.ways) {
      findings.Add(Admitted(Descent(mMoment, *root).Find(way), Found::kByPath));
    }
    if (mTarget.ways.empty()) findings.Add(kernel::kNotThere);
    if (findings.IsSettled() || !mTarget.ids || !HasCatalogIDs(*root)) return findings.Answer();
    auto byID = ByID(*root);
    return byID ? byID : findings.Answer();
  }

  // --- By id ------------------------------------------------------------------------------------

  static bool HasCatalogIDs(const HeldFolder& root) {
    const std::string_view kind = root.Volume()->Kind().name;
    return kind == "hfs" || kind == "hfsplus";
  }

  bool IsProved(const HeldFolder& root, const Sighting& seen) const {
    const kernel::Item& item = seen.item;
    return item.birthNanoseconds != kernel::kNoBirth && item.mount == root.Item().mount &&
           IsBirthOf(mTarget.ids->creation, item.birthSeconds);
  }

  Result<Resolved> ByID(const HeldFolder& root) {
    auto item = WithTargetID(root);
    if (!item) item = InFolderWithParentID(root);
    return item;
  }

  Result<Resolved> WithTargetID(const HeldFolder& root) {
    if (!mTarget.ids->target) return kernel::kNotThere;
    auto found = catalog::FindItem(mMoment, root.Volume(), *mTarget.ids->target, false);
    if (found && !IsProved(root, *found)) return kernel::kNotThere;
    return Admitted(std::move(found), Found::kByID);
  }

  Result<Resolved> InFolderWithParentID(const HeldFolder& root) {
    if (!mTarget.ids->parent) return kernel::kNotThere;
    const auto folder =
        catalog::HoldFolderWithID(mMoment, root.Volume()->Number(), *mTarget.ids->parent);
    if (!folder) return folder.Error();
    Findings findings;
    for (const Way& name : mTarget.names) {
      auto found = Descent(mMoment, *folder).Find(name);
      if (found && !IsProved(root, *found)) found = kernel::kNotThere;
      findings.Add(Admitted(std::move(found), Found::kByID));
    }
    return findings.Answer();
  }

  catalog::Moment& mMoment;
  const Target& mTarget;
};

}  // namespace

Result<Resolved> Resolve(catalog::Moment& moment, const catalog::Look* file, const Target& target) {
  Search search(moment, target);
  if (file != nullptr && target.levels) {
    const Findings relative = search.Relative(*file);
    if (relative.IsSettled()) return relative.Answer();
  }
  return search.OnVolumes();
}

}  // namespace tallowmere::aliases
