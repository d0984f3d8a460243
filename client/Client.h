// A parent's side of the service: starts it, asks it, ends it.
//
// Names are bytes in the legacy single-byte encoding, as the service has them. A client belongs to
// one thread at a time. After an error the conversation is over: every further request gives an
// error too.
#pragma once

#include <chrono>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "client/Result.h"
#include "client/ServiceProcess.h"

namespace tallowmere {

struct ClientOptions {
  // The service's program. Empty: "tallowmere" beside this process's own program, else on PATH.
  std::string service;
  // How long one request may take, from its first byte sent to its last byte received.
  std::chrono::milliseconds deadline{10'000};
};

class Client {
 public:
  static Result<Client> Start(const ClientOptions& options = {});

  // The volume reference number of the first mounted volume with that HFS name, or none.
  // A name above 255 bytes or with a NUL is no volume's.
  Result<std::optional<std::int16_t>> GetVolRefnumByHFSName(std::string_view name);

  // The HFS name of the volume with that number, or none. 0 asks for the volume of "/".
  Result<std::optional<std::string>> GetHFSVolumeName(std::int16_t number);

 private:
  Client(ServiceProcess service, std::chrono::milliseconds deadline);

  ServiceProcess mService;
  std::chrono::milliseconds mDeadline;
  std::optional<Error> mFailure;  // of an earlier request

  class Exchange;
};

}  // namespace tallowmere
