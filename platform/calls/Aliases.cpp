#include <CoreServices/CoreServices.h>
#include <sys/stat.h>

#include "files/ItemReference.h"

using tallowmere::files::Unpack;

OSErr FSResolveAliasFile(FSRef* item, Boolean, Boolean* targetIsFolder, Boolean* wasAliased) {
  const auto found = Unpack(item);
  if (!found) return fnfErr;
  if (targetIsFolder != nullptr) *targetIsFolder = S_ISDIR(found->type);
  if (wasAliased != nullptr) *wasAliased = false;
  return noErr;
}

OSErr FSResolveAliasFileWithMountFlags(FSRef* item, Boolean resolveAliasChains,
                                       Boolean* targetIsFolder, Boolean* wasAliased,
                                       unsigned long) {
  return FSResolveAliasFile(item, resolveAliasChains, targetIsFolder, wasAliased);
}
