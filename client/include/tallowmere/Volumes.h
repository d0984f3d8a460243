// Lists the volumes, and finds one of them.
#pragma once

#include <tallowmere/Client.h>
#include <tallowmere/Result.h>

#include <cstdint>
#include <string>
#include <string_view>
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

// The one volume of a list with a name, in Mac Roman, letter case included. kAmbiguous for a name
// that several have, kNotAVolume for one that none has.
Result<Volume> VolumeWithName(const std::vector<Volume>& volumes, std::string_view name);

// The volume whose root folder is at a path; links are followed, also a last one. The folder's path
// becomes its mount point here also where it is not its first one. kNotAVolume for any other path.
Result<Volume> VolumeAt(Client& client, PathView mountPoint);

// The volume that a person means: by its name in UTF-8, or by a path to its root folder, which may
// be relative or a link. A text that begins with '/', "./" or "../" is a path. kAmbiguous for one
// that is the name of one volume and the path of another.
Result<Volume> FindVolume(Client& client, std::string_view mountPointOrName);

}  // namespace tallowmere
