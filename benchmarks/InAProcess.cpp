#include "InAProcess.h"

#include <fcntl.h>
#include <grp.h>
#include <sched.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <cstdio>
#include <cstdlib>
#include <exception>
#include <sstream>

#include "Measure.h"
#include "Server.h"
#include "support/ArgumentVector.h"
#include "support/Pipe.h"

namespace tallowmere::benchmark {
namespace {

constexpr uid_t kNobody = 65534;
constexpr std::size_t kMostValues = 16;

cpu_set_t& AllowedCores() {
  static cpu_set_t allowed = [] {
    cpu_set_t cores;
    if (sched_getaffinity(0, sizeof cores, &cores) != 0) Fail("sched_getaffinity");
    return cores;
  }();
  return allowed;
}

void RunOn(const cpu_set_t& cores) {
  if (sched_setaffinity(0, sizeof cores, &cores) != 0) Fail("sched_setaffinity");
}

bool WaitForSuccess(pid_t process) {
  int status = 0;
  return waitpid(process, &status, 0) == process && WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

}  // namespace

std::vector<double> InAProcess(const std::function<std::vector<double>()>& measure) {
  const auto ends = test::MakePipe();
  const pid_t child = fork();
  if (child < 0) Fail("fork");
  if (child == 0) {
    // _exit, as nothing that belongs to the parent may be cleaned up here.
    try {
      const std::vector<double> values = measure();
      const auto size = static_cast<ssize_t>(values.size() * sizeof(double));
      _exit(write(ends[1], values.data(), values.size() * sizeof(double)) == size ? 0 : 1);
    } catch (const std::exception& error) {
      std::fprintf(stderr, "%s\n", error.what());
      _exit(1);
    }
  }
  close(ends[1]);
  std::array<double, kMostValues> values{};
  const ssize_t got = read(ends[0], values.data(), sizeof values);
  close(ends[0]);
  if (!WaitForSuccess(child) || got < 0) Fail("a measurement");
  return {values.data(), values.data() + static_cast<std::size_t>(got) / sizeof(double)};
}

void DropPrivilege() {
  if (geteuid() != 0) return;
  if (setgroups(0, nullptr) != 0 || setresgid(kNobody, kNobody, kNobody) != 0 ||
      setresuid(kNobody, kNobody, kNobody) != 0) {
    Fail("setresuid");
  }
}

void PinToOneCore() {
  std::size_t last = CPU_SETSIZE - 1;
  while (!CPU_ISSET(last, &AllowedCores())) --last;
  cpu_set_t one;
  CPU_ZERO(&one);
  CPU_SET(last, &one);
  RunOn(one);
}

void UseAllCores() {
  RunOn(AllowedCores());
}

double TimeOf(const std::vector<std::string>& command) {
  const auto arguments = test::ArgumentVector(command);
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  posix_spawn_file_actions_addopen(&actions, STDOUT_FILENO, "/dev/null", O_WRONLY, 0);
  pid_t process = 0;
  const double begin = Now();
  errno = posix_spawnp(&process, arguments[0], &actions, nullptr, arguments.data(), environ);
  if (errno != 0 || !WaitForSuccess(process)) Fail(command.front());
  const double end = Now();
  posix_spawn_file_actions_destroy(&actions);
  return end - begin;
}

bool IsOnPath(const std::string& program) {
  const char* const path = std::getenv("PATH");
  std::istringstream folders(path == nullptr ? "" : path);
  for (std::string folder; std::getline(folders, folder, ':');) {
    if (access(folder.append("/").append(program).c_str(), X_OK) == 0) return true;
  }
  return false;
}

}  // namespace tallowmere::benchmark
