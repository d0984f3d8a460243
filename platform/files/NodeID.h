// Which number has an item: 32-bit node ids as the File Manager knows them.
#pragma once

#include <cstdint>

namespace tallowmere::files {

// The id of a volume's root folder, and of the parent that every root has.
inline constexpr std::uint32_t kRootFolderID = 2;
inline constexpr std::uint32_t kParentOfRootID = 1;

}  // namespace tallowmere::files
