#include "kernel/Item.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>

namespace tallowmere::kernel {
namespace {

// Longer than the coarsest resolution of a stored time of birth, one second.
constexpr std::int64_t kNewbornSeconds = 2;
constexpr std::int64_t kNanosecondsInASecond = 1'000'000'000;

bool HasBirth(const Item& item) {
  return item.birthNanoseconds != kNoBirth;
}

bool HasHandle(const Item& item) {
  return item.handle.size != 0;
}

// Also true for a birth in the future, by another machine's clock.
bool IsNewborn(const Item& item) {
  return item.birthSeconds + kNewbornSeconds >= Now() / kNanosecondsInASecond;
}

// Devices without hardware, such as those of overlays, have the major number 0.
bool IsProvedByBirth(const Item& item) {
  return HasBirth(item) && major(item.device) != 0 && !IsNewborn(item);
}

bool HaveSameBirth(const Item& first, const Item& second) {
  return first.birthSeconds == second.birthSeconds &&
         first.birthNanoseconds == second.birthNanoseconds;
}

}  // namespace

bool IsFolder(const Item& item) {
  return S_ISDIR(item.type);
}

bool IsLink(const Item& item) {
  return S_ISLNK(item.type);
}

bool IsRegularFile(const Item& item) {
  return S_ISREG(item.type);
}

std::uint64_t DeviceNumber(unsigned majorNumber, unsigned minorNumber) {
  return makedev(majorNumber, minorNumber);
}

bool HaveSameNumbers(const Item& first, const Item& second) {
  return first.device == second.device && first.inode == second.inode;
}

Spot AtPath(const char* path) {
  return {AT_FDCWD, path};
}

Spot AtOpen(int descriptor) {
  return {descriptor, ""};
}

Result<Status> ReadStatus(const Spot& spot) {
  struct statx about {};
  const int emptyPath = *spot.name == '\0' ? AT_EMPTY_PATH : 0;
  if (statx(spot.folder, spot.name, AT_SYMLINK_NOFOLLOW | AT_NO_AUTOMOUNT | emptyPath,
            STATX_TYPE | STATX_INO | STATX_NLINK | STATX_BTIME | STATX_CTIME | STATX_MNT_ID,
            &about) != 0) {
    return Error::OfLastCall();
  }
  Item item{};
  item.inode = about.stx_ino;
  item.device = DeviceNumber(about.stx_dev_major, about.stx_dev_minor);
  const bool hasBirth = (about.stx_mask & STATX_BTIME) != 0;
  item.birthSeconds = hasBirth ? about.stx_btime.tv_sec : 0;
  item.birthNanoseconds = hasBirth ? about.stx_btime.tv_nsec : kNoBirth;
  // An emulator may report 0, which is no mount's id.
  const bool hasMount = (about.stx_mask & STATX_MNT_ID) != 0 && about.stx_mnt_id != 0;
  item.mount = hasMount ? static_cast<std::int32_t>(about.stx_mnt_id) : kNoMount;
  item.type = about.stx_mode & S_IFMT;
  const bool isBelowTop = (about.stx_attributes_mask & ~about.stx_attributes &
                           static_cast<std::uint64_t>(STATX_ATTR_MOUNT_ROOT)) != 0;
  return Status{item, NanosecondsOf(about.stx_ctime.tv_sec, about.stx_ctime.tv_nsec),
                about.stx_nlink, !isBelowTop};
}

Result<Item> ReadItem(const Spot& spot) {
  auto status = ReadStatus(spot);
  if (!status) return status.Error();
  ReadProof(status->item, spot);
  return status->item;
}

FileHandle HandleAt(const Spot& spot) {
  const auto handle = ReadHandleToIdentify(spot.folder, spot.name);
  return handle ? *handle : FileHandle{};
}

void ReadProof(Item& item, const Spot& spot) {
  if (!IsProvedByBirth(item)) item.handle = HandleAt(spot);
}

bool IsAt(const Item& item, const Spot& spot) {
  const auto status = ReadStatus(spot);
  if (!status) return false;
  Item found = status->item;
  if (!HaveSameNumbers(found, item)) return false;
  if (HasHandle(item)) found.handle = HandleAt(spot);
  return IsProvedSame(found, item);
}

bool IsProvedSame(const Item& first, const Item& second) {
  if (!HaveSameNumbers(first, second) || first.type != second.type) return false;
  if (HasHandle(first) || HasHandle(second)) return first.handle == second.handle;
  if (!HaveSameBirth(first, second)) return false;
  return HasBirth(first) || first.mount == second.mount;
}

}  // namespace tallowmere::kernel
