// Parent ids in records that belong to no folder.
#pragma once

#include <cstdint>

namespace tallowmere {

inline constexpr std::int32_t kParentOfRoots =
    1;  // of every volume's root folder, and nothing else
inline constexpr std::int32_t kParentOnNoVolume = 3;  // of what is on no volume: it leads nowhere

}  // namespace tallowmere
