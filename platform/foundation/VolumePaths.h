// What HFS paths need to know about mounted volumes. Both functions are declared here, where they
// are needed, and defined by whoever keeps the list of volumes.
//
// Volume names are UTF-16 text in the HFS view (':' and '/' already exchanged), compared unit by
// unit. May throw std::bad_alloc.
#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

namespace tallowmere::foundation {

// The mount point of the first mounted volume with this name: an absolute path in Linux bytes,
// without a "/" at its end unless it is "/". Nullopt when no volume has the name.
std::optional<std::string> MountPointOfVolume(std::u16string_view name);

// The volume that a path lies on, judged by spelling alone: links are not followed and nothing
// needs to exist. The longest mount point that contains the path counts.
struct VolumeOfPath {
  std::u16string name;
  std::size_t mountPointLength;  // length in bytes of the mount point at the path's beginning
};

// REQUIRES: the path is absolute, in Linux bytes, without doubled "/", without "." components and
// without a "/" at its end unless it is "/". It may contain ".." components.
//
// Nullopt when there are no volumes, or when `MountPointOfVolume` would not lead back because
// another volume that comes first has the same name.
std::optional<VolumeOfPath> FindVolumeOfPath(std::string_view path);

}  // namespace tallowmere::foundation
