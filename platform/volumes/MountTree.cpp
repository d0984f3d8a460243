#include "volumes/MountTree.h"

#include <algorithm>

#include "kernel/FileSystemKinds.h"

namespace tallowmere::volumes {

MountTree::MountTree(const std::vector<Mount>& mounts, int rootID)
    : mMounts(mounts), mRootID(rootID), mState(mounts.size(), State::kUnknown) {
  for (std::size_t i = 0; i < mounts.size(); ++i) {
    mByID.emplace(mounts[i].id, i);
    if (mounts[i].mountPoint == "/") continue;
    // Of two mounts at the same place on the same parent, the kernel finds the later one.
    mByPlace.insert_or_assign({mounts[i].parent, mounts[i].mountPoint}, i);
  }
}

std::vector<std::vector<std::size_t>> MountTree::GroupIntoVolumes(
    const std::function<bool(const Mount&)>& isFolder) {
  std::map<std::uint64_t, std::vector<std::size_t>> fileSystems;
  for (std::size_t i = 0; i < mMounts.size(); ++i) {
    const bool counts = IsRoot(i) || kernel::HoldsFiles(mMounts[i].type);
    if (counts && IsReachable(i)) fileSystems[mMounts[i].device].push_back(i);
  }

  const auto isRoot = [&](std::size_t i) { return IsRoot(i); };
  const auto showsRootFolder = [&](std::size_t i) { return mMounts[i].root == "/"; };
  const auto showsFolder = [&](std::size_t i) { return !MayBeFile(i) || isFolder(mMounts[i]); };
  std::vector<std::vector<std::size_t>> volumes;
  for (auto& [device, indexes] : fileSystems) {
    auto place = std::find_if(indexes.begin(), indexes.end(), isRoot);
    if (place == indexes.end()) {
      place = std::find_if(indexes.begin(), indexes.end(), showsRootFolder);
    }
    if (place == indexes.end()) place = std::find_if(indexes.begin(), indexes.end(), showsFolder);
    if (place == indexes.end()) continue;
    std::rotate(indexes.begin(), place, place + 1);
    volumes.push_back(std::move(indexes));
  }
  std::sort(volumes.begin(), volumes.end(), [&](const auto& a, const auto& b) {
    if (isRoot(a.front()) != isRoot(b.front())) return isRoot(a.front());
    return a.front() < b.front();
  });
  return volumes;
}

bool MountTree::MayBeFile(std::size_t index) const {
  return mMounts[index].root != "/" && !NeedsServer(index);
}

bool MountTree::IsReachable(std::size_t index) {
  return IsEntered(index) && !mByPlace.contains({mMounts[index].id, mMounts[index].mountPoint});
}

// Whether path lookup enters the mount: neither it nor a mount further up is covered.
bool MountTree::IsEntered(std::size_t index) {
  std::vector<std::size_t> chain;
  bool isEntered = true;
  while (true) {
    if (mState[index] != State::kUnknown) {
      isEntered = mState[index] == State::kEntered;
      break;
    }
    mState[index] = State::kHidden;  // ends the climb when mounts are each other's ancestors
    chain.push_back(index);
    const auto parent = mByID.find(mMounts[index].parent);
    if (IsRoot(index) || parent == mByID.end()) break;
    index = parent->second;
  }
  for (auto step = chain.rbegin(); step != chain.rend(); ++step) {
    isEntered = IsRoot(*step) || (isEntered && !IsCovered(*step));
    mState[*step] = isEntered ? State::kEntered : State::kHidden;
  }
  return isEntered;
}

// Whether path lookup in the parent enters another mount first, at the mount point itself or
// further up.
bool MountTree::IsCovered(std::size_t index) const {
  const Mount& mount = mMounts[index];
  for (std::string_view path = mount.mountPoint; path != "/";) {
    const auto found = mByPlace.find({mount.parent, path});
    if (found != mByPlace.end() && found->second != index) return true;
    path = path.substr(0, std::max<std::size_t>(path.rfind('/'), 1));
  }
  return mount.mountPoint == "/";
}

// Whether looking at the mount can mean waiting for a server: its own, or that of a mount further
// up.
bool MountTree::NeedsServer(std::size_t index) const {
  while (!kernel::NeedsServer(mMounts[index].type)) {
    const auto parent = mByID.find(mMounts[index].parent);
    if (IsRoot(index) || parent == mByID.end()) return false;
    index = parent->second;
  }
  return true;
}

}  // namespace tallowmere::volumes
