#include "calls/ResultCodes.h"

#include "aliases/AliasFile.h"

namespace tallowmere::calls {

OSErr ResultCodeOf(kernel::Error error) {
  if (error == kernel::kNoVolume) return nsvErr;
  if (error == kernel::kNoFolder) return dirNFErr;
  if (kernel::MeansGone(error) || error.number == ENAMETOOLONG) return fnfErr;
  return kernel::MeansRefused(error) ? afpAccessDenied : ioErr;
}

OSErr ResultCodeOfFolder(kernel::Error error) {
  const OSErr code = ResultCodeOf(error);
  return code == fnfErr ? static_cast<OSErr>(dirNFErr) : code;
}

OSErr ResultCodeOfAlias(kernel::Error error) {
  return error == aliases::kBroken ? static_cast<OSErr>(paramErr) : ResultCodeOf(error);
}

}  // namespace tallowmere::calls
