#include "Source/LegacyHFSBridge.h"
#include "service/Commands.h"
#include "service/Protocol.h"

namespace tallowmere::service {

void GetVolRefnumByHFSName(Channel& channel) {
  char name[protocol::kLongestVolumeName + 1];
  channel.TakeCounted(name, protocol::kLongestVolumeName);
  if (channel.Failed()) return;

  const std::int16_t number = CFileUtilGetVolRefnumByHFSName(name);

  channel.Put(number);
}

void GetHFSVolumeName(Channel& channel) {
  const auto number = channel.Take<std::int16_t>();
  if (channel.Failed()) return;

  char name[protocol::kLongestVolumeName];
  const bool found = CFileUtilGetHFSVolumeName(number, name);

  channel.PutFlag(found);
  channel.PutString(name);
}

}  // namespace tallowmere::service
