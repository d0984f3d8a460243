#include "NumberedFileSystem.h"

#define FUSE_USE_VERSION 34
#include <fcntl.h>
#include <fuse_lowlevel.h>
#include <signal.h>
#include <strings.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <thread>
#include <vector>

#include "support/LoopDevice.h"

namespace tallowmere::test {
namespace {

struct Node {
  struct stat about;
  fuse_ino_t parent;
  std::string name;
};
// The first number of items to which the test gives none.
constexpr ino_t kFirstOwnNumber = 0x1000;

// A node's index is its FUSE node id. Indexes are never reused.
std::vector<Node> nodes;
bool ignoresCase = false;
NumberedFileSystem::Ticks ticks = NumberedFileSystem::Ticks::kFine;

struct stat About(ino_t number, mode_t mode) {
  struct stat about {};
  about.st_ino = number;
  about.st_mode = mode;
  about.st_nlink = S_ISDIR(mode) ? 2 : 1;
  clock_gettime(CLOCK_REALTIME, &about.st_ctim);
  return about;
}

fuse_ino_t Child(fuse_ino_t parent, const char* name) {
  for (fuse_ino_t node = FUSE_ROOT_ID + 1; node < nodes.size(); ++node) {
    if (nodes[node].parent != parent) continue;
    const char* const own = nodes[node].name.c_str();
    if ((ignoresCase ? strcasecmp(own, name) : std::strcmp(own, name)) == 0) return node;
  }
  return 0;
}

void ReplyEntry(fuse_req_t request, fuse_ino_t node) {
  if (node == 0) {
    fuse_reply_err(request, ENOENT);
    return;
  }
  fuse_entry_param entry{};
  entry.ino = node;
  entry.attr = nodes[node].about;
  fuse_reply_entry(request, &entry);
}

void LookUp(fuse_req_t request, fuse_ino_t parent, const char* name) {
  ReplyEntry(request, Child(parent, name));
}

void GetAttributes(fuse_req_t request, fuse_ino_t node, fuse_file_info*) {
  fuse_reply_attr(request, &nodes[node].about, 0);
}

void Touch(fuse_ino_t node) {
  const bool isFine = ticks == NumberedFileSystem::Ticks::kFine;
  timespec& change = nodes[node].about.st_ctim;
  clock_gettime(isFine ? CLOCK_REALTIME : CLOCK_REALTIME_COARSE, &change);
  if (ticks == NumberedFileSystem::Ticks::kSeconds) change.tv_nsec = 0;
}

void SetAttributes(fuse_req_t request, fuse_ino_t node, struct stat* given, int which,
                   fuse_file_info*) {
  if ((which & FUSE_SET_ATTR_MODE) != 0) nodes[node].about.st_mode = given->st_mode;
  if ((which & FUSE_SET_ATTR_MTIME) != 0) {
    nodes[node].about.st_ino = static_cast<ino_t>(given->st_mtim.tv_sec);
  }
  Touch(node);
  fuse_reply_attr(request, &nodes[node].about, 0);
}

void Make(fuse_req_t request, fuse_ino_t parent, const char* name, mode_t mode) {
  const std::string text = name;
  const std::size_t mark = text.rfind('@');
  const ino_t number = mark == std::string::npos
                           ? kFirstOwnNumber + nodes.size()
                           : std::strtoul(text.substr(mark + 1).c_str(), nullptr, 10);
  nodes.push_back({About(number, mode), parent, text});
  Touch(parent);
  ReplyEntry(request, nodes.size() - 1);
}
void MakeFolderNode(fuse_req_t request, fuse_ino_t parent, const char* name, mode_t mode) {
  Make(request, parent, name, S_IFDIR | mode);
}
void MakeNode(fuse_req_t request, fuse_ino_t parent, const char* name, mode_t mode, dev_t) {
  Make(request, parent, name, mode);
}

void RemoveFolder(fuse_req_t request, fuse_ino_t parent, const char* name) {
  nodes[Child(parent, name)].parent = 0;
  Touch(parent);
  fuse_reply_err(request, 0);
}

void Rename(fuse_req_t request, fuse_ino_t parent, const char* name, fuse_ino_t newParent,
            const char* newName, unsigned) {
  Node& moved = nodes[Child(parent, name)];
  moved.parent = newParent;
  moved.name = newName;
  Touch(parent);
  Touch(newParent);
  fuse_reply_err(request, 0);
}

void ReadFolder(fuse_req_t request, fuse_ino_t folder, size_t size, off_t offset, fuse_file_info*) {
  std::vector<char> buffer(size);
  size_t used = 0;
  for (auto node = static_cast<fuse_ino_t>(offset) + 1; node < nodes.size(); ++node) {
    if (nodes[node].parent != folder) continue;
    const size_t added =
        fuse_add_direntry(request, buffer.data() + used, size - used, nodes[node].name.c_str(),
                          &nodes[node].about, static_cast<off_t>(node));
    if (used + added > size) break;
    used += added;
  }
  fuse_reply_buf(request, buffer.data(), used);
}

// Returns a block device that lasts as long as the process, or an empty string on failure.
std::string MakeBlockDevice(const std::string& file) {
  constexpr off_t kSize = 1 << 20;
  const int content = open(file.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0600);
  if (ftruncate(content, kSize) != 0) return "";
  const LoopDevice device(content);
  return device.IsAttached() ? device.Path() : "";
}

[[noreturn]] void Serve(const std::string& place, NumberedFileSystem::On on) {
  nodes.resize(FUSE_ROOT_ID + 1);
  nodes[FUSE_ROOT_ID].about = About(FUSE_ROOT_ID, S_IFDIR | 0755);
  fuse_lowlevel_ops operations{};
  operations.lookup = LookUp;
  operations.getattr = GetAttributes;
  operations.setattr = SetAttributes;
  operations.mkdir = MakeFolderNode;
  operations.mknod = MakeNode;
  operations.rmdir = RemoveFolder;
  operations.rename = Rename;
  operations.readdir = ReadFolder;
  std::string options = "-oallow_other,default_permissions";
  if (on == NumberedFileSystem::On::kBlockDevice) {
    options += ",blkdev,fsname=" + MakeBlockDevice(place + ".image");
  }
  char name[] = "numbered";
  char* arguments[] = {name, options.data(), nullptr};
  fuse_args given = FUSE_ARGS_INIT(2, arguments);
  fuse_session* const session = fuse_session_new(&given, &operations, sizeof operations, nullptr);
  if (session != nullptr && fuse_session_mount(session, place.c_str()) == 0) {
    fuse_session_loop(session);
  }
  _exit(1);
}

}  // namespace

NumberedFileSystem::NumberedFileSystem(On on, Case letterCase, Ticks howTimesAdvance) {
  const std::string place = mFolder.MakeFolder("numbered");
  struct stat before {};
  stat(place.c_str(), &before);
  mServer = fork();
  if (mServer == 0) {
    ignoresCase = letterCase == Case::kIgnored;
    ticks = howTimesAdvance;
    Serve(place, on);
  }
  for (int i = 0; i < 500 && !mIsMounted; ++i) {
    std::this_thread::sleep_for(std::chrono::milliseconds(10));
    struct stat now {};
    mIsMounted = stat(place.c_str(), &now) == 0 && now.st_dev != before.st_dev;
  }
}

NumberedFileSystem::~NumberedFileSystem() {
  umount2(Path().c_str(), MNT_DETACH);
  kill(mServer, SIGKILL);
  waitpid(mServer, nullptr, 0);
}

std::string NumberedFileSystem::MakeFolder(const std::string& name, unsigned long number) const {
  const std::string path = Path() / (name + "@" + std::to_string(number));
  std::filesystem::create_directory(path);
  return path;
}

bool NumberedFileSystem::Renumber(const std::string& path, unsigned long number) {
  const timespec times[] = {{0, UTIME_OMIT}, {static_cast<time_t>(number), 0}};
  return utimensat(AT_FDCWD, path.c_str(), times, 0) == 0;
}

std::string NumberedFileSystem::MakeFile(const std::string& name, unsigned long number) const {
  const std::string path = Path() / (name + "@" + std::to_string(number));
  return mknod(path.c_str(), S_IFREG | 0644, 0) == 0 ? path : "";
}

}  // namespace tallowmere::test
