#include "support/ChildProgram.h"

#include <poll.h>
#include <signal.h>
#include <sys/ioctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cstdlib>
#include <limits>
#include <utility>

#include "support/ArgumentVector.h"
#include "support/Pipe.h"

namespace tallowmere::test {
namespace {

constexpr int kPatience = 10'000;  // milliseconds
constexpr std::size_t kPipeSize = 65'536;
constexpr int kStillRuns = -1000;

void Close(int& descriptor) {
  if (descriptor >= 0) close(std::exchange(descriptor, -1));
}

std::size_t UnreadOf(int pipe) {
  int unread = 0;
  if (ioctl(pipe, FIONREAD, &unread) != 0) std::abort();
  return static_cast<std::size_t>(unread);
}

std::string ReadUpTo(int descriptor, std::size_t size) {
  std::string bytes;
  while (bytes.size() < size) {
    pollfd awaited{descriptor, POLLIN, 0};
    if (poll(&awaited, 1, kPatience) != 1) break;
    std::array<char, 4096> piece;
    const ssize_t got = read(descriptor, piece.data(), std::min(piece.size(), size - bytes.size()));
    if (got <= 0) break;
    bytes.append(piece.data(), static_cast<std::size_t>(got));
  }
  return bytes;
}

pid_t Execute(const std::string& path, const std::vector<std::string>& arguments,
              ChildProgram::BrokenPipe brokenPipe, const ChildProgram::Streams& streams) {
  std::vector<std::string> command{path};
  command.insert(command.end(), arguments.begin(), arguments.end());
  const auto vector = ArgumentVector(command);

  const pid_t process = fork();
  if (process == 0) {
    signal(SIGPIPE, brokenPipe == ChildProgram::BrokenPipe::kEnds ? SIG_DFL : SIG_IGN);
    dup2(streams[STDIN_FILENO], STDIN_FILENO);
    dup2(streams[STDOUT_FILENO], STDOUT_FILENO);
    dup2(streams[STDERR_FILENO], STDERR_FILENO);
    execvp(path.c_str(), vector.data());
    _exit(127);
  }
  return process;
}

}  // namespace

ChildProgram::ChildProgram(const std::string& path, const std::vector<std::string>& arguments,
                           BrokenPipe brokenPipe)
    : ChildProgram(
          [&](const Streams& streams) { return Execute(path, arguments, brokenPipe, streams); }) {}

ChildProgram::ChildProgram(const std::function<pid_t(const Streams&)>& start) {
  const auto input = MakePipe();
  const auto output = MakePipe();
  const auto errors = MakePipe();
  mProcess = start({input[0], output[1], errors[1]});
  if (mProcess < 0) std::abort();
  mInputReader = input[0];
  mInput = input[1];
  mOutput = output[0];
  mErrors = errors[0];
  close(output[1]);
  close(errors[1]);
}

ChildProgram::~ChildProgram() {
  if (mProcess > 0) {
    kill(mProcess, SIGKILL);
    waitpid(mProcess, nullptr, 0);
  }
  for (int* const descriptor : {&mInput, &mInputReader, &mOutput, &mErrors}) Close(*descriptor);
}

void ChildProgram::Write(std::string_view bytes) {
  while (!bytes.empty()) {
    const ssize_t sent = write(mInput, bytes.data(), bytes.size());
    if (sent < 0) std::abort();
    bytes.remove_prefix(static_cast<std::size_t>(sent));
  }
}

void ChildProgram::CloseInput() {
  Close(mInput);
}
void ChildProgram::CloseOutput() {
  Close(mOutput);
}

std::string ChildProgram::Read(std::size_t size) {
  return ReadUpTo(mOutput, size);
}
std::string ChildProgram::ReadToEnd() {
  return ReadUpTo(mOutput, std::numeric_limits<std::size_t>::max());
}
std::string ChildProgram::ReadSome() {
  std::string bytes(kPipeSize, '\0');
  pollfd awaited{mOutput, POLLIN, 0};
  if (poll(&awaited, 1, kPatience) != 1) return {};
  const ssize_t got = read(mOutput, bytes.data(), bytes.size());
  bytes.resize(static_cast<std::size_t>(std::max<ssize_t>(got, 0)));
  return bytes;
}
std::string ChildProgram::ReadErrorsToEnd() {
  return ReadUpTo(mErrors, std::numeric_limits<std::size_t>::max());
}

std::size_t ChildProgram::UnreadInput() const {
  return UnreadOf(mInputReader);
}
std::size_t ChildProgram::UnreadOutput() const {
  return UnreadOf(mOutput);
}

int ChildProgram::Wait() {
  int status = 0;
  for (int waited = 0; waited < kPatience; ++waited) {
    const pid_t ended = waitpid(mProcess, &status, WNOHANG);
    if (ended == mProcess) {
      mProcess = -1;
      return WIFEXITED(status) ? WEXITSTATUS(status) : -WTERMSIG(status);
    }
    usleep(1000);
  }
  return kStillRuns;
}

}  // namespace tallowmere::test
