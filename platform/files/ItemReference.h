// What an FSRef holds: which item of which file system, told so that another item that gets the
// same numbers later is not taken for it.
//
// The proof of identity is the inode number with the file handle, or with the time of birth, which
// costs no system call of its own. Birth is enough on a block device unless the item was born just
// before it was read: file systems give a freed number away at once, and time moves in ticks. It is
// not enough without a device: an overlay gives an item another birth when it is first renamed or
// written to. Where there is neither birth nor handle, the type and the mount have to be the same,
// and a new item of the same type with the same number is not noticed; nor is it where a newborn
// has no handle and the number goes round within one tick.
#pragma once

#include <CoreServices/CoreServices.h>

#include <cstdint>
#include <optional>
#include <string>

#include "files/FileHandle.h"

namespace tallowmere::files {

inline constexpr std::int32_t kNoMount = -1;
inline constexpr std::uint32_t kNoBirth = 0xFFFFFFFF;

// Plain bytes, an FSRef's own.
struct ItemReference {
  std::uint64_t inode;
  std::uint64_t device;
  std::int64_t birthSeconds;       // since 1970
  std::uint32_t birthNanoseconds;  // kNoBirth: the file system does not tell
  std::int32_t mount;              // the id in /proc/self/mountinfo; kNoMount: not told
  std::uint32_t type;              // the S_IFMT part of the mode, never 0 for an item
  FileHandle handle;               // where birth is not enough
};
static_assert(sizeof(ItemReference) == sizeof(FSRef));

// An existing item and where it is: its absolute path without ".", ".." and empty components, the
// item itself not followed when it is a link. Where nothing else is said the path is canonical, as
// it was when the item was first reached there; a folder on the way can have become a link since,
// which leads to the same item. The item need not have its handle.
struct Place {
  std::string path;
  ItemReference item;
};

FSRef Pack(const ItemReference& item);

// None for null and for what Pack does not make, all zero among it.
std::optional<ItemReference> Unpack(const FSRef* reference);

bool HasHandle(const ItemReference& item);

// Whether both are to one item, by device and inode number.
bool AreEqual(const ItemReference& first, const ItemReference& second);

// The item itself, links not followed and nothing mounted on the way; none when there is none.
// `folder` as in openat(2); with an empty name, the open item itself. With "/" at the end of the
// name the folder to which it leads, links followed.
std::optional<ItemReference> ReadItem(int folder, const char* name);

// Gives an item that was just read as ItemStatus the handle that ReadItem would have read.
void ReadProof(ItemReference& item, int folder, const char* name);

// A time in nanoseconds since 1970. Beyond the years 1677 to 2262 the number wraps, so that other
// times still have other numbers.
std::int64_t Nanoseconds(std::int64_t seconds, std::int64_t nanoseconds);

// The item without its handle, when it was last changed, and how many names it has.
struct ItemStatus {
  ItemReference item;
  std::int64_t change;  // as Nanoseconds
  std::uint32_t links;
};

// As ReadItem, in one system call.
std::optional<ItemStatus> ReadStatus(int folder, const char* name);

// Whether a system error says that nothing is there: none that only hides it.
bool MeansGone(int error);

// Whether this very item is there now, on whichever mount.
bool IsAt(const ItemReference& item, int folder, const char* name);

}  // namespace tallowmere::files
