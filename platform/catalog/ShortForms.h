// Looks up short forms, the names of items that have no own HFS name, in a folder.
#pragma once

#include <cstdint>
#include <string_view>
#include <vector>

#include "catalog/Moment.h"
#include "catalog/Sighting.h"
#include "kernel/Result.h"
#include "names/HFSNames.h"

namespace tallowmere::catalog {

// The id in an item's short form: kNoVolumeID for a mount point of something that is no volume.
std::uint32_t IDInShortForm(Moment& moment, const Look& item);

// One lookup of a short form in the views of a folder.
class ShortFormSearch {
 public:
  // REQUIRES: all outlive the search.
  ShortFormSearch(Moment& moment, const std::vector<HeldFolder>& views, std::string_view name);

  // Returns ENOENT when the name is no short form and when it fits no item or several, EIO when an
  // item that it could fit cannot be examined, otherwise the error of reading the folder.
  kernel::Result<Look> Find();

 private:
  bool CanStandForOne() const;
  bool IsShortFormOf(const names::ShortNameParts& parts, const Look& item);
  bool FindByNumber(const names::ShortNameParts& parts);
  kernel::Error SearchFolder(const HeldFolder& view);
  bool MayBeMeant(const HeldFolder& view, std::uint64_t inode,
                  const names::ShortNameParts& parts) const;
  void Offer(const HeldFolder& view, const names::ShortNameParts& parts, const char* linuxName);

  Moment& mMoment;
  const std::vector<HeldFolder>& mViews;
  std::string_view mName;
  std::vector<names::ShortNameParts> mReadings;
  std::vector<Look> mFound;  // no two of one item
  bool mIsHidden = false;    // an entry that could fit cannot be examined
};

}  // namespace tallowmere::catalog
