// The handle by which a file system itself tells its items apart, and by which a privileged process
// opens one without its path: name_to_handle_at(2).
//
// A handle names one item for ever: an inode number that is given to a new item comes with another
// generation.
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

// Plain bytes, all zero for none.
struct FileHandle {
  std::int32_t type;
  std::uint32_t size;                              // in bytes, 0: no handle
  std::array<std::uint8_t, kLongestHandle> bytes;  // zero behind `size`

  bool operator==(const FileHandle&) const = default;
};

// The handle of the item itself, links not followed, that opens it again. `folder` as in openat(2);
// with an empty name, of the open item itself. EOPNOTSUPP where the file system cannot open by
// handle.
Result<FileHandle> ReadHandle(int folder, const char* name);

// The same, or else a handle that only tells the item from others (Linux 6.5).
Result<FileHandle> ReadHandleToIdentify(int folder, const char* name);

// Opens an item for its path alone (O_PATH). `onVolume` is open for reading on the same file
// system.
//
//   EPERM    the process lacks CAP_DAC_READ_SEARCH
//   ESTALE   the file system does not find the item
//
// What opens can have been removed meanwhile, can be in no folder that is mounted, and a file has
// no path that the kernel knows before somebody has looked it up: /proc tells "/" then.
Result<Descriptor> OpenByHandle(int onVolume, const FileHandle& handle);

// What a handle is made of, besides what nobody needs to know.
struct HandleNumbers {
  std::uint64_t inode;
  std::uint64_t subvolume = 0;   // of btrfs
  std::uint32_t generation = 0;  // 0 also where the file system takes any item with the number
};

// The handle of the item with those numbers, in the form of that of another item of its file
// system, which ReadHandle gave. None when handles are not known to be made so, or have no room for
// the number. FileSystemKind tells where such handles find every item.
std::optional<FileHandle> HandleOf(const HandleNumbers& numbers, const FileHandle& sibling,
                                   std::uint64_t siblingInode);

// The id of the subvolume that an item is in, from a handle of btrfs; none from another one.
std::optional<std::uint64_t> SubvolumeOf(const FileHandle& handle);

}  // namespace tallowmere::kernel
