// The kinds of file systems and what can be relied on in each. A trait is a promise that a kind is
// known to keep; nothing else is relied on.
#pragma once

#include <cstdint>
#include <string_view>

#include "names/NodeIDs.h"

namespace tallowmere::kernel {

// Which items a privileged process can open by number, without having read their handles.
enum class ByNumber : std::uint8_t {
  kNone,
  kInode,               // all, with the inode number and generation 0
  kInodeAndSubvolume,   // all, with the inode number, the subvolume and generation 0
  kInodeAndGeneration,  // all, once the file system has told the inode number's generation
};

struct FileSystemKind {
  std::string_view name;

  // While the volume is mounted, device and inode number identify a single item.
  bool numbersTellItemsApart = false;

  // The width of its inode numbers: 32 or 64.
  unsigned numberBits = 64;

  // The rule for node ids in the upper half.
  names::UpperIDs upperIDs = names::UpperIDs::kMixed;

  // In a folder in which nothing is mounted, the entry of an item that is not a folder has the
  // item's inode number. (Entries of folders need not: subvolumes, mount points, merged folders.)
  bool entriesTellNumbers = false;

  // A file keeps its inode number as long as neither it nor its folder is changed.
  bool keepsNumbers = false;

  // A folder has two links plus one for each folder in it, or a single one when it has lost count.
  bool countsSubfolders = false;

  // A name also finds the item whose name differs from it in letter case alone, at least in some of
  // its folders.
  bool ignoresCase = false;

  // Names can be the bytes that an older machine stored, in Mac Roman.
  bool namesCanBeMacRoman = false;

  // Programs of its time knew an item whose name is longer than 31 characters by a short form.
  bool longNamesHadShortForms = false;

  // Every item is found by its handle as long as it exists. Other file systems only find what they
  // have not forgotten.
  bool findsAllByHandle = false;

  ByNumber byNumber = ByNumber::kNone;
};

// The kind of a file system, by what statfs(2) reports (the lowest 32 bits of f_type, f_files) and
// the device number of its root folder. Kinds that are not in the table promise nothing.
const FileSystemKind& KindOf(std::uint32_t type, std::uint64_t fileCount, std::uint64_t device);

// False for file systems that are kernel interfaces and hold no user's files, by the type in the
// mount table ("ext4", "proc", …).
bool HoldsFiles(std::string_view mountedType);

// Whether a look at the file system can mean waiting for a server: over the network or FUSE.
bool NeedsServer(std::string_view mountedType);

}  // namespace tallowmere::kernel
