#include "files/FileHandle.h"

#include <fcntl.h>

#include <cerrno>
#include <cstring>
#include <limits>

namespace tallowmere::files {
namespace {

// Asks for a handle that only identifies; file systems that cannot open by handle have those
// (Linux 6.5). The number is from <linux/fcntl.h>.
constexpr int kOnlyToIdentify = 0x200;

// The kernel's commonest handle, FILEID_INO32_GEN: the inode number and the generation, 32 bits
// each.
constexpr std::int32_t kInodeAndGeneration = 1;
struct InodeAndGeneration {
  std::uint32_t inode;
  std::uint32_t generation;
};

// The kernel's record with room for the longest handle.
struct HandleBuffer {
  alignas(file_handle) std::array<std::uint8_t, sizeof(file_handle) + kLongestHandle> bytes{};

  file_handle* Get() { return reinterpret_cast<file_handle*>(bytes.data()); }
  std::uint8_t* Handle() { return bytes.data() + sizeof(file_handle); }
};

bool ReadHandle(int folder, const char* name, int flags, HandleBuffer& buffer) {
  int mount = 0;
  buffer.Get()->handle_bytes = kLongestHandle;
  return name_to_handle_at(folder, name, buffer.Get(), &mount, flags) == 0;
}

}  // namespace

FileHandle ReadHandle(int folder, const char* name) {
  HandleBuffer buffer;
  FileHandle handle{};
  const int flags = *name == '\0' ? AT_EMPTY_PATH : 0;
  const bool isRead =
      ReadHandle(folder, name, flags, buffer) ||
      (errno == EOPNOTSUPP && ReadHandle(folder, name, flags | kOnlyToIdentify, buffer));
  if (!isRead) return handle;
  handle.type = buffer.Get()->handle_type;
  handle.size = buffer.Get()->handle_bytes;
  std::memcpy(handle.bytes.data(), buffer.Handle(), handle.size);
  return handle;
}

std::optional<FileHandle> HandleOfInode(const FileHandle& sibling, std::uint64_t siblingInode,
                                        std::uint64_t inode) {
  InodeAndGeneration content{};
  if (sibling.type != kInodeAndGeneration || sibling.size != sizeof content) return std::nullopt;
  std::memcpy(&content, sibling.bytes.data(), sizeof content);
  if (content.inode != siblingInode || inode > std::numeric_limits<std::uint32_t>::max()) {
    return std::nullopt;
  }
  content = {static_cast<std::uint32_t>(inode), 0};
  FileHandle handle = sibling;
  std::memcpy(handle.bytes.data(), &content, sizeof content);
  return handle;
}

Descriptor OpenByHandle(int onVolume, const FileHandle& handle) {
  HandleBuffer buffer;
  buffer.Get()->handle_bytes = handle.size;
  buffer.Get()->handle_type = handle.type;
  std::memcpy(buffer.Handle(), handle.bytes.data(), handle.size);
  return Descriptor(open_by_handle_at(onVolume, buffer.Get(), O_PATH | O_CLOEXEC));
}

}  // namespace tallowmere::files
