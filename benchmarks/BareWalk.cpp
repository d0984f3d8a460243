#include "BareWalk.h"

#include <dirent.h>
#include <fcntl.h>
#include <unistd.h>

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

namespace tallowmere::benchmark {
namespace {

struct Entry {  // struct linux_dirent64 of getdents(2)
  std::uint64_t inode;
  std::int64_t offset;
  std::uint16_t size;
  std::uint8_t type;
  char name[1];
};

long WalkFrom(int parent, const char* name) {
  const int folder = openat(parent, name, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
  if (folder < 0) return 0;
  long seen = 0;
  std::vector<std::string> folders;
  alignas(Entry) std::array<char, 32768> buffer;
  for (ssize_t got; (got = getdents64(folder, buffer.data(), buffer.size())) > 0;) {
    for (ssize_t at = 0; at < got;) {
      const auto* const entry = reinterpret_cast<const Entry*>(buffer.data() + at);
      const char* const entryName = buffer.data() + at + offsetof(Entry, name);
      at += entry->size;
      if (!std::strcmp(entryName, ".") || !std::strcmp(entryName, "..")) continue;
      ++seen;
      if (entry->type == DT_DIR) folders.emplace_back(entryName);
    }
  }
  for (const std::string& child : folders) seen += WalkFrom(folder, child.c_str());
  close(folder);
  return seen;
}

}  // namespace

long WalkBare(const std::filesystem::path& top) {
  return WalkFrom(AT_FDCWD, top.c_str());
}

}  // namespace tallowmere::benchmark
