// What can be relied on in the kinds of file systems, by the type that the mount table gives
// ("ext4", "tmpfs", …). What is not known of a type is not relied on.
#pragma once

#include <string_view>

namespace tallowmere::files {

// Whether a folder's entry can have another inode number than its item, also where nothing is
// mounted.
bool HasUntrueEntries(std::string_view type);

// Whether a file can get another inode number while nothing is done to it or its folder: the
// numbers are given as the file system meets its items.
bool RenumbersFiles(std::string_view type);

// Whether a folder has two links and one more for each folder in it, or a single one when it has
// lost count.
bool CountsSubfolders(std::string_view type);

// Whether every item is found by its handle as long as it exists. Other file systems find what they
// have not forgotten.
bool FindsAllByHandle(std::string_view type);

// Whether every item is found by a handle with its inode number and generation 0.
bool FindsAllByInode(std::string_view type);

}  // namespace tallowmere::files
