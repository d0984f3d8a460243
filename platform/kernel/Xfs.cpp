#include "kernel/Xfs.h"

#include <sys/ioctl.h>

#include <bit>

namespace tallowmere::kernel {
namespace {

// The records of ioctl_xfs_bulkstat(2) and ioctl_xfs_fsgeometry(2); `others` stands for fields that
// are not needed here.
struct BulkHeader {
  std::uint64_t inode;  // the first to look for
  std::uint32_t flags;
  std::uint32_t room;   // in records
  std::uint32_t count;  // records filled in
  std::uint32_t group;
  std::uint64_t reserved[5];
};
static_assert(sizeof(BulkHeader) == 64);

struct BulkRecord {
  std::uint64_t inode;
  std::uint64_t others1[7];
  std::uint32_t generation;
  std::uint32_t others2[15];
  std::uint16_t others3[4];
  std::uint64_t others4[7];
};
static_assert(sizeof(BulkRecord) == 192);

struct Geometry {
  std::uint32_t blockSize;  // in bytes
  std::uint32_t other1;
  std::uint32_t groupBlocks;
  std::uint32_t groups;
  std::uint32_t others2[2];
  std::uint32_t inodeSize;  // in bytes
  std::uint32_t others3[57];
};
static_assert(sizeof(Geometry) == 256);

// XFS_IOC_BULKSTAT and XFS_IOC_FSGEOMETRY of <xfs/xfs_fs.h>. The former is defined with the
// header's size.
constexpr unsigned long kBulkStat = _IOR('X', 127, BulkHeader);
constexpr unsigned long kGeometry = _IOR('X', 126, Geometry);

}  // namespace

// Bulkstat finds the first item with this number or a higher one.
Result<std::uint32_t> ReadXfsGeneration(int onVolume, std::uint64_t inode) {
  struct {
    BulkHeader header;
    BulkRecord record;
  } request{};
  request.header.inode = inode;
  request.header.room = 1;
  if (ioctl(onVolume, kBulkStat, &request) != 0) return Error::OfLastCall();
  if (request.header.count != 1 || request.record.inode != inode) return Error{ENOENT};
  return request.record.generation;
}

// A number consists of the group, the block in the group, and the inode in the block.
Result<std::uint64_t> ReadHighestXfsInode(int onVolume) {
  Geometry geometry{};
  if (ioctl(onVolume, kGeometry, &geometry) != 0) return Error::OfLastCall();
  const std::uint64_t blocks = std::bit_ceil(std::uint64_t{geometry.groupBlocks});
  return geometry.groups * blocks * (geometry.blockSize / geometry.inodeSize) - 1;
}

}  // namespace tallowmere::kernel
