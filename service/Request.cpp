#include "service/Request.h"

#include <unistd.h>

#include <algorithm>
#include <array>
#include <cstdlib>

#include "service/Channel.h"
#include "service/Commands.h"
#include "service/Protocol.h"

namespace tallowmere::service {
namespace {

struct Command {
  protocol::RequestCode code;
  void (*serve)(Channel&);
};

void Quit(Channel&) {
  std::exit(EXIT_SUCCESS);
}

constexpr auto kCommands = std::to_array<Command>({
    {protocol::kRequestQuit, Quit},
    {protocol::kRequestMakeFullPath, MakeFullPath},
    {protocol::kRequestMakeFileRefFromPath, MakeFileRefFromPath},
    {protocol::kRequestGetVolRefnumByHFSName, GetVolRefnumByHFSName},
    {protocol::kRequestGetHFSVolumeName, GetHFSVolumeName},
    {protocol::kRequestGetHFSName, GetHFSName},
    {protocol::kRequestAddHFSName, AddHFSName},
    {protocol::kRequestGetFSSpec, GetFSSpec},
    {protocol::kRequestSetFileRefFromFSSpecData, SetFileRefFromFSSpecData},
    {protocol::kRequestSetFileRefFromFSSpec, SetFileRefFromFSSpec},
    {protocol::kRequestGetAIFFExportSettings, GetAIFFExportSettings},
});

const Command* FindCommand(std::uint16_t code) {
  const auto* const found = std::find_if(kCommands.begin(), kCommands.end(),
                                         [code](const Command& row) { return row.code == code; });
  return found == kCommands.end() ? nullptr : found;
}

}  // namespace

OSErr ServeOneRequest() {
  Channel channel(STDIN_FILENO, STDOUT_FILENO);
  const auto code = channel.Take<std::uint16_t>();
  if (channel.Failed()) return ioErr;
  const Command* const command = FindCommand(code);
  if (command == nullptr) std::exit(EXIT_FAILURE);
  command->serve(channel);
  channel.PutBytes(protocol::kTrailer.data(), protocol::kTrailer.size());
  return channel.Failed() ? ioErr : noErr;
}

}  // namespace tallowmere::service
