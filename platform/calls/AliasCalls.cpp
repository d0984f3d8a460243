#include <CoreServices/CoreServices.h>

#include "calls/References.h"
#include "kernel/Item.h"

using tallowmere::calls::Unpack;

OSErr FSResolveAliasFile(FSRef* item, Boolean, Boolean* targetIsFolder, Boolean* wasAliased) {
  const auto found = Unpack(item);
  if (!found) return fnfErr;
  if (targetIsFolder != nullptr) *targetIsFolder = tallowmere::kernel::IsFolder(*found);
  if (wasAliased != nullptr) *wasAliased = false;
  return noErr;
}

OSErr FSResolveAliasFileWithMountFlags(FSRef* item, Boolean resolveAliasChains,
                                       Boolean* targetIsFolder, Boolean* wasAliased,
                                       unsigned long) {
  return FSResolveAliasFile(item, resolveAliasChains, targetIsFolder, wasAliased);
}
