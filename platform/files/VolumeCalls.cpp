#include <CoreServices/CoreServices.h>

#include <algorithm>

#include "files/MountTable.h"

namespace {

using tallowmere::files::MountTable;
using tallowmere::files::Volume;

const Volume* VolumeFor(long index, SInt16 number) {
  MountTable& table = MountTable::OfThisProcess();
  if (index < 0) return nullptr;
  return index == 0 ? table.WithNumber(number) : table.AtIndex(static_cast<std::size_t>(index - 1));
}

void CopyName(const std::string& name, StringPtr destination) {
  destination[0] = static_cast<unsigned char>(name.size());
  std::copy(name.begin(), name.end(), destination + 1);
}

}  // namespace

OSErr PBHGetVInfoSync(HParmBlkPtr paramBlock) {
  HVolumeParam& block = paramBlock->volumeParam;
  const Volume* volume = VolumeFor(block.ioVolIndex, block.ioVRefNum);
  if (volume == nullptr) return nsvErr;
  if (block.ioNamePtr != nullptr) CopyName(volume->Name(), block.ioNamePtr);
  block.ioVRefNum = volume->Number();
  return noErr;
}

OSErr PBGetVolumeInfoSync(FSVolumeInfoParamPtr paramBlock) {
  const Volume* volume = VolumeFor(paramBlock->volumeIndex, paramBlock->ioVRefNum);
  if (volume == nullptr) return nsvErr;
  paramBlock->ioVRefNum = volume->Number();
  return noErr;
}
