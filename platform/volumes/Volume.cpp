#include "volumes/Volume.h"

#include <algorithm>
#include <utility>

#include "foundation/ColonsAndSlashes.h"
#include "foundation/PathText.h"
#include "kernel/MountTableFile.h"
#include "kernel/VolumeFacts.h"
#include "names/HFSNames.h"
#include "text/FileNameText.h"
#include "text/MacRoman.h"

namespace tallowmere::volumes {
namespace {

// The name of the volume of "/" when its file system has no label.
constexpr const char* kUnlabelledRoot = "Root";

// The path relative to a folder that contains it; empty for the folder itself.
std::string_view BehindFolder(std::string_view path, std::string_view folder) {
  path.remove_prefix(folder == "/" ? 0 : folder.size());
  if (path.starts_with('/')) path.remove_prefix(1);
  return path;
}

std::string Below(const std::string& folder, std::string_view path) {
  return path.empty() ? folder : foundation::JoinPath(folder, path);
}

// Whether an error means that this process may not read the label, or that the device does not
// return it: another process may succeed.
bool HidesLabel(kernel::Error error) {
  return kernel::MeansRefused(error) || error.number == EIO;
}

std::string HFSNameOfVolume(const std::string& linuxName) {
  auto plain = names::PlainHFSName(linuxName, names::kLongestSpecName);
  return plain ? *std::move(plain) : names::ShortHFSName(linuxName, names::kRootFolderID);
}

// 0 for an item in no subvolume, or whose handle was not read.
std::uint64_t SubvolumeOfItem(const kernel::Item& item) {
  return kernel::SubvolumeOf(item.handle, item.inode).value_or(0);
}

// Whether the item found at a mount point is not what is mounted there, but something else or
// something in it.
bool IsMoved(const kernel::Result<kernel::Status>& found, int mount, bool isProcessRoot) {
  if (!found) return found.Error().number == ENOENT || found.Error().number == ENOTDIR;
  if (!found->isTopOfMount && !isProcessRoot) return true;
  return found->item.mount != kernel::kNoMount && found->item.mount != mount;
}

}  // namespace

ListedVolume::ListedVolume(VolumeNumber number, std::vector<Place> places,
                           std::vector<std::string> covers)
    : mNumber(number), mPlaces(std::move(places)), mCovers(std::move(covers)) {}

const std::vector<std::string>& ListedVolume::MountPoints() const {
  if (!mMountPoints.empty()) return mMountPoints;
  std::vector<std::string> mountPoints{MountPoint()};
  for (auto place = mPlaces.begin() + 1; place != mPlaces.end(); ++place) {
    const std::string& mountPoint = place->mount.mountPoint;
    if (place->mayBeFile && !kernel::IsFolderByMemory(mountPoint)) continue;
    mountPoints.push_back(mountPoint);
  }
  mMountPoints = std::move(mountPoints);
  return mMountPoints;
}

const ListedVolume::Place* ListedVolume::PlaceWithID(int mount) const {
  const auto found = std::find_if(mPlaces.begin(), mPlaces.end(),
                                  [mount](const Place& place) { return place.mount.id == mount; });
  return found == mPlaces.end() ? nullptr : &*found;
}

bool ListedVolume::IsMountedAs(int mount) const {
  return PlaceWithID(mount) != nullptr;
}

std::vector<std::string> ListedVolume::PathsOf(const std::string& path, int mount) const {
  const Place* const own = PlaceWithID(mount);
  if (own == nullptr || !foundation::IsWithin(path, own->mount.mountPoint)) return {path};
  const std::string inside = Below(own->mount.root, BehindFolder(path, own->mount.mountPoint));
  std::vector<std::string> paths;
  for (const Place& other : mPlaces) {
    if (!foundation::IsWithin(inside, other.mount.root)) continue;
    paths.push_back(Below(other.mount.mountPoint, BehindFolder(inside, other.mount.root)));
  }
  return paths;
}

kernel::Result<std::string_view> ListedVolume::Name() const {
  if (mIsNameKnown) return std::string_view(mName);
  if (MountPoint() != "/") {
    mName = HFSNameOfVolume(std::string(*foundation::LastComponent(MountPoint())));
    mIsNameKnown = true;
    return std::string_view(mName);
  }
  auto label = kernel::ReadRootLabel();
  if (!label && !HidesLabel(label.Error())) return label.Error();
  const bool isLabelled = label && !label->empty();
  // A label may contain characters that no item's name can.
  if (isLabelled) std::replace(label->begin(), label->end(), '/', ':');
  mName = HFSNameOfVolume(isLabelled ? *label : kUnlabelledRoot);
  mIsNameKnown = static_cast<bool>(label);
  return std::string_view(mName);
}

kernel::Result<std::u16string> ListedVolume::FullName() const {
  if (MountPoint() != "/") {
    return foundation::ExchangeColonsAndSlashes(
        text::TextOfFileName(*foundation::LastComponent(MountPoint())));
  }
  const auto name = Name();
  if (!name) return name.Error();
  return text::DecodeMacRoman(*name);
}

kernel::Result<VolumePointer> ListedVolume::Enter() const {
  if (!mEntered) {
    const kernel::Spot place = kernel::AtPath(MountPoint().c_str());
    const auto root = kernel::ReadStatus(place);
    if (IsMoved(root, mPlaces.front().mount.id, MountPoint() == "/")) return kMoved;
    if (!root) return root.Error();
    const auto kind = kernel::ReadKind(MountPoint(), root->item.device);
    if (!kind) return kind.Error();
    kernel::Item item = root->item;
    // Subvolumes are known from handles.
    if ((*kind)->upperIDs == names::UpperIDs::kSubvolumes) item.handle = kernel::HandleAt(place);
    mEntered.emplace(*this, item, **kind);
  }
  return VolumePointer(shared_from_this(), &*mEntered);
}

Volume::Volume(const ListedVolume& listed, const kernel::Item& root,
               const kernel::FileSystemKind& kind)
    : mListed(listed),
      mRoot(root),
      mKind(kind),
      mRule{{root.inode, root.device, SubvolumeOfItem(root)}, kind.upperIDs} {}

VolumeNumber Volume::Number() const {
  return mListed.Number();
}

const std::string& Volume::MountPoint() const {
  return mListed.MountPoint();
}

bool Volume::NeedsHandleForID(const kernel::Item& item) const {
  return SubvolumeOfItem(item) == 0 && names::NeedsSubvolume({item.inode, item.device, 0}, mRule);
}

std::uint32_t Volume::IDOf(const kernel::Item& item) const {
  return names::NodeIDOf({item.inode, item.device, SubvolumeOfItem(item)}, mRule);
}

std::uint32_t Volume::IDOfEntry(std::uint64_t inode, const kernel::Item& folder) const {
  return names::NodeIDOf({inode, folder.device, SubvolumeOfItem(folder)}, mRule);
}

std::uint64_t Volume::HighestInode() const {
  return kernel::HighestInode(mKind, MountPoint());
}

bool Volume::IsCertain(std::uint32_t id) const {
  if (!NumbersIdentifyItems()) return false;
  return names::IsInodeNumber(id) || id == names::kRootFolderID ||
         names::IsCertain(id, mRule, HighestInode());
}

bool Volume::IsRoot(const kernel::Item& item, const std::string& path) const {
  if (!kernel::HaveSameNumbers(item, mRoot)) return false;
  const auto& mountPoints = mListed.MountPoints();
  return NumbersIdentifyItems() ||
         std::find(mountPoints.begin(), mountPoints.end(), path) != mountPoints.end();
}

}  // namespace tallowmere::volumes
