#include "PassThrough.h"

#define FUSE_USE_VERSION 31
#include <dirent.h>
#include <fcntl.h>
#include <fuse.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <vector>

#include "Served.h"
#include "support/LoopDevice.h"

namespace tallowmere::soak {
namespace {

constexpr ino_t kOneNumber = 500;

int source = -1;
PassThrough served;

// Returns the path relative to the source folder. The server's paths begin with "/".
const char* Below(const char* path) {
  return path[1] == '\0' ? "." : path + 1;
}
int Result(int result) {
  return result < 0 ? -errno : 0;
}

int GetAttributes(const char* path, struct stat* about, fuse_file_info*) {
  const int result = Result(fstatat(source, Below(path), about, AT_SYMLINK_NOFOLLOW));
  if (served.oneNumber && path[1] != '\0') about->st_ino = kOneNumber;
  return result;
}

int ReadLink(const char* path, char* text, size_t size) {
  const ssize_t length = readlinkat(source, Below(path), text, size - 1);
  if (length >= 0) text[length] = '\0';
  return Result(static_cast<int>(length));
}

int MakeFile(const char* path, mode_t mode, dev_t) {
  return Result(mknodat(source, Below(path), mode, 0));
}
int MakeFolder(const char* path, mode_t mode) {
  return Result(mkdirat(source, Below(path), mode));
}
int MakeLink(const char* target, const char* path) {
  return Result(symlinkat(target, source, Below(path)));
}
int AddName(const char* from, const char* to) {
  return Result(linkat(source, Below(from), source, Below(to), 0));
}
int Remove(const char* path) {
  return Result(unlinkat(source, Below(path), 0));
}
int RemoveFolder(const char* path) {
  return Result(unlinkat(source, Below(path), AT_REMOVEDIR));
}
int Rename(const char* from, const char* to, unsigned flags) {
  return Result(renameat2(source, Below(from), source, Below(to), flags));
}
int Open(const char*, fuse_file_info*) {
  return 0;
}

int ReadFolder(const char* path, void* buffer, fuse_fill_dir_t add, off_t, fuse_file_info*,
               fuse_readdir_flags) {
  DIR* const folder = fdopendir(openat(source, Below(path), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (folder == nullptr) return -errno;
  while (const dirent* const entry = readdir(folder)) {
    struct stat about {};
    about.st_ino = served.oneNumber ? kOneNumber : entry->d_ino;
    about.st_mode = static_cast<mode_t>(DTTOIF(entry->d_type));
    add(buffer, entry->d_name, &about, 0, fuse_fill_dir_flags{});
  }
  closedir(folder);
  return 0;
}

void* Start(fuse_conn_info*, fuse_config* config) {
  config->use_ino = 1;
  return nullptr;
}

// Returns a block device that lasts as long as the process, or an empty string on failure.
std::string BlockDevice() {
  constexpr off_t kSize = 1 << 20;
  std::FILE* const file = std::tmpfile();
  if (file == nullptr || ftruncate(fileno(file), kSize) != 0) return "";
  const test::LoopDevice device(fileno(file));
  return device.IsAttached() ? device.Path() : "";
}

[[noreturn]] void Serve(const std::string& folder, const std::string& place) {
  source = open(folder.c_str(), O_PATH | O_DIRECTORY | O_CLOEXEC);
  fuse_operations operations{};
  operations.getattr = GetAttributes;
  operations.readlink = ReadLink;
  operations.mknod = MakeFile;
  operations.mkdir = MakeFolder;
  operations.symlink = MakeLink;
  operations.link = AddName;
  operations.unlink = Remove;
  operations.rmdir = RemoveFolder;
  operations.rename = Rename;
  operations.open = Open;
  operations.readdir = ReadFolder;
  operations.init = Start;
  std::string options = "-oallow_other,default_permissions";
  if (served.onBlockDevice) options += ",blkdev,fsname=" + BlockDevice();
  std::vector<char> name{'s', '\0'};
  std::vector<char*> words{name.data(), options.data()};
  fuse_args arguments = FUSE_ARGS_INIT(static_cast<int>(words.size()), words.data());
  umask(0);
  fuse* const server = fuse_new(&arguments, &operations, sizeof operations, nullptr);
  if (server != nullptr && fuse_mount(server, place.c_str()) == 0) fuse_loop(server);
  _exit(1);
}

}  // namespace

bool MountPassThrough(const std::string& folder, const std::string& place, PassThrough how) {
  return IsServed(place, [&] {
    served = how;
    Serve(folder, place);
  });
}

}  // namespace tallowmere::soak
