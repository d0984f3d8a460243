// Which volumes there are.
#pragma once

#include <tallowmere/Client.h>
#include <tallowmere/Result.h>

#include <cstdint>
#include <string>
#include <vector>

namespace tallowmere {

struct Volume {
  std::int16_t number;     // volume reference number
  std::string name;        // in Mac Roman; several volumes can have one name
  std::string mountPoint;  // where its root folder is
};

// The volumes that the service and this process can reach, the one of "/" first. The service is
// asked about each mount point, which can mean to wait for the server of a file system, as long as
// the client's deadline; the error then begins with the mount point.
Result<std::vector<Volume>> ListVolumes(Client& client);

}  // namespace tallowmere
