// Where the service's program is.
#pragma once

#include <string>

namespace tallowmere {

// "tallowmere" beside this process's own program, else on PATH; empty when it is in neither place.
std::string FindService();

}  // namespace tallowmere
