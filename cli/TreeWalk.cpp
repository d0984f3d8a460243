#include "cli/TreeWalk.h"

#include <dirent.h>

#include <cerrno>
#include <memory>
#include <optional>
#include <string_view>
#include <system_error>
#include <utility>
#include <vector>

namespace tallowmere::cli {
namespace {

struct CloseFolder {
  void operator()(DIR* folder) const { closedir(folder); }
};

// Returns nullopt and sets errno when the folder cannot be read.
std::optional<std::vector<std::string>> NamesIn(const std::string& path) {
  const std::unique_ptr<DIR, CloseFolder> folder(opendir(path.c_str()));
  if (!folder) return std::nullopt;
  std::vector<std::string> names;
  errno = 0;
  while (const dirent* const entry = readdir(folder.get())) {
    const std::string_view name = entry->d_name;
    if (name != "." && name != "..") names.emplace_back(name);
  }
  if (errno != 0) return std::nullopt;
  return names;
}

std::string PathIn(const std::string& folder, const std::string& name) {
  return folder == "/" ? folder + name : folder + '/' + name;
}

class Walk {
 public:
  explicit Walk(const TreeVisitor& visitor) : mVisitor(visitor) {}

  void Run(const std::string& folder) {
    if (!Look(folder, std::nullopt)) return;
    mShareOfEach = 1;
    MoveFound();
    while (!mPending.empty()) {
      const Folder next = std::move(mPending.back());
      mPending.pop_back();
      if (!Read(next)) return;
    }
  }

 private:
  struct Folder {
    std::string path;
    dev_t device;
    double share;  // of the whole walk
  };

  // An estimate, since the rest of the tree is unknown: each subfolder counts as much as any other,
  // and as much as all other items together.
  bool Read(const Folder& folder) {
    const auto names = NamesIn(folder.path);
    if (!names) {
      LeaveOut(folder.path);
    } else {
      for (const std::string& name : *names) {
        if (!Look(PathIn(folder.path, name), folder.device)) return false;
      }
    }
    mShareOfEach = folder.share / static_cast<double>(mFound.size() + 1);
    mDone += mShareOfEach;
    MoveFound();
    return true;
  }

  // Returns whether the walk goes on.
  bool Look(const std::string& path, std::optional<dev_t> deviceOfFolder) {
    struct stat status {};
    if (lstat(path.c_str(), &status) != 0) {
      LeaveOut(path);
      return true;
    }
    if (!mVisitor.item(path, status, mDone)) return false;
    if (!S_ISDIR(status.st_mode)) return true;
    if (status.st_dev != deviceOfFolder && !mVisitor.isOnVolume(path, status)) {
      mVisitor.leftOut(path, "an interface of the kernel");
    } else {
      mFound.push_back({path, status.st_dev, 0});
    }
    return true;
  }

  void LeaveOut(const std::string& path) {
    if (errno == ENOENT) return;
    mVisitor.leftOut(path, std::generic_category().message(errno));
  }

  void MoveFound() {
    for (Folder& folder : mFound) {
      folder.share = mShareOfEach;
      mPending.push_back(std::move(folder));
    }
    mFound.clear();
  }

  const TreeVisitor& mVisitor;
  std::vector<Folder> mPending;  // the last one is visited next
  std::vector<Folder> mFound;    // in the current folder
  double mShareOfEach = 1;
  double mDone = 0;
};

}  // namespace

void WalkTree(const std::string& folder, const TreeVisitor& visitor) {
  Walk(visitor).Run(folder);
}

}  // namespace tallowmere::cli
