// HFS and Windows paths to Linux paths and back, all as bytes of file names.
//
// A path that begins at a root stays so, a relative one stays relative. A path whose translation
// would read back as another one has none. May throw std::bad_alloc.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace tallowmere::foundation {

// "Volume:a:b" → mount point and "/a/b", ":a:b" → "a/b". In each component ':' and '/' are
// exchanged; each colon more climbs one level ("Volume:a::b" → "…/a/../b"); a ':' at the end names
// the same item. None when the volume is not mounted, when the path climbs above its root, when a
// component is "." or "..", and for an empty path.
std::optional<std::string> LinuxPathOfHfsPath(std::string_view hfs);

// The reverse; a folder ends in ':', a volume's root always. None for a path that climbs above its
// volume's root, and when no volume is known.
std::optional<std::string> HfsPathOfLinuxPath(std::string_view path, bool folder);

// "C:\a\b" → "/C:/a/b", "\a\b" → "/a/b", "a\b" → "a/b".
std::string LinuxPathOfWindowsPath(std::string_view windows);

// The reverse. None for a path with '\' in a name and for a relative one that begins with a drive.
std::optional<std::string> WindowsPathOfLinuxPath(std::string_view path);

}  // namespace tallowmere::foundation
