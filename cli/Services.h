// How many services may share the work.
#pragma once

#include <cstddef>
#include <string>

namespace tallowmere::cli {

// As many as there are cores for this process; one where two of them could give different answers:
// where a folder is shown at two mount points, either path of an item may be given, and above mount
// id 32768 each service gives numbers of its own.
std::size_t MostServices();

// Whether all services give the same answers with these mounts (proc_pid_mountinfo(5)).
bool AllAnswerAlike(const std::string& mountInfo);

}  // namespace tallowmere::cli
