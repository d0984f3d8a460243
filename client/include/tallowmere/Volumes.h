// Lists the volumes.
#pragma once

#include <tallowmere/Client.h>
#include <tallowmere/Result.h>

#include <cstdint>
#include <string>
#include <vector>

namespace tallowmere {

struct Volume {
  std::int16_t number;     // volume reference number
  std::string name;        // in Mac Roman; not unique
  std::string mountPoint;  // the path of its root folder
};

// The volumes that both the service and this process can reach, the one of "/" first. Asks the
// service about each mount point, which may have to wait for a file system's server, for as long as
// the client's deadline; the error then begins with the mount point.
Result<std::vector<Volume>> ListVolumes(Client& client);

}  // namespace tallowmere
