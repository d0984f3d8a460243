// The handle by which a file system tells its items apart, and by which a privileged process opens
// one without its path: name_to_handle_at(2).
//
// A handle identifies one item for ever: an inode number that is given to a new item comes with
// another generation.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>

#include "kernel/Descriptor.h"
#include "kernel/Result.h"

namespace tallowmere::kernel {

// Longer handles are not kept. Those of the local file systems take 8 to 32 bytes.
inline constexpr std::size_t kLongestHandle = 36;

// Plain bytes; all zero for no handle.
struct FileHandle {
  std::int32_t type;
  std::uint32_t size;                              // in bytes; 0 for no handle
  std::array<std::uint8_t, kLongestHandle> bytes;  // zero after `size`

  bool operator==(const FileHandle&) const = default;
};

// The handle that opens the item itself, links not followed. `folder` is as in openat(2); with an
// empty name, it is the open item itself. EOPNOTSUPP when the file system cannot open by handle.
Result<FileHandle> ReadHandle(int folder, const char* name);

// The same, or else a handle that only identifies the item (Linux 6.5).
Result<FileHandle> ReadHandleToIdentify(int folder, const char* name);

// Opens an item for its path alone (O_PATH). REQUIRES: `onVolume` is open for reading on the same
// file system.
//
//   EPERM    the process lacks CAP_DAC_READ_SEARCH
//   ESTALE   the file system does not find the item
//
// The item may have been removed meanwhile, or be in no folder that is mounted. The kernel knows no
// path of a file before somebody has looked it up: /proc then shows "/".
Result<Descriptor> OpenByHandle(int onVolume, const FileHandle& handle);

// The relevant contents of a handle.
struct HandleNumbers {
  std::uint64_t inode;
  std::uint64_t subvolume = 0;   // of btrfs
  std::uint32_t generation = 0;  // 0 also where the file system accepts any item with the number
};

// The handle of the item with these numbers, in the format of another item's handle on the same
// file system, which ReadHandle returned. Nullopt when handles of that format are not known to be
// made this way, or have no room for the number. FileSystemKind tells where such handles find every
// item.
std::optional<FileHandle> HandleOf(const HandleNumbers& numbers, const FileHandle& sibling,
                                   std::uint64_t siblingInode);

// The id of the subvolume that an item is in, from a handle of btrfs; nullopt from any other
// handle.
std::optional<std::uint64_t> SubvolumeOf(const FileHandle& handle);

// The same for an item with a number; none either from the handle of an item with another number,
// which came to its place before the handle was read.
std::optional<std::uint64_t> SubvolumeOf(const FileHandle& handle, std::uint64_t inode);

}  // namespace tallowmere::kernel
