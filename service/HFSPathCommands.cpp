#include <CFileRef.h>
#include <LegacyHFSBridge.h>
#include <Tallowmere/Process.h>

#include <algorithm>
#include <cstring>

#include "service/Commands.h"
#include "service/Protocol.h"

namespace tallowmere::service {

// A size too small for the path keeps the service busy for ever: see CFileUtilMakeFullPath.
void MakeFullPath(Channel& channel) {
  auto path = channel.TakeAllocated();
  const auto size = channel.Take<std::uint16_t>();
  if (size > protocol::kLongestHFSName) channel.Fail();
  const auto flag = channel.Take<std::uint8_t>();
  if (channel.Failed()) return;

  process::MomentScope moment;
  CFileRef item;
  item.Set(path.get(), false);
  path.reset();
  char fullPath[protocol::kLongestHFSName];
  fullPath[0] = '\0';
  const unsigned short length =
      CFileUtilMakeFullPath(item, size == 0 ? nullptr : fullPath, size, flag);
  moment.End();

  // After the NUL come uninitialised bytes or, without the flag, the folders that were cut off.
  std::fill(fullPath + std::strlen(fullPath), fullPath + size, '\0');

  channel.Put<std::uint16_t>(length);
  channel.PutBytes(fullPath, size);
}

void MakeFileRefFromPath(Channel& channel) {
  // With the flag, the folder is two strings. A missing second one needs a NUL too.
  const auto folder = channel.TakeAllocated(2);
  std::uint16_t nameLength = 0;
  const auto name = channel.TakeAllocated(1, &nameLength);
  const auto flag = channel.Take<std::uint8_t>();
  if (channel.Failed()) return;

  process::MomentScope moment;
  CFileRef item;
  const char* const nameIfAny = nameLength == 0 ? nullptr : name.get();
  const OSErr result = CFileUtilMakeFileRefFromPath(&item, folder.get(), nameIfAny, flag);
  moment.End();

  channel.Put<std::int16_t>(result);
  channel.PutString(item.GetPath());
}

void AddHFSName(Channel& channel) {
  auto path = channel.TakeAllocated();
  char name[protocol::kLongestHFSName + 1];
  channel.TakeCounted(name, protocol::kLongestHFSName);
  const bool flag = channel.Take<std::uint8_t>() != 0;
  if (channel.Failed()) return;

  process::MomentScope moment;
  CFileRef item(path.get(), true);
  path.reset();
  const bool isAdded = CFileUtilAddHFSName(&item, name, flag);
  moment.End();

  channel.PutFlag(isAdded);
  channel.PutString(item.GetPath());
}

}  // namespace tallowmere::service
