// The File Manager's question about a folder by its id.

#include <CoreServices/CoreServices.h>

#include "calls/Process.h"
#include "calls/ResultCodes.h"
#include "catalog/Climbing.h"
#include "foundation/NoThrow.h"
#include "names/PascalNames.h"

using namespace tallowmere;
using namespace tallowmere::calls;

OSErr PBGetCatInfoSync(CInfoPBPtr paramBlock) {
  return foundation::OrError([&]() -> OSErr {
    DirInfo& block = paramBlock->dirInfo;
    if (block.ioFDirIndex != -1) return paramErr;
    return InMoment([&](catalog::Moment& moment) -> OSErr {
      const auto folder =
          catalog::ClimbFrom(moment, block.ioVRefNum, static_cast<UInt32>(block.ioDrDirID));
      if (!folder) return ResultCodeOfFolder(folder.Error());
      if (block.ioNamePtr != nullptr) names::CopyToPascal(folder->name, block.ioNamePtr);
      block.ioDrParID = static_cast<SInt32>(folder->parent);
      return noErr;
    });
  });
}
