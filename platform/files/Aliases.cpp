#include <CoreServices/CoreServices.h>
#include <sys/stat.h>

#include "files/ItemReference.h"

using tallowmere::files::Unpack;

OSErr FSResolveAliasFile(FSRef* reference, Boolean, Boolean* targetIsFolder, Boolean* wasAliased) {
  const auto item = Unpack(reference);
  if (!item) return fnfErr;
  if (targetIsFolder != nullptr) *targetIsFolder = S_ISDIR(item->type);
  if (wasAliased != nullptr) *wasAliased = false;
  return noErr;
}

OSErr FSResolveAliasFileWithMountFlags(FSRef* reference, Boolean resolveAliasChains,
                                       Boolean* targetIsFolder, Boolean* wasAliased,
                                       unsigned long) {
  return FSResolveAliasFile(reference, resolveAliasChains, targetIsFolder, wasAliased);
}
