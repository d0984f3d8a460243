#include <CoreServices/CoreServices.h>

#include <algorithm>

#include "service/Commands.h"
#include "service/Protocol.h"

namespace tallowmere::service {
namespace {

bool SameName(ConstStr255Param a, ConstStr255Param b) {
  return std::equal(a, a + 1 + a[0], b, b + 1 + b[0]);
}

std::int16_t VolumeNamed(ConstStr255Param wanted) {
  Str255 name;
  HParamBlockRec block{};
  for (SInt16 index = 1;; ++index) {
    block.volumeParam.ioNamePtr = name;
    block.volumeParam.ioVRefNum = 0;
    block.volumeParam.ioVolIndex = index;
    if (PBHGetVInfoSync(&block) != noErr) return protocol::kNoVolume;
    if (SameName(name, wanted)) return block.volumeParam.ioVRefNum;
  }
}

}  // namespace

void GetVolRefnumByHFSName(Channel& channel) {
  char name[protocol::kLongestVolumeName + 1];
  channel.TakeCounted(name, protocol::kLongestVolumeName);
  if (channel.Failed()) return;

  Str255 wanted;
  c2pstrcpy(wanted, name);
  const std::int16_t number = VolumeNamed(wanted);

  channel.Put(number);
}

void GetHFSVolumeName(Channel& channel) {
  const auto number = channel.Take<std::int16_t>();
  if (channel.Failed()) return;

  Str255 name = {};
  HParamBlockRec block{};
  block.volumeParam.ioNamePtr = name;
  block.volumeParam.ioVRefNum = number;
  const bool found = PBHGetVInfoSync(&block) == noErr;
  if (found) P2CStr(name);

  channel.PutFlag(found);
  channel.PutString(reinterpret_cast<const char*>(name));
}

}  // namespace tallowmere::service
