// What the kernel says of one item, told so that another item that gets the same numbers later is
// not taken for it.
//
// The proof of identity is the inode number with the file handle, or with the time of birth, which
// costs no system call of its own. Birth proves on a block device, unless the item was born just
// before it was read: file systems give a freed number away at once, and time moves in ticks.
// Birth proves nothing without a device: an overlay gives an item another birth when it is first
// renamed or written to.
//
//   birth    handle    proved by                   not noticed
//   ---------------------------------------------------------------------------------------------
//   old      any       birth, on a block device
//   any      yes       handle
//   any      no        birth                       a number that goes round within one tick
//   none     no        type and mount              a new item of that type with that number
//
// On file systems whose numbers are not one item's, the place is a part of the identity as well:
// see catalog/Sighting.h.
#pragma once

#include <cstdint>
#include <string_view>

#include "kernel/Clock.h"
#include "kernel/FileHandle.h"
#include "kernel/Result.h"

namespace tallowmere::kernel {

inline constexpr std::int32_t kNoMount = -1;
inline constexpr std::uint32_t kNoBirth = 0xFFFFFFFF;

// Plain bytes.
struct Item {
  std::uint64_t inode;
  std::uint64_t device;
  std::int64_t birthSeconds;       // since 1970
  std::uint32_t birthNanoseconds;  // kNoBirth: the file system does not tell
  std::int32_t mount;              // the id in /proc/self/mountinfo; kNoMount: not told
  std::uint32_t type;              // the S_IFMT part of the mode, never 0 for an item
  FileHandle handle;               // all zero where birth proves
};

bool IsFolder(const Item& item);
bool IsLink(const Item& item);

// Whether both have the device and inode number of one item.
bool HaveSameNumbers(const Item& first, const Item& second);

// An item without its handle, when it was last changed, and how many names it has.
struct Status {
  Item item;
  Nanoseconds change;
  std::uint32_t links;
};

// Where to look for an item, as in openat(2): a name in an open folder, an absolute path with
// AT_FDCWD, or with an empty name the open item itself. The name is valid as long as its owner.
struct Spot {
  int folder;
  const char* name;
};

// The spot of an absolute path. REQUIRES: `path` outlives the spot.
Spot AtPath(const char* path);

// The spot of an open item itself.
Spot AtOpen(int descriptor);

// The item itself, links not followed and nothing mounted on the way. With "/" at the end of the
// name the folder to which it leads, links followed. One system call.
Result<Status> ReadStatus(const Spot& spot);

// The same with the handle where birth does not prove.
Result<Item> ReadItem(const Spot& spot);

// The handle that tells an item from others; all zero where the file system has none.
FileHandle HandleAt(const Spot& spot);

// Gives an item that was just read at a spot the handle that ReadItem would have read. If it has
// been replaced since, the result refers to no item at all, unless number and birth are the new
// one's as well.
void ReadProof(Item& item, const Spot& spot);

// Whether this very item is there now, on whichever mount.
bool IsAt(const Item& item, const Spot& spot);

// Whether two items read at different moments are proved to be one: by what is known of both.
bool IsProvedSame(const Item& first, const Item& second);

}  // namespace tallowmere::kernel
