// The File Manager's list of volumes.

#include <CoreServices/CoreServices.h>

#include <cstdint>

#include "calls/Process.h"
#include "calls/ResultCodes.h"
#include "foundation/NoThrow.h"
#include "names/PascalNames.h"

using namespace tallowmere;
using namespace tallowmere::calls;

namespace {

// Returns the next volume of the walk, or the first of a new walk. Null past the last.
volumes::ListedVolumePointer VolumeAt(std::size_t index) {
  WalkByIndex& walk = ThisProcess().walk;
  const bool goesOn = walk.volumes && index > 0 && index == walk.next;
  if (!goesOn) walk.volumes = ThisProcess().catalog.Table().Now();
  walk.next = index + 1;
  const auto& volumes = walk.volumes->InOrder();
  return index < volumes.size() ? volumes[index] : nullptr;
}

volumes::ListedVolumePointer FindVolume(std::int64_t index, SInt16 number) {
  if (index < 0) return nullptr;
  if (index > 0) return VolumeAt(static_cast<std::size_t>(index - 1));
  return InMoment(
      [number](catalog::Moment& moment) { return moment.Volumes()->WithNumber(number); });
}

}  // namespace

OSErr PBHGetVInfoSync(HParmBlkPtr paramBlock) {
  return foundation::OrError([&]() -> OSErr {
    HVolumeParam& block = paramBlock->volumeParam;
    const auto volume = FindVolume(block.ioVolIndex, block.ioVRefNum);
    if (!volume) return nsvErr;
    if (block.ioNamePtr != nullptr) {
      const auto name = volume->Name();
      if (!name) return ResultCodeOf(name.Error());
      names::CopyToPascal(*name, block.ioNamePtr);
    }
    block.ioVRefNum = volume->Number();
    return noErr;
  });
}

OSErr PBGetVolumeInfoSync(FSVolumeInfoParamPtr paramBlock) {
  return foundation::OrError([&]() -> OSErr {
    const auto volume = FindVolume(paramBlock->volumeIndex, paramBlock->ioVRefNum);
    if (!volume) return nsvErr;
    paramBlock->ioVRefNum = volume->Number();
    return noErr;
  });
}
