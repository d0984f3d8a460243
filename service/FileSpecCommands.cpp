#include <CFileRef.h>
#include <CoreServices/CoreServices.h>
#include <LegacyHFSBridge.h>
#include <Tallowmere/Process.h>

#include <algorithm>
#include <iterator>

#include "service/Commands.h"
#include "service/Protocol.h"

namespace tallowmere::service {
namespace {

static_assert(sizeof(FSSpec) == protocol::kFileSpecSize);

FSSpec TakeSpec(Channel& channel) {
  FSSpec spec{};
  channel.TakeBytes(&spec, sizeof spec);
  return spec;
}

}  // namespace

void GetHFSName(Channel& channel) {
  auto path = channel.TakeAllocated();
  const auto maximum = channel.Take<std::uint16_t>();
  if (channel.Failed()) return;

  process::MomentScope moment;
  const CFileRef item(path.get(), false);
  path.reset();
  char name[protocol::kLongestHFSName] = {};
  const bool fits = CFileUtilGetHFSName(item, name, maximum);
  moment.End();

  channel.PutFlag(fits);
  channel.PutString(name);
}

// The reference is always that of a folder, whatever the path names, unlike in GetHFSName.
void GetFSSpec(Channel& channel) {
  auto path = channel.TakeAllocated();
  if (channel.Failed()) return;

  process::MomentScope moment;
  const CFileRef item(path.get(), true);
  path.reset();
  FSSpec spec;
  const bool usable = CFileUtilGetDeprecatedFSSpecThroughIPC(item, &spec);
  moment.End();
  // The bytes after the name in a record are uninitialised memory.
  std::fill(spec.name + 1 + spec.name[0], std::end(spec.name), 0);

  channel.PutFlag(usable);
  channel.PutBytes(&spec, sizeof spec);
}

void SetFileRefFromFSSpecData(Channel& channel) {
  const auto volume = channel.Take<std::int16_t>();
  const auto folder = channel.Take<std::int32_t>();
  char name[protocol::kLongestHFSName + 1];
  channel.TakeCounted(name, protocol::kLongestHFSName);
  const bool last = channel.Take<std::uint8_t>() != 0;
  if (channel.Failed()) return;

  process::MomentScope moment;
  CFileRef item;
  const bool isSet = CFileUtilSetFileRefFromFSSpecData(&item, volume, folder, name, last);
  moment.End();

  channel.PutFlag(isSet);
  channel.PutString(item.GetPath());
}

void SetFileRefFromFSSpec(Channel& channel) {
  const FSSpec spec = TakeSpec(channel);
  const bool searchOtherVolumes = channel.Take<std::uint8_t>() != 0;
  const bool last = channel.Take<std::uint8_t>() != 0;
  if (channel.Failed()) return;

  process::MomentScope moment;
  CFileRef item;
  const bool isSet =
      CFileUtilSetFileRefFromDeprecatedFSSpecThroughIPC(&item, &spec, searchOtherVolumes, last);
  moment.End();

  channel.PutFlag(isSet);
  channel.PutString(item.GetPath());
}

}  // namespace tallowmere::service
