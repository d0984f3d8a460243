#include "Server.h"

#include <signal.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <ctime>
#include <fstream>
#include <system_error>

#include "support/ArgumentVector.h"
#include "support/Pipe.h"

namespace tallowmere::benchmark {
void Fail(const std::string& what) {
  throw std::system_error(errno, std::generic_category(), what);
}

Server::Server(const std::string& program, const std::vector<std::string>& arguments) {
  const auto requests = test::MakePipe();
  const auto answers = test::MakePipe();
  std::vector<std::string> command{program};
  command.insert(command.end(), arguments.begin(), arguments.end());
  const auto vector = test::ArgumentVector(command);

  posix_spawn_file_actions_t pipes;
  posix_spawn_file_actions_init(&pipes);
  posix_spawn_file_actions_adddup2(&pipes, requests[0], STDIN_FILENO);
  posix_spawn_file_actions_adddup2(&pipes, answers[1], STDOUT_FILENO);
  errno = posix_spawn(&mProcess, program.c_str(), &pipes, nullptr, vector.data(), environ);
  if (errno != 0) Fail(program);
  posix_spawn_file_actions_destroy(&pipes);
  close(requests[0]);
  close(answers[1]);
  mRequests = requests[1];
  mAnswers = answers[0];
  errno = clock_getcpuclockid(mProcess, &mClock);
  if (errno != 0) Fail("processor time of " + program);
}

Server::~Server() {
  close(mRequests);
  close(mAnswers);
  waitpid(mProcess, nullptr, 0);
}

std::string_view Server::Ask(std::string_view request, std::size_t answerSize) {
  mAnswer.resize(answerSize);
  if (write(mRequests, request.data(), request.size()) != static_cast<ssize_t>(request.size())) {
    Fail("request");
  }
  for (std::size_t count = 0; count < answerSize;) {
    const ssize_t got = read(mAnswers, mAnswer.data() + count, answerSize - count);
    if (got < 1) Fail("answer");
    count += static_cast<std::size_t>(got);
  }
  return mAnswer;
}

double Server::ProcessorTime() const {
  timespec used{};
  clock_gettime(mClock, &used);
  return static_cast<double>(used.tv_sec) * 1e6 + static_cast<double>(used.tv_nsec) / 1e3;
}

double Server::Memory(std::string_view line) const {
  std::ifstream status("/proc/" + std::to_string(mProcess) + "/status");
  for (std::string word; status >> word;) {
    if (word == std::string(line) + ":" && status >> word) return std::atof(word.c_str());
  }
  Fail("memory");
}

}  // namespace tallowmere::benchmark
