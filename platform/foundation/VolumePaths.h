// What HFS paths need to know about mounted volumes. Declared here, where the question is asked;
// whoever keeps the list of volumes defines both functions.
//
// Volume names are UTF-16 text in the HFS view (':' and '/' already exchanged), compared unit by
// unit. May throw std::bad_alloc.
#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

namespace tallowmere::foundation {

// The mount point of the first mounted volume with a name: an absolute path in Linux bytes, without
// a "/" at its end unless it is "/". None when no volume has that name.
std::optional<std::string> MountPointOfVolume(std::u16string_view name);

// The volume on whose mount point or below it a path lies, by its spelling alone: links in it are
// not followed and nothing needs to exist. Of several mount points the longest counts.
struct VolumeOfPath {
  std::u16string name;
  std::size_t mountPointLength;  // bytes at the path's beginning that spell the mount point
};

// REQUIRES: the path is absolute, in Linux bytes, without doubled "/", without "." components and
// without a "/" at its end unless it is "/". It may contain ".." components.
// None when there are no volumes, or when `MountPointOfVolume` would not lead back: the name
// belongs to another volume as well, which comes first.
std::optional<VolumeOfPath> FindVolumeOfPath(std::string_view path);

}  // namespace tallowmere::foundation
