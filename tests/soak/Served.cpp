#include "Served.h"

#include <signal.h>
#include <sys/prctl.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <thread>

#include "support/ArgumentVector.h"

namespace tallowmere::soak {
namespace {

dev_t DeviceOf(const std::string& place) {
  struct stat about {};
  stat(place.c_str(), &about);
  return about.st_dev;
}

}  // namespace

bool IsServed(const std::string& place, const std::function<void()>& serve) {
  constexpr int kAttempts = 500;
  constexpr std::chrono::milliseconds kBetween(10);
  const dev_t before = DeviceOf(place);
  const pid_t server = fork();
  if (server == 0) {
    prctl(PR_SET_PDEATHSIG, SIGKILL);
    serve();
    _exit(1);
  }
  for (int i = 0; i < kAttempts && waitpid(server, nullptr, WNOHANG) == 0; ++i) {
    if (DeviceOf(place) != before) return true;
    std::this_thread::sleep_for(kBetween);
  }
  return false;
}

bool IsServedBy(const std::vector<std::string>& command, const std::string& place) {
  return IsServed(place, [&] {
    const auto arguments = test::ArgumentVector(command);
    execvp(arguments[0], arguments.data());
  });
}

}  // namespace tallowmere::soak
