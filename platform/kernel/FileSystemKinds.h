// The kinds of file systems and what can be relied on in each. A trait is a promise that a kind is
// known to keep; what is not known of a kind is not relied on.
#pragma once

#include <cstdint>
#include <string_view>

#include "names/NodeIDs.h"

namespace tallowmere::kernel {

// Which items a privileged process can open by number, without having seen their handles.
enum class ByNumber : std::uint8_t {
  kNone,
  kInode,               // all: inode number and generation 0
  kInodeAndSubvolume,   // all: inode number, subvolume and generation 0
  kInodeAndGeneration,  // all: the file system tells the generation of an inode number
};

struct FileSystemKind {
  std::string_view name;

  // Device and inode number are those of one item only while the volume is mounted.
  bool numbersTellItemsApart = false;

  // 32 or 64: how long its inode numbers can be.
  unsigned numberBits = 64;

  // The rule for node ids of the upper half.
  names::UpperIDs upperIDs = names::UpperIDs::kMixed;

  // The entry of an item that is no folder, in a folder in which nothing is mounted, has the item's
  // inode number. (Entries of folders need not: subvolumes, mount points, merged folders.)
  bool entriesTellNumbers = false;

  // A file keeps its inode number as long as nothing is done to it or its folder.
  bool keepsNumbers = false;

  // A folder has two links and one more for each folder in it, or a single one when it has lost
  // count.
  bool countsSubfolders = false;

  // Every item is found by its handle as long as it exists. Other file systems find what they have
  // not forgotten.
  bool findsAllByHandle = false;

  ByNumber byNumber = ByNumber::kNone;
};

// The kind of a file system by what statfs(2) says of it (f_type's lowest 32 bits, f_files) and by
// the device number of its root folder. Kinds that are not in the table promise nothing.
const FileSystemKind& KindOf(std::uint32_t type, std::uint64_t fileCount, std::uint64_t device);

// False for the file systems that are kernel interfaces and hold no user's files, by the type that
// the mount table gives ("ext4", "proc", …).
bool HoldsFiles(std::string_view mountedType);

// Whether looking at something there can mean to wait for a server: over the network or FUSE.
bool NeedsServer(std::string_view mountedType);

}  // namespace tallowmere::kernel
