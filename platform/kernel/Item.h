// What the kernel says of one item, kept so that another item that later gets the same numbers is
// not mistaken for it.
//
// Identity is proved by the inode number together with the file handle, or with the time of birth,
// which takes no extra system call. Birth is proof on a block device, unless the item was born just
// before it was read: file systems reuse a freed number at once, and time advances in ticks.
// Without a device, birth proves nothing: an overlay gives an item another birth when it is first
// renamed or written to.
//
//   birth    handle    proved by                   not noticed
//   ---------------------------------------------------------------------------------------------
//   old      any       birth, on a block device
//   any      yes       handle
//   any      no        birth                       a number that is reused within one tick
//   none     no        type and mount              a new item of that type with that number
//
// On file systems whose numbers do not identify a single item, the place is part of the identity
// too: see catalog/Sighting.h.
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
  std::uint32_t birthNanoseconds;  // kNoBirth when the file system does not tell
  std::int32_t mount;              // the id in /proc/self/mountinfo; kNoMount when not known
  std::uint32_t type;              // the S_IFMT part of the mode, never 0 for an item
  FileHandle handle;               // all zero where birth is proof
};

bool IsFolder(const Item& item);
bool IsLink(const Item& item);
bool IsRegularFile(const Item& item);

// The device number of two halves, as in Item.
std::uint64_t DeviceNumber(unsigned majorNumber, unsigned minorNumber);

// Whether both have the same device and inode number.
bool HaveSameNumbers(const Item& first, const Item& second);

// An item without its handle, the time of its last change, its number of names, and whether it is
// what its mount shows at the mount point; true before Linux 5.8, which does not tell: statx(2).
struct Status {
  Item item;
  Nanoseconds change;
  std::uint32_t links;
  bool isTopOfMount;
};

// Where to find an item, as in openat(2): a name in an open folder; an absolute path, with
// AT_FDCWD; or, with an empty name, the open item itself. The name is valid as long as its owner.
struct Spot {
  int folder;
  const char* name;
};

// The spot of an absolute path. REQUIRES: `path` outlives the spot.
Spot AtPath(const char* path);

// The spot of an open item itself.
Spot AtOpen(int descriptor);

// Reads the item itself, following no links and mounting nothing. When the name ends in "/", reads
// the folder that it leads to, following links. One system call.
Result<Status> ReadStatus(const Spot& spot);

// The same, with the handle unless birth is proof.
Result<Item> ReadItem(const Spot& spot);

// The handle that identifies an item; all zero where the file system has none.
FileHandle HandleAt(const Spot& spot);

// Gives an item that was just read at a spot the handle that ReadItem would have read. If the item
// has been replaced since, the result matches no item at all, unless the new item has the same
// number and birth.
void ReadProof(Item& item, const Spot& spot);

// Whether exactly this item is there now, on whichever mount.
bool IsAt(const Item& item, const Spot& spot);

// Whether two items read at different moments are proved to be the same, by what is known of both.
bool IsProvedSame(const Item& first, const Item& second);

}  // namespace tallowmere::kernel
