// Goes down a path from a folder without ever leaving the folder's mount: over no mount point, by
// no link with an absolute target, and above the top of the mount by none. What openat2(2) does
// with RESOLVE_BENEATH and RESOLVE_NO_XDEV, step by step, since a name can have several spellings.
#pragma once

#include <string>

#include "aliases/Target.h"
#include "catalog/Moment.h"
#include "catalog/Sighting.h"
#include "kernel/Result.h"

namespace tallowmere::aliases {

class Descent {
 public:
  // REQUIRES: the moment outlives the descent.
  Descent(catalog::Moment& moment, catalog::HeldFolder start);

  // One folder further up; ENOENT at the top of the mount.
  kernel::Result<catalog::HeldFolder> Above(const catalog::HeldFolder& folder);

  // The item at the end of a way from the start, itself not followed when it is a link. Its path
  // has the names that the folders store. kNoFolder when a folder on the way is missing, ENOENT
  // when the item is, or lies outside, or when a name is that of two items.
  kernel::Result<catalog::Sighting> Find(const Way& way);

 private:
  bool IsOnMount(const kernel::Item& item) const;
  kernel::Result<catalog::Look> OnMount(kernel::Result<catalog::Look> look);
  kernel::Result<catalog::Look> LookUp(const catalog::HeldFolder& folder, const std::string& name,
                                       Way::Spelling spelling);
  kernel::Result<catalog::Look> LookUpOtherForms(const catalog::HeldFolder& folder,
                                                 const std::string& name);
  kernel::Result<catalog::HeldFolder> Climb(const catalog::HeldFolder& folder);
  kernel::Result<catalog::HeldFolder> Enter(const catalog::Look& item);
  kernel::Result<catalog::HeldFolder> Follow(const catalog::Look& link);

  catalog::Moment& mMoment;
  catalog::HeldFolder mStart;
  int mLinks = 0;  // followed in this search
};

}  // namespace tallowmere::aliases
