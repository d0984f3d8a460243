// Converts HFS and Windows paths to Linux paths and back, all as the bytes of file names.
//
// An absolute path stays absolute, a relative one stays relative. A path that would not survive the
// round trip has no translation. May throw std::bad_alloc.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace tallowmere::foundation {

// "Volume:a:b" → mount point and "/a/b", ":a:b" → "a/b". In each component ':' and '/' are
// exchanged; each further adjacent colon climbs one level ("Volume:a::b" → "…/a/../b"); a trailing
// ':' names the same item. Nullopt for an empty path, for a volume that is not mounted, for a path
// that climbs above its root, and for a component "." or "..".
std::optional<std::string> LinuxPathOfHfsPath(std::string_view hfs);

// The reverse. A folder ends in ':', and so does every volume's root. Nullopt for a path that
// climbs above its volume's root, and when no volume is known.
std::optional<std::string> HfsPathOfLinuxPath(std::string_view path, bool folder);

// "C:\a\b" → "/C:/a/b", "\a\b" → "/a/b", "a\b" → "a/b".
std::string LinuxPathOfWindowsPath(std::string_view windows);

// The reverse. Nullopt for a name with '\' in it and for a relative path that begins with a drive.
std::optional<std::string> WindowsPathOfLinuxPath(std::string_view path);

}  // namespace tallowmere::foundation
