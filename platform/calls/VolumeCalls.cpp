#include <CoreServices/CoreServices.h>

#include "files/MountTable.h"
#include "files/PascalName.h"
#include "foundation/NoThrow.h"

using namespace tallowmere::files;
using tallowmere::foundation::OrError;

namespace {

VolumePointer VolumeFor(long index, SInt16 number) {
  MountTable& table = MountTable::OfThisProcess();
  if (index < 0) return nullptr;
  return index == 0 ? table.WithNumber(number) : table.AtIndex(static_cast<std::size_t>(index - 1));
}

}  // namespace

OSErr PBHGetVInfoSync(HParmBlkPtr paramBlock) {
  return OrError([&]() -> OSErr {
    HVolumeParam& block = paramBlock->volumeParam;
    const VolumePointer volume = VolumeFor(block.ioVolIndex, block.ioVRefNum);
    if (!volume) return nsvErr;
    if (block.ioNamePtr != nullptr) CopyToPascal(volume->Name(), block.ioNamePtr);
    block.ioVRefNum = volume->Number();
    return noErr;
  });
}

OSErr PBGetVolumeInfoSync(FSVolumeInfoParamPtr paramBlock) {
  return OrError([&]() -> OSErr {
    const VolumePointer volume = VolumeFor(paramBlock->volumeIndex, paramBlock->ioVRefNum);
    if (!volume) return nsvErr;
    paramBlock->ioVRefNum = volume->Number();
    return noErr;
  });
}
