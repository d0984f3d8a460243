// Where Linux keeps the resource fork and the Finder information of a file: in attributes or files
// beside it, by whichever server or system wrote them.
//
//   store                 Finder information                   resource fork
//   ---------------------------------------------------------------------------------------------
//   attributes            com.apple.FinderInfo, on most        com.apple.ResourceFork, likewise
//                         file systems below user.; below
//                         osx. on the kernel's hfsplus
//   AFP server            user.org.netatalk.Metadata, an       user.org.netatalk.ResourceFork
//                         AppleDouble header
//   SMB server            user.DosStream.AFP_AfpInfo:$DATA     user.DosStream.AFP_Resource:$DATA
//   AppleDouble beside    ._NAME                               ._NAME
//   AppleDouble in folder .AppleDouble/NAME                    .AppleDouble/NAME
//
// Each of the two is that of the first store which has it: Finder information that is not all zero,
// a fork that is not empty. A store that is none, or broken, has nothing.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "catalog/Moment.h"
#include "kernel/Descriptor.h"
#include "kernel/Result.h"

namespace tallowmere::stores {

// Longer ones are not read: a fork's map can only tell of resources in its first 16 MiB.
inline constexpr std::size_t kLongestFork = std::size_t{32} << 20;

// The bits of the Finder information's flags: Inside Macintosh: Macintosh Toolbox Essentials,
// "Finder Interface".
inline constexpr std::uint16_t kIsAlias = 0x8000;

// The Finder flags of a file; nullopt where no store has its Finder information. EACCES and others
// where a store may not be looked at. REQUIRES: `contents` is the file of the look, open for
// reading.
kernel::Result<std::optional<std::uint16_t>> FinderFlagsOf(const catalog::Look& file,
                                                           const kernel::Descriptor& contents);

// The resource fork of a file; empty where no store has it. The same errors; EFBIG for one that is
// longer than kLongestFork.
kernel::Result<std::string> ResourceForkOf(const catalog::Look& file,
                                           const kernel::Descriptor& contents);

}  // namespace tallowmere::stores
