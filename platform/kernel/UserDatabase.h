// Where the C library looks for the machine's users: nsswitch.conf(5).
#pragma once

#include <string_view>

namespace tallowmere::kernel {

// Whether a text like that of /etc/nsswitch.conf names a service for "passwd" that is not known to
// do with files and local sockets. "compat" is none of those that are: it may ask NIS.
bool NeedsNetwork(std::string_view nameServiceSwitch);

// The same of this machine's. Not where it has none: the C library then looks into files.
bool UserDatabaseNeedsNetwork();

}  // namespace tallowmere::kernel
