#include "kernel/FileHandle.h"

#include <fcntl.h>

#include <cstring>
#include <limits>

namespace tallowmere::kernel {
namespace {

// Asks for a handle that only identifies an item. The number is from <linux/fcntl.h>.
constexpr int kOnlyToIdentify = 0x200;

// Types of handles, as enum fid_type in the kernel's <linux/exportfs.h> describes them, and their
// sizes. Numbers are in the machine's byte order.
constexpr std::int32_t kInode32 = 1;       // FILEID_INO32_GEN: inode, generation (32 bits)
constexpr std::int32_t kInode64 = 0x81;    // FILEID_INO64_GEN: inode (64 bits), generation
constexpr std::int32_t kSubvolume = 0x4D;  // FILEID_BTRFS_WITHOUT_PARENT: inode, subvolume (64
                                           // bits each), generation
constexpr std::uint32_t kInode32Size = 8;
constexpr std::uint32_t kInode64Size = 12;
constexpr std::uint32_t kSubvolumeSize = 20;

bool HasForm(const FileHandle& handle, std::int32_t type, std::uint32_t size) {
  return handle.type == type && handle.size == size;
}

template <class Number>
Number Get(const FileHandle& handle, std::size_t offset) {
  Number number{};
  std::memcpy(&number, handle.bytes.data() + offset, sizeof number);
  return number;
}

// Concatenates the bytes of numbers.
template <class... Numbers>
FileHandle MakeHandle(std::int32_t type, std::uint32_t size, Numbers... numbers) {
  FileHandle handle{type, size, {}};
  std::uint8_t* end = handle.bytes.data();
  ((std::memcpy(end, &numbers, sizeof numbers), end += sizeof numbers), ...);
  return handle;
}

// The kernel's record with room for the longest handle.
struct HandleBuffer {
  alignas(file_handle) std::array<std::uint8_t, sizeof(file_handle) + kLongestHandle> bytes{};

  file_handle* Get() { return reinterpret_cast<file_handle*>(bytes.data()); }
  std::uint8_t* Handle() { return bytes.data() + sizeof(file_handle); }
};

Result<FileHandle> ReadHandle(int folder, const char* name, int flags) {
  HandleBuffer buffer;
  int mount = 0;
  buffer.Get()->handle_bytes = kLongestHandle;
  if (*name == '\0') flags |= AT_EMPTY_PATH;
  if (name_to_handle_at(folder, name, buffer.Get(), &mount, flags) != 0) return Error::OfLastCall();
  FileHandle handle{buffer.Get()->handle_type, buffer.Get()->handle_bytes, {}};
  std::memcpy(handle.bytes.data(), buffer.Handle(), handle.size);
  return handle;
}

}  // namespace

Result<FileHandle> ReadHandle(int folder, const char* name) {
  return ReadHandle(folder, name, 0);
}

Result<FileHandle> ReadHandleToIdentify(int folder, const char* name) {
  auto handle = ReadHandle(folder, name, 0);
  return handle.Error().number == EOPNOTSUPP ? ReadHandle(folder, name, kOnlyToIdentify) : handle;
}

Result<Descriptor> OpenByHandle(int onVolume, const FileHandle& handle) {
  HandleBuffer buffer;
  buffer.Get()->handle_bytes = handle.size;
  buffer.Get()->handle_type = handle.type;
  std::memcpy(buffer.Handle(), handle.bytes.data(), handle.size);
  Descriptor opened(open_by_handle_at(onVolume, buffer.Get(), O_PATH | O_CLOEXEC));
  if (!opened.IsOpen()) return Error::OfLastCall();
  return opened;
}

std::optional<FileHandle> HandleOf(const HandleNumbers& numbers, const FileHandle& sibling,
                                   std::uint64_t siblingInode) {
  const auto [inode, subvolume, generation] = numbers;
  if (HasForm(sibling, kInode32, kInode32Size)) {
    const bool fits = inode <= std::numeric_limits<std::uint32_t>::max();
    if (!fits || Get<std::uint32_t>(sibling, 0) != siblingInode) return std::nullopt;
    return MakeHandle(kInode32, kInode32Size, static_cast<std::uint32_t>(inode), generation);
  }
  if (Get<std::uint64_t>(sibling, 0) != siblingInode) return std::nullopt;
  if (HasForm(sibling, kInode64, kInode64Size)) {
    return MakeHandle(kInode64, kInode64Size, inode, generation);
  }
  if (HasForm(sibling, kSubvolume, kSubvolumeSize)) {
    return MakeHandle(kSubvolume, kSubvolumeSize, inode, subvolume, generation);
  }
  return std::nullopt;
}

std::optional<std::uint64_t> SubvolumeOf(const FileHandle& handle) {
  if (!HasForm(handle, kSubvolume, kSubvolumeSize)) return std::nullopt;
  return Get<std::uint64_t>(handle, sizeof(std::uint64_t));
}

std::optional<std::uint64_t> SubvolumeOf(const FileHandle& handle, std::uint64_t inode) {
  const auto subvolume = SubvolumeOf(handle);
  return subvolume && Get<std::uint64_t>(handle, 0) == inode ? subvolume : std::nullopt;
}

}  // namespace tallowmere::kernel
