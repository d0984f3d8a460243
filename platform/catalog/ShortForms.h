// Short forms, which stand for items without an HFS name of their own: looked up in a folder.
#pragma once

#include <cstdint>
#include <string_view>
#include <vector>

#include "catalog/Moment.h"
#include "catalog/Sighting.h"
#include "kernel/Result.h"
#include "names/HFSNames.h"

namespace tallowmere::catalog {

// The id that a short form has for an item of a folder: kNoVolumeID for what is mounted there and
// on no volume.
std::uint32_t IDInShortForm(Moment& moment, const Look& item);

// One look-up of a short form in the views of a folder.
class ShortFormSearch {
 public:
  // REQUIRES: all outlive the search.
  ShortFormSearch(Moment& moment, const std::vector<HeldFolder>& views, std::string_view name);

  // ENOENT when the name is no short form, and when none or several items are meant; EIO when an
  // item that could be meant cannot be looked at; else the error of reading the folder.
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
  std::vector<Look> mFound;  // different items
  bool mIsHidden = false;    // an entry that could be meant cannot be looked at
};

}  // namespace tallowmere::catalog
