#include "MainVolume.h"

#include <sys/mount.h>

#include <algorithm>
#include <array>
#include <cstdint>
#include <string_view>

#include "Served.h"
#ifdef TALLOWMERE_HAS_FUSE
#include "PassThrough.h"
#endif

namespace tallowmere::soak {
namespace {

struct Disk {
  std::string_view kind;
  std::vector<std::string> makeCommand;
  std::uintmax_t size;
};

// Each size is about the smallest that the tool accepts.
const std::vector<Disk>& Disks() {
  static const std::vector<Disk> disks{{"ext4", {"mkfs.ext4", "-q", "-F"}, 64 << 20},
                                       {"xfs", {"mkfs.xfs", "-q", "-f"}, 320 << 20},
                                       {"btrfs", {"mkfs.btrfs", "-q", "-f"}, 128 << 20}};
  return disks;
}

constexpr auto kTrustedOthers = std::to_array<std::string_view>({"tmpfs", "overlay", "fuseblk"});
constexpr auto kUntrusted =
    std::to_array<std::string_view>({"fuse", "fuse-one-number", "bindfs", "fuse-overlayfs"});

Numbers NumbersOf(const std::string& kind) {
  if (kind == "fuseblk") return Numbers::kServed;
  const bool isUntrusted =
      std::find(kUntrusted.begin(), kUntrusted.end(), kind) != kUntrusted.end();
  return isUntrusted ? Numbers::kUntrusted : Numbers::kTrusted;
}

bool IsMounted(const char* type, const std::string& place, const std::string& options = "") {
  return mount("none", place.c_str(), type, 0, options.c_str()) == 0;
}

}  // namespace

std::vector<std::string> MainVolume::Kinds() {
  std::vector<std::string> kinds;
  for (const Disk& disk : Disks()) kinds.emplace_back(disk.kind);
  kinds.insert(kinds.end(), kTrustedOthers.begin(), kTrustedOthers.end());
  kinds.insert(kinds.end(), kUntrusted.begin(), kUntrusted.end());
  return kinds;
}

bool MainVolume::IsKind(const std::string& kind) {
  const auto kinds = Kinds();
  return std::find(kinds.begin(), kinds.end(), kind) != kinds.end();
}

MainVolume::MainVolume(const std::string& kind) : mKind(kind), mNumbers(NumbersOf(kind)) {
  for (const Disk& disk : Disks()) {
    if (disk.kind == kind) mImage.emplace(kind, disk.makeCommand, disk.size);
  }
}

std::optional<std::string> MainVolume::Mount() {
  if (mImage) {
    if (!mImage->IsMade() || !mImage->Mount()) return std::nullopt;
    return mImage->Path();
  }
  const std::string place = FolderFor("mounted");
  bool isMounted = false;
  if (mKind == "tmpfs") {
    isMounted = IsMounted("tmpfs", place);
  } else if (mKind == "overlay") {
    isMounted = MountOverlay(place);
  } else {
    isMounted = MountServed(place);
  }
  if (!isMounted) return std::nullopt;
  return place;
}

namespace {

// The layers of an overlay, all on one file system.
struct Layers {
  explicit Layers(const std::string& folder)
      : lower(folder + "/lower"), upper(folder + "/upper"), work(folder + "/work") {
    for (const std::string& layer : {lower, upper, work}) std::filesystem::create_directory(layer);
    std::filesystem::create_directory(lower + "/of the lower layer");
  }
  std::string Options() const {
    return "lowerdir=" + lower + ",upperdir=" + upper + ",workdir=" + work;
  }
  std::string lower;
  std::string upper;
  std::string work;
};

}  // namespace

bool MainVolume::MountOverlay(const std::string& place) {
  const std::string folder = FolderFor("layers");
  if (!IsMounted("tmpfs", folder)) return false;
  return IsMounted("overlay", place, Layers(folder).Options());
}

bool MainVolume::MountServed(const std::string& place) {
  const std::string source = FolderFor("source");
  if (!IsMounted("tmpfs", source)) return false;
  if (mKind == "bindfs") return IsServedBy({"bindfs", "-f", source, place}, place);
  if (mKind == "fuse-overlayfs") {
    return IsServedBy({"fuse-overlayfs", "-f", "-o", Layers(source).Options(), place}, place);
  }
#ifdef TALLOWMERE_HAS_FUSE
  const PassThrough how{.onBlockDevice = mKind == "fuseblk",
                        .oneNumber = mKind == "fuse-one-number"};
  return MountPassThrough(source, place, how);
#else
  return false;
#endif
}

}  // namespace tallowmere::soak
