// How many services may share the work.
#pragma once

#include <cstddef>
#include <string>

namespace tallowmere::cli {

// One for each core that this process may use; one alone where two services could answer
// differently: where a folder is shown at two mount points, each may give either path of an item,
// and above mount id 32768 each assigns numbers of its own.
std::size_t MostServices();

// Whether all services give the same answers with these mounts (proc_pid_mountinfo(5)).
bool AllAnswerAlike(const std::string& mountInfo);

}  // namespace tallowmere::cli
