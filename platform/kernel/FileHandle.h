// The handle by which a file system itself tells its items apart, and by which a privileged process
// opens one without its path: name_to_handle_at(2).
//
// A handle names one item for ever: an inode number that is given to a new item comes with another
// generation.
#pragma once

#include <array>
#include <cstdint>
#include <optional>

#include "files/Descriptor.h"

namespace tallowmere::files {

// Longer handles are not kept. Those of the local file systems take 8 to 32 bytes.
inline constexpr std::size_t kLongestHandle = 36;

// Plain bytes, all zero for none.
struct FileHandle {
  std::int32_t type;
  std::uint32_t size;                              // in bytes, 0: no handle
  std::array<std::uint8_t, kLongestHandle> bytes;  // zero behind `size`

  bool operator==(const FileHandle&) const = default;
};

// The handle of the item itself, links not followed; none when its file system has none or there is
// no item. `folder` as in openat(2); with an empty name, of the open item itself.
FileHandle ReadHandle(int folder, const char* name);

// The handle of an inode with any generation, made from that of another item of its file system.
// None when the file system's handles are not known to be made so.
std::optional<FileHandle> HandleOfInode(const FileHandle& sibling, std::uint64_t siblingInode,
                                        std::uint64_t inode);

// Opens an item for its path alone (O_PATH). `onVolume` is open for reading on the same file
// system. Not open when there is no such item and where the process lacks the privilege; errno
// tells, ESTALE when the file system does not find the item.
Descriptor OpenByHandle(int onVolume, const FileHandle& handle);

}  // namespace tallowmere::files
