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

constexpr std::chrono::seconds kTimeToEnd{1};
constexpr std::chrono::milliseconds kLongestPoll{60'000};  // a later deadline takes several

std::string MessageOf(int errorNumber) {
  return std::generic_category().message(errorNumber);
}

void CloseIfOpen(int& descriptor) {
  if (descriptor >= 0) close(std::exchange(descriptor, -1));
}

// Moves a descriptor above the standard ones: what a program prints that has closed those must not
// reach the service.
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

// Starts `path`; the error number, or 0.
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

// Keeps SIGPIPE from this thread while a write can raise it, and takes back what the write raised.
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

Error Ended() {
  return {"the service ended before it answered"};
}

// For poll: at least 0, at most kLongestPoll.
int MillisecondsUntil(Deadline deadline) {
  const auto left =
      std::chrono::ceil<std::chrono::milliseconds>(deadline - std::chrono::steady_clock::now());
  return static_cast<int>(std::clamp(left, std::chrono::milliseconds(0), kLongestPoll).count());
}

// Waits until the descriptor can be read or written, or its other end is closed.
Result<std::monostate> WaitFor(int descriptor, short events, Deadline deadline) {
  while (true) {
    const int left = MillisecondsUntil(deadline);
    if (left == 0) return Error{"the service did not answer in time"};
    pollfd awaited{descriptor, events, 0};
    const int ready = poll(&awaited, 1, left);
    if (ready > 0) return std::monostate{};
    if (ready < 0 && errno != EINTR) return Error{"poll failed: " + MessageOf(errno)};
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
    return Error{"no pipe to the service: " + MessageOf(errno)};
  }
  pid_t process = -1;
  if (const int error = Spawn(path, requests.readEnd, responses.writeEnd, process)) {
    return Error{"the service " + path + " could not be started: " + MessageOf(error)};
  }
  int watch = static_cast<int>(syscall(SYS_pidfd_open, process, 0));
  if (watch >= 0) MoveUp(watch);
  return ServiceProcess(process, watch, std::exchange(requests.writeEnd, -1),
                        std::exchange(responses.readEnd, -1));
}

ServiceProcess::ServiceProcess(pid_t process, int watch, int requests, int responses)
    : mProcess(process), mWatch(watch), mRequests(requests), mResponses(responses) {}

ServiceProcess::ServiceProcess(ServiceProcess&& other) noexcept
    : mProcess(std::exchange(other.mProcess, -1)),
      mWatch(std::exchange(other.mWatch, -1)),
      mRequests(std::exchange(other.mRequests, -1)),
      mResponses(std::exchange(other.mResponses, -1)),
      mReceived(std::move(other.mReceived)) {}

ServiceProcess& ServiceProcess::operator=(ServiceProcess&& other) noexcept {
  if (this != &other) {
    End();
    mProcess = std::exchange(other.mProcess, -1);
    mWatch = std::exchange(other.mWatch, -1);
    mRequests = std::exchange(other.mRequests, -1);
    mResponses = std::exchange(other.mResponses, -1);
    mReceived = std::move(other.mReceived);
  }
  return *this;
}

ServiceProcess::~ServiceProcess() {
  End();
}

// Without a watch the process has been waited for by somebody else in this program (who ignores the
// signal of a child's end, say), and its id may be another's by now.
void ServiceProcess::End() {
  CloseIfOpen(mRequests);
  CloseIfOpen(mResponses);
  if (mWatch >= 0) {
    pollfd ended{mWatch, POLLIN, 0};
    const auto deadline = std::chrono::steady_clock::now() + kTimeToEnd;
    while (poll(&ended, 1, MillisecondsUntil(deadline)) < 0 && errno == EINTR) {
    }
    syscall(SYS_pidfd_send_signal, mWatch, SIGKILL, nullptr, 0);
    while (waitpid(mProcess, nullptr, 0) < 0 && errno == EINTR) {
    }
  }
  CloseIfOpen(mWatch);
  mProcess = -1;
}

Result<std::monostate> ServiceProcess::Send(std::string_view bytes, Deadline deadline) {
  const WithoutBrokenPipeSignal guard;
  while (!bytes.empty()) {
    const ssize_t sent = write(mRequests, bytes.data(), bytes.size());
    if (sent >= 0) {
      bytes.remove_prefix(static_cast<std::size_t>(sent));
    } else if (WouldBlock(errno)) {
      if (auto ready = WaitFor(mRequests, POLLOUT, deadline); !ready) return ready;
    } else {
      return errno == EPIPE ? Ended() : Error{"writing failed: " + MessageOf(errno)};
    }
  }
  return std::monostate{};
}

Result<std::string> ServiceProcess::Receive(std::size_t size, Deadline deadline) {
  while (mReceived.size() < size) {
    std::array<char, 4096> piece;
    const ssize_t got = read(mResponses, piece.data(), piece.size());
    if (got > 0) {
      mReceived.append(piece.data(), static_cast<std::size_t>(got));
    } else if (got == 0) {
      return Ended();
    } else if (WouldBlock(errno)) {
      if (auto ready = WaitFor(mResponses, POLLIN, deadline); !ready) return ready.Failure();
    } else {
      return Error{"reading failed: " + MessageOf(errno)};
    }
  }
  std::string bytes = mReceived.substr(0, size);
  mReceived.erase(0, size);
  return bytes;
}

}  // namespace tallowmere
