// Finds the service's program.
#pragma once

#include <string>

namespace tallowmere {

// "tallowmere" in the folder of this process's own program, else on PATH; empty when it is in
// neither.
std::string FindService();

}  // namespace tallowmere
