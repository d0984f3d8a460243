#include "catalog/ShortForms.h"

#include <algorithm>

#include "catalog/Finding.h"
#include "catalog/OwnNames.h"
#include "foundation/PathText.h"
#include "kernel/FolderReader.h"
#include "kernel/Paths.h"

namespace tallowmere::catalog {
namespace {

// Whether a short form, read in one way, is that of an item called `linuxName`.
bool StandsFor(const names::ShortNameParts& parts, std::string_view name, const char* linuxName) {
  for (std::size_t marks = 1; marks <= parts.marks; ++marks) {
    if (names::ShortHFSName(linuxName, parts.nodeID, marks) == name) return true;
  }
  return false;
}

std::string NameOf(const Sighting& item) {
  return std::string(*foundation::LastComponent(item.path));
}

// Whether entries of the folder can have other inode numbers than their items: on some kinds of
// file system, and where something is mounted.
bool EntriesMayDiffer(Moment& moment, const HeldFolder& folder) {
  if (!folder.Volume()->Kind().entriesTellNumbers) return true;
  const auto seen = moment.See(folder.Path());
  return !seen || moment.Volumes()->HoldsMountPoint(seen->path);
}

}  // namespace

std::uint32_t IDInShortForm(Moment& moment, const Look& item) {
  const volumes::Volume& volume = *item.Folder().Volume();
  const bool isOnVolume = item.Item().mount == item.Folder().Item().mount ||
                          static_cast<bool>(moment.VolumeOf(item.Seen()));
  return isOnVolume ? volume.IDOf(item.Item()) : names::kNoVolumeID;
}

ShortFormSearch::ShortFormSearch(Moment& moment, const std::vector<HeldFolder>& views,
                                 std::string_view name)
    : mMoment(moment), mViews(views), mName(name), mReadings(names::ReadShortHFSName(name)) {}

kernel::Result<Look> ShortFormSearch::Find() {
  if (mReadings.empty() || !CanStandForOne()) return kernel::kNotThere;
  if (mReadings.size() == 1 && FindByNumber(mReadings.front())) return mFound.front();
  for (const HeldFolder& view : mViews) {
    const kernel::Error error = SearchFolder(view);
    if (error.number != 0) return error;
  }
  if (mIsHidden) return kernel::Error{EIO};
  if (mFound.size() != 1) return kernel::kNotThere;
  return mFound.front();
}

// Whether any item could have this short form: one without an own name, or with a long one.
bool ShortFormSearch::CanStandForOne() const {
  return mViews.size() > 1 || names::CanBeShortForm(mName) ||
         !names::SpellHFSName(mName).decomposed.empty();
}

bool ShortFormSearch::IsShortFormOf(const names::ShortNameParts& parts, const Look& item) {
  const std::string linuxName = NameOf(item.Seen());
  if (!StandsFor(parts, mName, linuxName.c_str())) return false;
  const bool hadOne =
      item.Folder().Volume()->Kind().longNamesHadShortForms && names::HadShortForm(linuxName);
  return hadOne || !HasOwnName(mMoment, mViews.front(), item.Seen(), names::kLongestSpecName);
}

// Tries to find the item without reading the folder.
bool ShortFormSearch::FindByNumber(const names::ShortNameParts& parts) {
  const auto volume = mViews.front().Volume();
  const auto item = FindItemWithoutPass(mMoment, volume, parts.nodeID);
  if (!item) return false;
  for (const HeldFolder& view : mViews) {
    auto look = mMoment.LookUp(view, NameOf(*item));
    if (!look || !AreSame(*volume, look->Seen(), *item)) continue;
    if (IDInShortForm(mMoment, *look) != parts.nodeID) return false;
    if (!IsShortFormOf(parts, *look)) return false;
    mFound.push_back(*std::move(look));
    return true;
  }
  return false;
}

// Returns error number 0 when the whole folder was read.
kernel::Error ShortFormSearch::SearchFolder(const HeldFolder& view) {
  const auto open = kernel::OpenForReading(view.SpotOf("."));
  if (!open) return open.Error();
  const bool mayDiffer = EntriesMayDiffer(mMoment, view);
  kernel::FolderReader reader(*open);
  while (const kernel::Entry* const entry = reader.Next()) {
    const bool isOther = entry->kind == kernel::Entry::Kind::kOther;
    for (const names::ShortNameParts& parts : mReadings) {
      if (isOther && !mayDiffer && !MayBeMeant(view, entry->inode, parts)) continue;
      if (StandsFor(parts, mName, entry->name)) Offer(view, parts, entry->name);
    }
  }
  return reader.FailedBy();
}

// Whether an entry with its item's inode number has the id.
bool ShortFormSearch::MayBeMeant(const HeldFolder& view, std::uint64_t inode,
                                 const names::ShortNameParts& parts) const {
  return view.Volume()->IDOfEntry(inode, view.Item()) == parts.nodeID;
}

void ShortFormSearch::Offer(const HeldFolder& view, const names::ShortNameParts& parts,
                            const char* linuxName) {
  const auto item = mMoment.LookUp(view, linuxName);
  if (!item) {
    mIsHidden = mIsHidden || item.Error() != kernel::kNotThere;
    return;
  }
  if (IDInShortForm(mMoment, *item) != parts.nodeID) return;
  const bool isKnown = std::any_of(mFound.begin(), mFound.end(), [&](const Look& found) {
    return AreSame(*view.Volume(), found.Seen(), item->Seen());
  });
  if (!isKnown && IsShortFormOf(parts, *item)) mFound.push_back(*item);
}

}  // namespace tallowmere::catalog
