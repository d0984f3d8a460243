// Preloaded into a service: after the service's first request, attempts from inside all that a
// service never does, and some of what it may. Prints a line for each attempt on standard error, a
// name and the error number, 0 for success. $TALLOWMERE_ATTEMPTS is a folder with files "file",
// "old file" and "old name", a folder "old folder" and a listening local socket "socket". Attempts
// that could do harm have arguments that lead nowhere.
#include <dlfcn.h>
#include <fcntl.h>
#include <linux/fs.h>
#include <linux/openat2.h>
#include <netinet/in.h>
#include <pthread.h>
#include <setjmp.h>
#include <signal.h>
#include <sys/ioctl.h>
#include <sys/ptrace.h>
#include <sys/resource.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/un.h>
#include <sys/xattr.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>

namespace {

constexpr int kNoProcess = 0x7FFFFFF0;  // above the highest id that a kernel assigns
constexpr int kNoDescriptor = -1;

void Tell(const char* name, long result) {
  dprintf(STDERR_FILENO, "%s %d\n", name, result < 0 ? errno : 0);
}

sockaddr_un Address(const char* name) {
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  std::strncpy(address.sun_path, name, sizeof address.sun_path - 1);
  return address;
}

long OpenToWriteAnew() {
  open_how how{};
  how.flags = O_WRONLY;
  return syscall(SYS_openat2, AT_FDCWD, "file", &how, sizeof how);
}

void AttemptFiles() {
  Tell("files/write", open("file", O_WRONLY));
  Tell("files/read-and-write", open("file", O_RDWR));
  Tell("files/empty", open("file", O_RDONLY | O_TRUNC));
  Tell("files/create", open("new", O_RDONLY | O_CREAT, 0600));
  Tell("files/temporary", open(".", O_WRONLY | O_TMPFILE, 0600));
  Tell("files/truncate", truncate("file", 0));
  Tell("files/mkdir", mkdir("new folder", 0700));
  Tell("files/mknod", mknod("fifo", S_IFIFO | 0600, 0));
  Tell("files/symlink", symlink("file", "link"));
  Tell("files/rename", rename("old name", "new name"));
  Tell("files/link", link("file", "hard link"));
  Tell("files/unlink", unlink("old file"));
  Tell("files/rmdir", rmdir("old folder"));
  Tell("openat2/write", OpenToWriteAnew());
  Tell("attributes/chmod", chmod("file", 0644));
  Tell("attributes/chown", chown("file", getuid(), getgid()));
  Tell("attributes/utimes", utimensat(AT_FDCWD, "file", nullptr, 0));
  Tell("attributes/setxattr", setxattr("file", "user.x", "", 0, 0));
  Tell("attributes/removexattr", removexattr("file", "user.y"));
}

// Forks a process that ends at once.
long Fork() {
  const long process = syscall(SYS_clone, SIGCHLD, 0, 0, 0, 0);
  if (process == 0) syscall(SYS_exit, 0);
  return process;
}

void AttemptProcesses() {
  char program[] = "/no such program";
  char* const words[] = {program, nullptr};
  Tell("calls/execve", execve(program, words, words));
  Tell("calls/execveat", syscall(SYS_execveat, AT_FDCWD, program, words, words, 0));
  Tell("processes/clone", Fork());
  Tell("processes/clone-thread-in-namespace",
       syscall(SYS_clone, CLONE_THREAD | CLONE_NEWNET, 0, 0, 0, 0));
  Tell("unknown/clone3", syscall(SYS_clone3, nullptr, 0));
  Tell("processes/ptrace", ptrace(PTRACE_ATTACH, kNoProcess, nullptr, nullptr));
  Tell("calls/process_vm_readv",
       syscall(SYS_process_vm_readv, kNoProcess, nullptr, 0, nullptr, 0, 0));
  Tell("calls/signal", syscall(SYS_kill, getppid(), SIGWINCH));
  Tell("calls/thread-signal", syscall(SYS_tgkill, getppid(), getppid(), SIGWINCH));
  Tell("calls/queued-signal", syscall(SYS_rt_sigqueueinfo, kNoProcess, SIGWINCH, nullptr));
  Tell("calls/pidfd_open", syscall(SYS_pidfd_open, getpid(), 0));
  Tell("calls/limits-of-another", syscall(SYS_prlimit64, getppid(), RLIMIT_CORE, nullptr, nullptr));
  Tell("calls/unshare", syscall(SYS_unshare, 0));
  Tell("calls/setns", syscall(SYS_setns, kNoDescriptor, 0));
}

void AttemptMounts() {
  Tell("calls/mount", syscall(SYS_mount, nullptr, "/no such folder", nullptr, 0, nullptr));
  Tell("calls/umount", syscall(SYS_umount2, "/no such folder", 0));
  Tell("calls/pivot_root", syscall(SYS_pivot_root, "/no such folder", "/no such folder"));
  Tell("calls/chroot", syscall(SYS_chroot, "/no such folder"));
  Tell("calls/open_tree", syscall(SYS_open_tree, AT_FDCWD, "/", 0));
  Tell("calls/fsopen", syscall(SYS_fsopen, "no such file system", 0));
  Tell("calls/move_mount", syscall(SYS_move_mount, kNoDescriptor, "", kNoDescriptor, "", 0));
  Tell("calls/mount_setattr", syscall(SYS_mount_setattr, kNoDescriptor, "", 0, nullptr, 0));
}

// Reports a failure to create the socket instead.
void AttemptTCP(const char* name, int (*call)(int, const sockaddr*, socklen_t)) {
  sockaddr_in here{};
  here.sin_family = AF_INET;
  here.sin_port = htons(1);
  here.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  const int internet = socket(AF_INET, SOCK_STREAM, 0);
  Tell(name, internet < 0 ? -1 : call(internet, reinterpret_cast<sockaddr*>(&here), sizeof here));
}

void AttemptSockets() {
  Tell("network/internet", socket(AF_INET, SOCK_STREAM, 0));
  Tell("network/internet6", socket(AF_INET6, SOCK_DGRAM, 0));
  Tell("network/netlink", socket(AF_NETLINK, SOCK_RAW, 0));
  Tell("calls/packet", socket(AF_PACKET, SOCK_RAW, 0));
  AttemptTCP("tcp/bind", bind);
  AttemptTCP("tcp/connect", connect);
  const int local = socket(AF_UNIX, SOCK_STREAM, 0);
  const sockaddr_un place = Address("new socket");
  Tell("files/bind", bind(local, reinterpret_cast<const sockaddr*>(&place), sizeof place));
  Tell("calls/listen", listen(local, 1));
}

void AttemptTheMachine() {
  Tell("configured/init_module", syscall(SYS_init_module, nullptr, 0, ""));
  Tell("configured/kexec_load", syscall(SYS_kexec_load, 0, 0, nullptr, ~0UL));
  Tell("configured/bpf", syscall(SYS_bpf, -1, nullptr, 0));
  Tell("configured/perf_event_open", syscall(SYS_perf_event_open, nullptr, 0, 0, 0, 0));
  Tell("configured/io_uring_setup", syscall(SYS_io_uring_setup, 0, nullptr));
  Tell("configured/userfaultfd", syscall(SYS_userfaultfd, -1));
  Tell("configured/keyctl", syscall(SYS_keyctl, -1));
  Tell("calls/reboot", syscall(SYS_reboot, 0, 0, 0, nullptr));
  Tell("calls/settimeofday", syscall(SYS_settimeofday, nullptr, nullptr));
  Tell("calls/shmget", syscall(SYS_shmget, 0, 0, 0));
  Tell("calls/terminal-input", ioctl(STDIN_FILENO, TIOCSTI, ""));
  constexpr long kSetXAttrAt = 463;  // Linux 6.13: newer than the filter
  Tell("configured/setxattrat", syscall(kSetXAttrAt, AT_FDCWD, "file", 0, "user.x", nullptr, 0));
}

#ifdef __x86_64__
sigjmp_buf beforeTheOtherKind;

// Calls getpid as 32-bit programs do.
void AttemptCallsOfAnotherKind() {
  constexpr long kGetPid = 20;
  const auto former = signal(SIGSEGV, [](int) { siglongjmp(beforeTheOtherKind, 1); });
  if (sigsetjmp(beforeTheOtherKind, 1) == 0) {
    long result = kGetPid;
    __asm__ volatile("int $0x80" : "+a"(result) : : "r8", "r9", "r10", "r11", "memory");
    errno = static_cast<int>(-result);
    Tell("calls/32-bit", result);
  } else {
    errno = EPERM;  // the kernel is built without them
    Tell("absent/32-bit", -1);
  }
  signal(SIGSEGV, former);
}
#else
void AttemptCallsOfAnotherKind() {}
#endif

void* ReturnAtOnce(void*) {
  return nullptr;
}

void TryWhatIsNeeded() {
  Tell("needed/read", open("file", O_RDONLY));
  const int file = open("file", O_RDONLY | O_NOFOLLOW | O_NOATIME);
  Tell("needed/read-without-a-trace", file);
  char value[1];
  const ssize_t size = fgetxattr(file, "user.none", value, sizeof value);
  const bool isAnswered = size < 0 && (errno == ENODATA || errno == EOPNOTSUPP);
  Tell("needed/ask-for-an-attribute", isAnswered ? 0 : -1);
  Tell("needed/read-a-link", readlink("/proc/self/exe", value, sizeof value));
  Tell("needed/list", open(".", O_RDONLY | O_DIRECTORY));
  const int local = socket(AF_UNIX, SOCK_STREAM, 0);
  const sockaddr_un place = Address("socket");
  Tell("needed/connect", connect(local, reinterpret_cast<const sockaddr*>(&place), sizeof place));
  Tell("needed/load-a-library", dlopen("libresolv.so.2", RTLD_NOW) != nullptr ? 0 : -1);
  pthread_t thread{};
  Tell("needed/thread", pthread_create(&thread, nullptr, ReturnAtOnce, nullptr) == 0 ? 0 : -1);
  pthread_join(thread, nullptr);
  Tell("needed/look-for-the-parent", syscall(SYS_kill, getppid(), 0));
  Tell("needed/own-limits", syscall(SYS_prlimit64, 0, RLIMIT_CORE, nullptr, nullptr));
  const int folder = open(".", O_RDONLY | O_DIRECTORY);
  char label[FSLABEL_MAX];
  const int asked = ioctl(folder, FS_IOC_GETFSLABEL, label);
  Tell("needed/ask-for-the-label", asked == 0 || errno == ENOTTY ? 0 : -1);
}

void AttemptAll() {
  const char* const folder = std::getenv("TALLOWMERE_ATTEMPTS");
  if (folder == nullptr || chdir(folder) != 0) return;
  AttemptFiles();
  AttemptProcesses();
  AttemptMounts();
  AttemptSockets();
  AttemptTheMachine();
  AttemptCallsOfAnotherKind();
  TryWhatIsNeeded();
}

}  // namespace

// The service calls this after each request, to check for its parent.
extern "C" int kill(pid_t process, int signal) noexcept {
  static bool isFirst = true;
  if (isFirst) AttemptAll();
  isFirst = false;
  return static_cast<int>(syscall(SYS_kill, process, signal));
}
