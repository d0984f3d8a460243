#include "files/ItemReference.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>

#include <bit>
#include <ctime>

namespace tallowmere::files {
namespace {

// Longer than the coarsest tick of a stored time of birth, one second.
constexpr std::int64_t kNewbornSeconds = 2;

bool HasBirth(const ItemReference& item) {
  return item.birthNanoseconds != kNoBirth;
}

// True also for a birth in the future, by a clock that is not ours.
bool IsNewborn(const ItemReference& item) {
  timespec now{};
  clock_gettime(CLOCK_REALTIME, &now);
  return item.birthSeconds + kNewbornSeconds >= now.tv_sec;
}

// Devices without hardware, as those of overlays, have the major number 0.
bool IsProvedByBirth(const ItemReference& item) {
  return HasBirth(item) && major(item.device) != 0 && !IsNewborn(item);
}

}  // namespace

FSRef Pack(const ItemReference& item) {
  return std::bit_cast<FSRef>(item);
}

std::optional<ItemReference> Unpack(const FSRef* reference) {
  if (reference == nullptr) return std::nullopt;
  const auto item = std::bit_cast<ItemReference>(*reference);
  if (item.type == 0 || item.handle.size > kLongestHandle) return std::nullopt;
  return item;
}

bool MeansGone(int error) {
  return error == ENOENT || error == ENOTDIR || error == ELOOP;
}

bool HasHandle(const ItemReference& item) {
  return item.handle.size != 0;
}

bool AreEqual(const ItemReference& first, const ItemReference& second) {
  return first.device == second.device && first.inode == second.inode;
}

std::int64_t Nanoseconds(std::int64_t seconds, std::int64_t nanoseconds) {
  constexpr std::uint64_t kInASecond = 1'000'000'000;
  return static_cast<std::int64_t>(static_cast<std::uint64_t>(seconds) * kInASecond +
                                   static_cast<std::uint64_t>(nanoseconds));
}

std::optional<ItemStatus> ReadStatus(int folder, const char* name) {
  struct statx about {};
  const int emptyPath = *name == '\0' ? AT_EMPTY_PATH : 0;
  if (statx(folder, name, AT_SYMLINK_NOFOLLOW | AT_NO_AUTOMOUNT | emptyPath,
            STATX_TYPE | STATX_INO | STATX_NLINK | STATX_BTIME | STATX_CTIME | STATX_MNT_ID,
            &about) != 0) {
    return std::nullopt;
  }
  ItemReference item{};
  item.inode = about.stx_ino;
  item.device = makedev(about.stx_dev_major, about.stx_dev_minor);
  const bool hasBirth = (about.stx_mask & STATX_BTIME) != 0;
  item.birthSeconds = hasBirth ? about.stx_btime.tv_sec : 0;
  item.birthNanoseconds = hasBirth ? about.stx_btime.tv_nsec : kNoBirth;
  const bool hasMount = (about.stx_mask & STATX_MNT_ID) != 0;
  item.mount = hasMount ? static_cast<std::int32_t>(about.stx_mnt_id) : kNoMount;
  item.type = about.stx_mode & S_IFMT;
  return ItemStatus{item, Nanoseconds(about.stx_ctime.tv_sec, about.stx_ctime.tv_nsec),
                    about.stx_nlink};
}

std::optional<ItemReference> ReadItem(int folder, const char* name) {
  auto status = ReadStatus(folder, name);
  if (!status) return std::nullopt;
  ReadProof(status->item, folder, name);
  return status->item;
}

// The item may have been replaced since it was read. The reference is then to no item at all,
// unless number and birth are the new one's as well.
void ReadProof(ItemReference& item, int folder, const char* name) {
  if (!IsProvedByBirth(item)) item.handle = ReadHandle(folder, name);
}

bool IsAt(const ItemReference& item, int folder, const char* name) {
  const auto status = ReadStatus(folder, name);
  if (!status) return false;
  const ItemReference* const found = &status->item;
  if (!AreEqual(*found, item) || found->type != item.type) return false;
  if (HasHandle(item)) return ReadHandle(folder, name) == item.handle;
  if (found->birthSeconds != item.birthSeconds) return false;
  if (found->birthNanoseconds != item.birthNanoseconds) return false;
  return HasBirth(item) || found->mount == item.mount;
}

}  // namespace tallowmere::files
