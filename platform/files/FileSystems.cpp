#include "files/FileSystems.h"

#include <algorithm>
#include <initializer_list>

namespace tallowmere::files {
namespace {

bool IsAnyOf(std::string_view type, std::initializer_list<std::string_view> types) {
  return std::find(types.begin(), types.end(), type) != types.end();
}

}  // namespace

bool HasUntrueEntries(std::string_view type) {
  return type == "overlay" || RenumbersFiles(type);
}

bool RenumbersFiles(std::string_view type) {
  return type.starts_with("fuse") || IsAnyOf(type, {"virtiofs", "vfat", "msdos", "exfat"});
}

bool CountsSubfolders(std::string_view type) {
  return IsAnyOf(type, {"ext2", "ext3", "ext4", "xfs", "tmpfs"});
}

bool FindsAllByHandle(std::string_view type) {
  return IsAnyOf(type, {"ext2", "ext3", "ext4", "xfs", "btrfs", "tmpfs"});
}

bool FindsAllByInode(std::string_view type) {
  return IsAnyOf(type, {"ext2", "ext3", "ext4"});
}

}  // namespace tallowmere::files
