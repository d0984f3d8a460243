#include "kernel/FileSystemKinds.h"

#include <linux/magic.h>
#include <sys/sysmacros.h>

#include <algorithm>
#include <array>

namespace tallowmere::kernel {
namespace {

using names::UpperIDs;

// The types that <linux/magic.h> lacks: that of hfs is in statfs(2), hfsplus reports its volume's
// signature (TN1150), and bcachefs a number of its own (the kernel's fs/bcachefs).
constexpr std::uint32_t kBcachefs = 0xCA451A4E;
constexpr std::uint32_t kHFS = 0x4244;
constexpr std::uint32_t kHFSPlus = 0x482B;

// For a type that stands for several kinds.
enum class Only : std::uint8_t {
  kAlways,
  kOnDisk,         // its device is a block device
  kCountedInodes,  // statfs counts inodes
};

struct Row {
  std::uint32_t type;
  Only only;
  FileSystemKind kind;
};

// Documents are those of Linux 6.12, below Documentation/filesystems; "seen" marks the result of an
// experiment on Linux 6.18. The first row that matches counts.
constexpr auto kRows = std::to_array<Row>({
    // ext2, ext3 and ext4 share one type. Inode numbers index the inode tables, have 32 bits, and
    // are in the entries: ext4/inodes.rst, ext4/directory.rst. Links: ext4/inodes.rst,
    // i_links_count. Handles: seen, also after the caches were dropped.
    {EXT4_SUPER_MAGIC,
     Only::kAlways,
     {.name = "ext",
      .numbersTellItemsApart = true,
      .numberBits = 32,
      .upperIDs = UpperIDs::kFolded,
      .entriesTellNumbers = true,
      .keepsNumbers = true,
      .countsSubfolders = true,
      .findsAllByHandle = true,
      .byNumber = ByNumber::kInode}},

    // An inode number is the inode's position on the disk, with inode64 of more than 32 bits:
    // admin-guide/xfs.rst, inode64. Generations by ioctl_xfs_bulkstat(2), and everything else:
    // seen.
    {XFS_SUPER_MAGIC,
     Only::kAlways,
     {.name = "xfs",
      .numbersTellItemsApart = true,
      .upperIDs = UpperIDs::kFolded,
      .entriesTellNumbers = true,
      .keepsNumbers = true,
      .countsSubfolders = true,
      .findsAllByHandle = true,
      .byNumber = ByNumber::kInodeAndGeneration}},

    // Each subvolume has inode numbers and a device of its own: seen. Folders have one link
    // whatever they contain: seen.
    {BTRFS_SUPER_MAGIC,
     Only::kAlways,
     {.name = "btrfs",
      .numbersTellItemsApart = true,
      .upperIDs = UpperIDs::kSubvolumes,
      .entriesTellNumbers = true,
      .keepsNumbers = true,
      .findsAllByHandle = true,
      .byNumber = ByNumber::kInodeAndSubvolume}},

    // tmpfs.rst, inode64: "avoids the possibility of multiple files with the same inode number".
    // With inode32 that possibility begins at the 2^32nd file. Links, handles: seen.
    {TMPFS_MAGIC,
     Only::kAlways,
     {.name = "tmpfs",
      .numbersTellItemsApart = true,
      .entriesTellNumbers = true,
      .keepsNumbers = true,
      .countsSubfolders = true,
      .findsAllByHandle = true}},

    // squashfs.rst: "Real inode numbers: yes"; of 32 bits, as the handles carry them: seen. Without
    // an export table, handles open nothing: seen.
    {SQUASHFS_MAGIC,
     Only::kAlways,
     {.name = "squashfs",
      .numbersTellItemsApart = true,
      .numberBits = 32,
      .upperIDs = UpperIDs::kFolded,
      .entriesTellNumbers = true,
      .keepsNumbers = true,
      .byNumber = ByNumber::kInode}},

    // erofs.rst: an inode number is the inode's position on the disk.
    {EROFS_SUPER_MAGIC_V1,
     Only::kAlways,
     {.name = "erofs",
      .numbersTellItemsApart = true,
      .entriesTellNumbers = true,
      .keepsNumbers = true}},

    // f2fs.rst: the node address table maps an inode's number to its place; an entry has the
    // number.
    {F2FS_SUPER_MAGIC,
     Only::kAlways,
     {.name = "f2fs",
      .numbersTellItemsApart = true,
      .entriesTellNumbers = true,
      .keepsNumbers = true}},

    // Catalog node ids, of 32 bits, are never reused: Inside Macintosh: Files, "Catalog Files".
    // Names are found without regard to case, and mounted without a code page are the bytes of the
    // disk: hfs.rst.
    {kHFS,
     Only::kAlways,
     {.name = "hfs",
      .numbersTellItemsApart = true,
      .numberBits = 32,
      .upperIDs = UpperIDs::kFolded,
      .entriesTellNumbers = true,
      .keepsNumbers = true,
      .ignoresCase = true,
      .namesCanBeMacRoman = true}},

    // Likewise: Technical Note TN1150, "Catalog File", "String Comparison Algorithm". The entry of
    // a hard link has its own number there ("Hard Links").
    {kHFSPlus,
     Only::kAlways,
     {.name = "hfsplus",
      .numbersTellItemsApart = true,
      .numberBits = 32,
      .upperIDs = UpperIDs::kFolded,
      .keepsNumbers = true,
      .ignoresCase = true,
      .longNamesHadShortForms = true}},

    // Inodes are numbered as they are encountered and lose the number when they leave memory:
    // vfat.rst, nfs=stale_rw. With nfs=nostale_ro it is a position on the disk, of 40 bits:
    // FILEID_FAT in <linux/exportfs.h>. Case: vfat.rst, check=; exfat likewise.
    {MSDOS_SUPER_MAGIC,
     Only::kAlways,
     {.name = "vfat",
      .numbersTellItemsApart = true,
      .upperIDs = UpperIDs::kFolded,
      .ignoresCase = true}},
    {EXFAT_SUPER_MAGIC,
     Only::kAlways,
     {.name = "exfat",
      .numbersTellItemsApart = true,
      .upperIDs = UpperIDs::kFolded,
      .ignoresCase = true}},

    // The number is the position of a record on the disk, in units of 32 bytes: isofs_get_ino in
    // the kernel's fs/isofs/isofs.h.
    {ISOFS_SUPER_MAGIC,
     Only::kAlways,
     {.name = "iso9660",
      .numbersTellItemsApart = true,
      .upperIDs = UpperIDs::kFolded,
      .keepsNumbers = true}},

    // The number is that of the inode's block, of 32 bits: FILEID_UDF in <linux/exportfs.h>.
    {UDF_SUPER_MAGIC,
     Only::kAlways,
     {.name = "udf",
      .numbersTellItemsApart = true,
      .numberBits = 32,
      .upperIDs = UpperIDs::kFolded,
      .keepsNumbers = true}},

    // overlayfs.rst, "Inode properties": st_dev and st_ino together are unique, and those of files
    // are in the entries. Over several file systems folders are numbered in memory. Seen: not
    // unique when the layers are on several subvolumes of btrfs; f_files is that of the uppermost
    // layer, 0 on btrfs.
    {OVERLAYFS_SUPER_MAGIC,
     Only::kCountedInodes,
     {.name = "overlay", .numbersTellItemsApart = true, .keepsNumbers = true}},
    {OVERLAYFS_SUPER_MAGIC,
     Only::kAlways,
     {.name = "overlay that counts no inodes", .keepsNumbers = true}},

    // RFC 1813, fattr3: "fileid: a number which uniquely identifies the file within its file
    // system", and fsid; RFC 8881, 5.8.2.7. An entry has the fileid: entry3.
    {NFS_SUPER_MAGIC,
     Only::kAlways,
     {.name = "nfs",
      .numbersTellItemsApart = true,
      .entriesTellNumbers = true,
      .keepsNumbers = true}},

    // fuse.rst: fuseblk is a file system on a disk, served by a process. Numbers are its own.
    {FUSE_SUPER_MAGIC, Only::kOnDisk, {.name = "fuseblk", .numbersTellItemsApart = true}},

    // Numbers are the server's, which can present several file systems as one: seen with bindfs
    // over subvolumes of btrfs. virtiofs is FUSE: virtiofs.rst.
    {FUSE_SUPER_MAGIC, Only::kAlways, {.name = "fuse"}},

    // Also the server's. admin-guide/cifs/usage.rst, serverino: "the server does not guarantee that
    // the inode numbers are unique".
    {V9FS_MAGIC, Only::kAlways, {.name = "9p"}},
    {SMB_SUPER_MAGIC, Only::kAlways, {.name = "smb"}},
    {CIFS_SUPER_MAGIC, Only::kAlways, {.name = "smb"}},
    {SMB2_SUPER_MAGIC, Only::kAlways, {.name = "smb"}},

    // Subvolumes share one device but have inode numbers of their own: FILEID_BCACHEFS in
    // <linux/exportfs.h>.
    {kBcachefs, Only::kAlways, {.name = "bcachefs"}},
});

constexpr FileSystemKind kUnknown{.name = "unknown"};

bool Fits(Only only, std::uint64_t fileCount, std::uint64_t device) {
  switch (only) {
    case Only::kOnDisk:
      return major(device) != 0;
    case Only::kCountedInodes:
      return fileCount != 0;
    case Only::kAlways:
      break;
  }
  return true;
}

// Sorted. A file system that is missing here is assumed to hold files.
constexpr auto kKernelInterfaces = std::to_array<std::string_view>({
    "anon_inodefs", "apparmorfs", "autofs",     "bdev",       "binder",     "binfmt_misc",
    "bpf",          "cgroup",     "cgroup2",    "configfs",   "cpuset",     "debugfs",
    "devpts",       "devtmpfs",   "dlmfs",      "efivarfs",   "functionfs", "fusectl",
    "gadgetfs",     "hugetlbfs",  "ibmasmfs",   "mqueue",     "nfsd",       "nsfs",
    "ocfs2_dlmfs",  "openpromfs", "oprofilefs", "pidfs",      "pipefs",     "proc",
    "pstore",       "resctrl",    "rpc_pipefs", "securityfs", "selinuxfs",  "smackfs",
    "sockfs",       "spufs",      "sysfs",      "tracefs",    "usbdevfs",   "usbfs",
    "xenfs",
});
static_assert(std::is_sorted(kKernelInterfaces.begin(), kKernelInterfaces.end()));

// Sorted. The names of FUSE file systems all begin with its own.
constexpr auto kServed = std::to_array<std::string_view>({
    "9p",
    "afs",
    "beegfs",
    "ceph",
    "cifs",
    "coda",
    "gfs2",
    "lustre",
    "ncpfs",
    "nfs",
    "nfs4",
    "ocfs2",
    "orangefs",
    "smb3",
    "smbfs",
    "vboxsf",
    "virtiofs",
    "vmhgfs",
});
static_assert(std::is_sorted(kServed.begin(), kServed.end()));

}  // namespace

const FileSystemKind& KindOf(std::uint32_t type, std::uint64_t fileCount, std::uint64_t device) {
  const auto row = std::find_if(kRows.begin(), kRows.end(), [&](const Row& candidate) {
    return candidate.type == type && Fits(candidate.only, fileCount, device);
  });
  return row == kRows.end() ? kUnknown : row->kind;
}

bool HoldsFiles(std::string_view mountedType) {
  return !std::binary_search(kKernelInterfaces.begin(), kKernelInterfaces.end(), mountedType);
}

bool NeedsServer(std::string_view mountedType) {
  return mountedType.starts_with("fuse") ||
         std::binary_search(kServed.begin(), kServed.end(), mountedType);
}

}  // namespace tallowmere::kernel
