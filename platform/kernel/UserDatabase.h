// Where the C library looks for the machine's users: nsswitch.conf(5).
#pragma once

#include <string_view>

namespace tallowmere::kernel {

// Whether a text like that of /etc/nsswitch.conf names a service for "passwd" that may need more
// than files and local sockets. "compat" is such a service: it may ask NIS.
bool NeedsNetwork(std::string_view nameServiceSwitch);

// The same for this machine's file. False when there is none: the C library then reads files.
bool UserDatabaseNeedsNetwork();

}  // namespace tallowmere::kernel
