// A root folder with nothing in it but one program and what that needs to start, so that what else is
// mounted on the machine takes no part in a test.
#pragma once

#include <string>

namespace tallowmere::soak {

inline constexpr const char* kProgramInSmallRoot = "/service";

// Mounts an empty file system at `place` and puts the program into it with the libraries that ldd
// names. False when that is not permitted. REQUIRES: the process is in a mount namespace of its own.
bool MakeSmallRoot(const std::string& place, const std::string& program);

// Makes `place` the root folder of this process and of the namespace, and takes all mounts that are
// not below it away from there.
bool EnterSmallRoot(const std::string& place);

}  // namespace tallowmere::soak
