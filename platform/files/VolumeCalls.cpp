#include <CoreServices/CoreServices.h>

#include "files/MountTable.h"
#include "files/PascalName.h"

namespace {

using tallowmere::files::MountTable;
using tallowmere::files::VolumePointer;

VolumePointer VolumeFor(long index, SInt16 number) {
  MountTable& table = MountTable::OfThisProcess();
  if (index < 0) return nullptr;
  return index == 0 ? table.WithNumber(number) : table.AtIndex(static_cast<std::size_t>(index - 1));
}

}  // namespace

OSErr PBHGetVInfoSync(HParmBlkPtr paramBlock) {
  HVolumeParam& block = paramBlock->volumeParam;
  const VolumePointer volume = VolumeFor(block.ioVolIndex, block.ioVRefNum);
  if (!volume) return nsvErr;
  if (block.ioNamePtr != nullptr) tallowmere::files::CopyToPascal(volume->Name(), block.ioNamePtr);
  block.ioVRefNum = volume->Number();
  return noErr;
}

OSErr PBGetVolumeInfoSync(FSVolumeInfoParamPtr paramBlock) {
  const VolumePointer volume = VolumeFor(paramBlock->volumeIndex, paramBlock->ioVRefNum);
  if (!volume) return nsvErr;
  paramBlock->ioVRefNum = volume->Number();
  return noErr;
}
