#include "files/MountTable.h"

#include <fcntl.h>
#include <linux/fs.h>
#include <poll.h>
#include <sys/ioctl.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <limits>
#include <system_error>
#include <utility>

#include "files/HFSNames.h"
#include "files/NodeID.h"
#include "foundation/PathText.h"

namespace tallowmere::files {
namespace {

constexpr VolumeNumber kLowestNumber = std::numeric_limits<VolumeNumber>::min();

// How often a table that changes while it is read is read again before it is taken as it is. The
// next question finds the change signalled.
constexpr int kReadAttempts = 8;

// What the volume of "/" is called when its file system has no label.
constexpr const char* kUnlabelledRoot = "Root";

// The kernel answers from what it has: neither a dead server nor an automounter is waited for.
constexpr int kWithoutWaiting = AT_STATX_DONT_SYNC | AT_NO_AUTOMOUNT;

bool IsFolder(const Mount& mount) {
  struct statx about {};
  return statx(AT_FDCWD, mount.mountPoint.c_str(), kWithoutWaiting, STATX_TYPE, &about) == 0 &&
         S_ISDIR(about.stx_mode);
}

bool HasMount(const std::vector<Mount>& mounts, int id) {
  return std::any_of(mounts.begin(), mounts.end(),
                     [id](const Mount& mount) { return mount.id == id; });
}

// The table's own mount at "/", where the kernel reports no mount ids: the lowest of a stack.
std::optional<int> LowestRoot(const std::vector<Mount>& mounts) {
  for (const Mount& mount : mounts) {
    const bool isLowest = mount.parent == mount.id || !HasMount(mounts, mount.parent);
    if (mount.mountPoint == "/" && isLowest) return mount.id;
  }
  return std::nullopt;
}

bool IsWithin(std::string_view path, std::string_view folder) {
  if (folder == "/") return path.starts_with('/');
  return path.starts_with(folder) && (path.size() == folder.size() || path[folder.size()] == '/');
}

// What a path has behind a folder that it is within, without "/" in front; empty for the folder.
std::string_view BehindFolder(std::string_view path, std::string_view folder) {
  path.remove_prefix(folder == "/" ? 0 : folder.size());
  if (path.starts_with('/')) path.remove_prefix(1);
  return path;
}

std::string Below(const std::string& folder, std::string_view path) {
  return path.empty() ? folder : foundation::JoinPath(folder, path);
}

template <class Map>
VolumePointer ValueOf(const Map& volumes, const typename Map::key_type& key) {
  const auto found = volumes.find(key);
  return found == volumes.end() ? nullptr : found->second;
}

// Empty for a file system that has none; none for a user who may not read "/" now. Throws
// std::system_error when it cannot be read for another reason.
std::optional<std::string> LabelOfRoot() {
  const Descriptor root(open("/", O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  std::array<char, FSLABEL_MAX + 1> label{};
  if (root.IsOpen() && ioctl(root.Get(), FS_IOC_GETFSLABEL, label.data()) == 0) {
    return label.data();
  }
  const bool canHaveNone = root.IsOpen() && (errno == ENOTTY || errno == EOPNOTSUPP ||
                                             errno == EINVAL || errno == ENOSYS);
  if (canHaveNone) return "";
  if (errno != EACCES) throw std::system_error(errno, std::generic_category());
  return std::nullopt;
}

// `isKnown` is false for a name that has to do for now.
std::string LinuxNameOf(const std::string& mountPoint, bool& isKnown) {
  isKnown = true;
  if (mountPoint != "/") return mountPoint.substr(mountPoint.rfind('/') + 1);
  std::optional<std::string> label = LabelOfRoot();
  isKnown = label.has_value();
  if (!label || label->empty()) return kUnlabelledRoot;
  // A label may hold what no name of an item can.
  std::replace(label->begin(), label->end(), '/', ':');
  return *std::move(label);
}

}  // namespace

Volume::Volume(VolumeNumber number, std::vector<Mount> mounts, std::vector<std::string> covers)
    : mNumber(number), mMounts(std::move(mounts)), mCovers(std::move(covers)) {
  for (const Mount& mount : mMounts) mMountPoints.push_back(mount.mountPoint);
}

std::vector<Mount>::const_iterator Volume::MountWithID(int id) const {
  return std::find_if(mMounts.begin(), mMounts.end(),
                      [id](const Mount& candidate) { return candidate.id == id; });
}

bool Volume::IsMountedAs(int mount) const {
  return MountWithID(mount) != mMounts.end();
}

std::vector<std::string> Volume::PathsOf(const std::string& path, int mount) const {
  const auto own = MountWithID(mount);
  if (own == mMounts.end() || !IsWithin(path, own->mountPoint)) return {path};
  const std::string inside = Below(own->root, BehindFolder(path, own->mountPoint));
  std::vector<std::string> paths;
  for (const Mount& other : mMounts) {
    if (!IsWithin(inside, other.root)) continue;
    paths.push_back(Below(other.mountPoint, BehindFolder(inside, other.root)));
  }
  return paths;
}

const std::optional<ItemReference>& Volume::Root() const {
  if (mRoot) return mRoot;
  const auto found = ReadItem(AT_FDCWD, MountPoint().c_str());
  mIsMoved = found ? found->mount != kNoMount && found->mount != mMounts.front().id
                   : errno == ENOENT || errno == ENOTDIR;
  if (found && !mIsMoved) mRoot = found;
  return mRoot;
}

const std::string& Volume::Name() const {
  if (!mName || !mIsNameKnown) {
    const std::string name = LinuxNameOf(MountPoint(), mIsNameKnown);
    auto plain = PlainHFSName(name, kLongestSpecName);
    mName = plain ? *std::move(plain) : ShortHFSName(name, kRootFolderID);
  }
  return *mName;
}

MountTable& MountTable::OfThisProcess() {
  static MountTable table;
  return table;
}

Mount MountTable::ReadRootMount() {
  Mount root{};
  root.mountPoint = "/";
  struct statx about {};
  if (statx(AT_FDCWD, "/", kWithoutWaiting, STATX_TYPE | STATX_MNT_ID, &about) == 0) {
    root.device = makedev(about.stx_dev_major, about.stx_dev_minor);
    if ((about.stx_mask & STATX_MNT_ID) != 0) root.id = static_cast<int>(about.stx_mnt_id);
  }
  return root;
}

MountTable::MountTable(std::string source, Mount (*readRoot)())
    : mSource(std::move(source)), mReadRoot(readRoot) {}

VolumePointer MountTable::AtIndex(std::size_t index) {
  const bool goesOn = mLastIndex && index == *mLastIndex + 1;
  if (!goesOn) Refresh();
  mLastIndex = index;
  return index < mState.volumes.size() ? mState.volumes[index] : nullptr;
}

VolumePointer MountTable::WithNumber(VolumeNumber number) {
  Refresh();
  if (number == 0) return mState.volumes.front();
  return ValueOf(mState.byNumber, number);
}

VolumePointer MountTable::WithName(std::string_view name) {
  Refresh();
  const auto& volumes = mState.volumes;
  const auto found = std::find_if(volumes.begin(), volumes.end(),
                                  [name](const auto& volume) { return volume->Name() == name; });
  return found == volumes.end() ? nullptr : *found;
}

VolumePointer MountTable::OfItem(const ItemReference& item, std::string_view path) {
  if (item.mount == kNoMount) {
    Refresh();
    const auto& volumes = mState.volumes;
    const auto found = std::find_if(volumes.begin(), volumes.end(), [&item](const auto& volume) {
      return volume->Root() && volume->Root()->device == item.device;
    });
    return found != volumes.end() ? *found : OfPath(path);
  }
  Refresh();
  VolumePointer volume = OfMount(item.mount);
  if (!volume || volume->Root() || !volume->IsMoved()) return volume;
  Distrust();
  Refresh();
  return OfMount(item.mount);
}

VolumePointer MountTable::OfMount(int id) const {
  return ValueOf(mState.byMount, id);
}

VolumePointer MountTable::OfPath(std::string_view path) {
  Refresh();
  VolumePointer longest;
  for (const VolumePointer& volume : mState.volumes) {
    if (!IsWithin(path, volume->MountPoint())) continue;
    if (!longest || volume->MountPoint().size() > longest->MountPoint().size()) longest = volume;
  }
  return longest;
}

bool MountTable::IsReachable(const Volume& volume, std::string path) const {
  const auto& own = volume.MountPoints();
  for (; path.size() > 1; path.resize(path.rfind('/'))) {
    if (IsMountPoint(path)) return std::find(own.begin(), own.end(), path) != own.end();
  }
  return true;
}

void MountTable::Refresh() {
  if (!mIsCurrent || HasChanged()) Read();
}

bool MountTable::HasChanged() const {
  pollfd table{mDescriptor.Get(), POLLPRI, 0};
  return poll(&table, 1, 0) != 0;
}

void MountTable::Read() {
  mIsCurrent = false;
  mLastIndex.reset();
  std::vector<Mount> mounts;
  bool isWhole = false;
  for (int attempt = 0; attempt < kReadAttempts && !isWhole; ++attempt) {
    const auto text = ReadSource();
    if (!text) break;
    mounts = ParseMountInfo(*text);
    // The text comes in several pieces; a mount made between two of them can be missing or shift
    // others out. The kernel has signalled it by now, and signals it only once.
    isWhole = !HasChanged();
  }
  const Mount root = mReadRoot();
  int rootID = root.id;
  if (!HasMount(mounts, rootID)) {
    // There is no table, or "/" is a folder inside a mount (chroot), or the kernel tells no ids.
    const auto lowest = rootID == 0 ? LowestRoot(mounts) : std::nullopt;
    if (!lowest) mounts.insert(mounts.begin(), root);
    rootID = lowest.value_or(root.id);
  }
  mState = StateOf(mounts, rootID);
  mIsCurrent = isWhole;
}

MountTable::State MountTable::StateOf(const std::vector<Mount>& mounts, int rootID) {
  State state;
  std::unordered_set<int> mountIDs;
  std::multimap<int, std::string> byParent;  // mount points
  for (const Mount& mount : mounts) {
    byParent.emplace(mount.parent, mount.mountPoint);
    state.mountPoints.insert(mount.mountPoint);
    state.holders.insert(foundation::FolderOf(mount.mountPoint));
    mountIDs.insert(mount.id);
  }
  for (const auto& indexes : GroupIntoVolumes(mounts, rootID, IsFolder)) {
    std::vector<Mount> own;
    own.reserve(indexes.size());
    for (const std::size_t index : indexes) own.push_back(mounts[index]);
    const auto number = NumberOf(own.front().id, mountIDs);
    if (!number) continue;
    std::vector<std::string> covers;
    for (const Mount& mount : own) {
      const auto [begin, end] = byParent.equal_range(mount.id);
      for (auto cover = begin; cover != end; ++cover) covers.push_back(cover->second);
    }
    auto volume = std::make_shared<Volume>(*number, own, std::move(covers));
    for (const Mount& mount : own) state.byMount[mount.id] = volume;
    state.byNumber[*number] = volume;
    state.volumes.push_back(std::move(volume));
  }
  return state;
}

// None, and the descriptor closed, when it cannot be opened or read whole.
std::optional<std::string> MountTable::ReadSource() {
  if (!mDescriptor.IsOpen()) mDescriptor = Descriptor(open(mSource.c_str(), O_RDONLY | O_CLOEXEC));
  if (!mDescriptor.IsOpen()) return std::nullopt;
  std::string text;
  ssize_t got = 0;
  do {
    std::array<char, 16384> piece;
    got = pread(mDescriptor.Get(), piece.data(), piece.size(), static_cast<off_t>(text.size()));
    if (got > 0) text.append(piece.data(), static_cast<std::size_t>(got));
  } while (got > 0);
  if (got == 0) return text;
  mDescriptor.Close();
  return std::nullopt;
}

// None when every number is taken.
std::optional<VolumeNumber> MountTable::NumberOf(int mountID,
                                                 const std::unordered_set<int>& mountIDs) {
  const auto assigned = mAssignedNumbers.find(mountID);
  if (assigned != mAssignedNumbers.end()) return assigned->second;
  if (mountID > 0 && -mountID >= kLowestNumber && !mTakenNumbers.contains(-mountID)) {
    return static_cast<VolumeNumber>(-mountID);
  }
  for (int number = kLowestNumber; number < 0; ++number) {
    if (mTakenNumbers.contains(number) || mountIDs.contains(-number)) continue;
    mTakenNumbers.insert(number);
    mAssignedNumbers[mountID] = static_cast<VolumeNumber>(number);
    return static_cast<VolumeNumber>(number);
  }
  return std::nullopt;
}

}  // namespace tallowmere::files
