// The subcommands of tallowmere-cli. Each gives the program's exit status: 0, or 1 when something
// could not be answered, with the reason on standard error.
#pragma once

#include "client/Client.h"

namespace tallowmere::cli {

// Prints number, name and mount point of every volume of this machine.
int PrintVolumes(const ClientOptions& options);

}  // namespace tallowmere::cli
