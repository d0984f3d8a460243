#include "files/FolderPass.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>
#include <unistd.h>

#include <cstdint>
#include <limits>
#include <memory>
#include <string_view>
#include <vector>

#include "foundation/PathText.h"

namespace tallowmere::files {
namespace {

struct CloseFolder {
  void operator()(DIR* folder) const { closedir(folder); }
};
using OpenFolder = std::unique_ptr<DIR, CloseFolder>;

OpenFolder Open(const std::string& path) {
  const int descriptor = open(path.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
  if (descriptor < 0) return nullptr;
  OpenFolder folder(fdopendir(descriptor));
  if (!folder) close(descriptor);
  return folder;
}

bool IsThisOrParent(std::string_view name) {
  return name == "." || name == "..";
}

unsigned char EntryType(const ItemReference& item) {
  return static_cast<unsigned char>(IFTODT(item.type));
}

class Pass {
 public:
  explicit Pass(const ItemReference& item) : mItem(item) {}

  std::optional<std::string> From(const std::string& start) {
    mFolders.push_back({kNone, start});
    std::string cameFrom;
    for (std::size_t next = 0; next < mFolders.size(); ++next) {
      const std::string path = PathOf(next);
      if (!IsOnVolumeOf(mItem, path.c_str())) continue;
      // The number in an entry can be another than the folder's own: on an overlay, say.
      if (S_ISDIR(mItem.type) && IsAt(mItem, AT_FDCWD, path.c_str())) return path;
      const bool isAbove = mFolders[next].parent == kNone;
      if (const auto name = Read(next, path, isAbove ? cameFrom : std::string())) {
        return foundation::JoinPath(path, *name);
      }
      if (isAbove && path != "/") {
        cameFrom = *foundation::LastComponent(path);
        mFolders.push_back(
            {kNone, foundation::WithFolderMark(foundation::ParentPath(path), false)});
      }
    }
    return std::nullopt;
  }

 private:
  static constexpr std::uint32_t kNone = std::numeric_limits<std::uint32_t>::max();

  // A folder that is read or waits for it. The start and the folders above it have no parent here,
  // and their whole path for a name.
  struct Folder {
    std::uint32_t parent;
    std::string name;
  };

  std::string PathOf(std::size_t index) const {
    const Folder& folder = mFolders[index];
    if (folder.parent == kNone) return folder.name;
    return foundation::JoinPath(PathOf(folder.parent), folder.name);
  }

  // The name of the item if it is in this folder. Else the folders in it, but for the one that the
  // pass comes from, wait.
  std::optional<std::string> Read(std::size_t index, const std::string& path,
                                  const std::string& cameFrom) {
    const OpenFolder folder = Open(path);
    if (!folder) return std::nullopt;
    while (const dirent* const entry = readdir(folder.get())) {
      if (IsThisOrParent(entry->d_name)) continue;
      if (IsItem(*entry, dirfd(folder.get()))) return entry->d_name;
      const bool mayBeFolder = entry->d_type == DT_DIR || entry->d_type == DT_UNKNOWN;
      if (mayBeFolder && entry->d_name != cameFrom) {
        mFolders.push_back({static_cast<std::uint32_t>(index), entry->d_name});
      }
    }
    return std::nullopt;
  }

  bool IsItem(const dirent& entry, int folder) const {
    return entry.d_ino == mItem.inode &&
           (entry.d_type == EntryType(mItem) || entry.d_type == DT_UNKNOWN) &&
           IsAt(mItem, folder, entry.d_name);
  }

  const ItemReference& mItem;
  std::vector<Folder> mFolders;  // in the order of reading
};

}  // namespace

bool IsOnVolumeOf(const ItemReference& item, const char* path) {
  struct statx about {};
  if (statx(AT_FDCWD, path, AT_SYMLINK_NOFOLLOW | AT_NO_AUTOMOUNT | AT_STATX_DONT_SYNC,
            STATX_MNT_ID, &about) != 0) {
    return false;
  }
  if (item.mount != kNoMount && (about.stx_mask & STATX_MNT_ID) != 0) {
    return about.stx_mnt_id == static_cast<std::uint64_t>(item.mount);
  }
  return makedev(about.stx_dev_major, about.stx_dev_minor) == item.device;
}

std::optional<std::string> SearchFolders(const ItemReference& item, const std::string& start) {
  return Pass(item).From(start);
}

}  // namespace tallowmere::files
