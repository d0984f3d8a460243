#include "client/ServiceProcess.h"

#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <spawn.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <system_error>
#include <utility>

namespace tallowmere {
namespace {

using std::chrono::milliseconds;
using std::chrono::steady_clock;

constexpr milliseconds kLongestPoll{60'000};  // a longer wait takes several polls

std::string MessageOf(int errorNumber) {
  return std::generic_category().message(errorNumber);
}

Error NoAnswer(std::string reason) {
  return {Outcome::kServiceFailed, std::move(reason)};
}

void CloseIfOpen(int& descriptor) {
  if (descriptor >= 0) close(std::exchange(descriptor, -1));
}

// Moves a descriptor above the standard ones: in a program that has closed those, what it prints
// must not reach the service.
bool MoveUp(int& descriptor) {
  if (descriptor > STDERR_FILENO) return true;
  const int moved = fcntl(descriptor, F_DUPFD_CLOEXEC, STDERR_FILENO + 1);
  if (moved < 0) return false;
  close(std::exchange(descriptor, moved));
  return true;
}

struct Pipe {
  int readEnd = -1;
  int writeEnd = -1;

  Pipe() = default;
  Pipe(const Pipe&) = delete;
  Pipe& operator=(const Pipe&) = delete;
  ~Pipe() {
    CloseIfOpen(readEnd);
    CloseIfOpen(writeEnd);
  }

  bool Open() {
    int ends[2];
    if (pipe2(ends, O_CLOEXEC) != 0) return false;
    readEnd = ends[0];
    writeEnd = ends[1];
    return MoveUp(readEnd) && MoveUp(writeEnd);
  }
};

bool SetNonBlocking(int descriptor) {
  return fcntl(descriptor, F_SETFL, O_NONBLOCK) == 0;
}

// Starts `path`. Returns the error number, or 0.
int Spawn(const std::string& path, int input, int output, pid_t& process) {
  std::string program = path;
  std::string parent = std::to_string(getpid());
  char* const arguments[] = {program.data(), parent.data(), nullptr};

  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  posix_spawn_file_actions_adddup2(&actions, input, STDIN_FILENO);
  posix_spawn_file_actions_adddup2(&actions, output, STDOUT_FILENO);
  const int error = posix_spawn(&process, path.c_str(), &actions, nullptr, arguments, environ);
  posix_spawn_file_actions_destroy(&actions);
  return error;
}

// Blocks SIGPIPE in this thread while a write can raise it, and discards one that the write raised.
class WithoutBrokenPipeSignal {
 public:
  WithoutBrokenPipeSignal() {
    sigemptyset(&mBrokenPipe);
    sigaddset(&mBrokenPipe, SIGPIPE);
    sigset_t pending;
    sigpending(&pending);
    mWasPending = sigismember(&pending, SIGPIPE) == 1;
    pthread_sigmask(SIG_BLOCK, &mBrokenPipe, &mBefore);
  }
  WithoutBrokenPipeSignal(const WithoutBrokenPipeSignal&) = delete;
  WithoutBrokenPipeSignal& operator=(const WithoutBrokenPipeSignal&) = delete;
  ~WithoutBrokenPipeSignal() {
    const timespec atOnce{};
    if (!mWasPending) sigtimedwait(&mBrokenPipe, nullptr, &atOnce);
    pthread_sigmask(SIG_SETMASK, &mBefore, nullptr);
  }

 private:
  sigset_t mBrokenPipe;
  sigset_t mBefore;
  bool mWasPending;
};

// Waits until the watched process has ended, for at most `patience`.
void AwaitEnd(int watch, milliseconds patience) {
  const auto until = steady_clock::now() + patience;
  const auto left = [until] {
    const auto time = std::chrono::ceil<milliseconds>(until - steady_clock::now());
    return static_cast<int>(std::max(time, milliseconds(0)).count());
  };
  pollfd ended{watch, POLLIN, 0};
  while (poll(&ended, 1, left()) < 0 && errno == EINTR) {
  }
}

bool WouldBlock(int errorNumber) {
  return errorNumber == EAGAIN || errorNumber == EINTR;
}

}  // namespace

Result<ServiceProcess> ServiceProcess::Start(const std::string& path) {
  Pipe requests;
  Pipe responses;
  if (!requests.Open() || !responses.Open() || !SetNonBlocking(requests.writeEnd) ||
      !SetNonBlocking(responses.readEnd)) {
    return NoAnswer("no pipe to the service: " + MessageOf(errno));
  }
  pid_t process = -1;
  if (const int error = Spawn(path, requests.readEnd, responses.writeEnd, process)) {
    return NoAnswer("the service " + path + " could not be started: " + MessageOf(error));
  }
  int watch = static_cast<int>(syscall(SYS_pidfd_open, process, 0));
  // A process that has vanished has been waited for elsewhere in this program, for example because
  // it ignores SIGCHLD. Its pipes tell that it has ended.
  if (watch < 0 && errno != ESRCH) {
    const int error = errno;
    kill(process, SIGKILL);
    while (waitpid(process, nullptr, 0) < 0 && errno == EINTR) {
    }
    return NoAnswer("the service could not be watched: " + MessageOf(error));
  }
  if (watch >= 0) MoveUp(watch);
  return ServiceProcess(watch, std::exchange(requests.writeEnd, -1),
                        std::exchange(responses.readEnd, -1));
}

ServiceProcess::ServiceProcess(int watch, int requests, int responses)
    : mOwner(getpid()), mWatch(watch), mRequests(requests), mResponses(responses) {}

ServiceProcess::ServiceProcess(ServiceProcess&& other) noexcept
    : mOwner(other.mOwner),
      mWatch(std::exchange(other.mWatch, -1)),
      mRequests(std::exchange(other.mRequests, -1)),
      mResponses(std::exchange(other.mResponses, -1)) {}

// Identifies the process by its watch alone: its id may belong to another one by now.
void ServiceProcess::End(std::chrono::milliseconds patience) {
  CloseIfOpen(mRequests);
  CloseIfOpen(mResponses);
  if (mWatch >= 0 && mOwner == getpid()) {
    AwaitEnd(mWatch, patience);
    syscall(SYS_pidfd_send_signal, mWatch, SIGKILL, nullptr, 0);
    siginfo_t ignored;
    while (waitid(P_PIDFD, static_cast<id_t>(mWatch), &ignored, WEXITED) < 0 && errno == EINTR) {
    }
  }
  CloseIfOpen(mWatch);
}

Result<std::size_t> ServiceProcess::Write(std::string_view bytes) {
  if (mRequests < 0) return std::size_t{0};
  const WithoutBrokenPipeSignal guard;
  const ssize_t sent = write(mRequests, bytes.data(), bytes.size());
  if (sent >= 0) return static_cast<std::size_t>(sent);
  if (errno != EPIPE && !WouldBlock(errno)) return NoAnswer("writing failed: " + MessageOf(errno));
  if (errno == EPIPE) CloseIfOpen(mRequests);
  return std::size_t{0};
}

Result<std::size_t> ServiceProcess::Read(char* bytes, std::size_t size) {
  const ssize_t got = read(mResponses, bytes, size);
  if (got > 0) return static_cast<std::size_t>(got);
  if (got == 0) return NoAnswer("the service ended before it answered");
  if (!WouldBlock(errno)) return NoAnswer("reading failed: " + MessageOf(errno));
  return std::size_t{0};
}

void ServiceProcess::Wait(bool forWriting, milliseconds longest) const {
  // poll ignores negative descriptors.
  std::array<pollfd, 2> awaited{
      {{mResponses, POLLIN, 0}, {forWriting ? mRequests : -1, POLLOUT, 0}}};
  poll(awaited.data(), awaited.size(), static_cast<int>(std::min(longest, kLongestPoll).count()));
}

}  // namespace tallowmere
