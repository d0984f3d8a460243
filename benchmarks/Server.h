// A program being measured: a process that answers requests on its standard input and output.
#pragma once

#include <sys/types.h>

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace tallowmere::benchmark {

class Server {
 public:
  // Fails when the program cannot be started.
  Server(const std::string& program, const std::vector<std::string>& arguments);
  Server(const Server&) = delete;
  Server& operator=(const Server&) = delete;
  // Closes the pipes and waits for the process to end.
  ~Server();

  // Writes a request and reads an answer of this size, which is valid until the next call. Fails
  // when there is none.
  std::string_view Ask(std::string_view request, std::size_t answerSize);

  // The processor time of the process so far, user and system, in microseconds.
  double ProcessorTime() const;

  // A line of /proc/PID/status in KiB: "VmHWM" is its peak memory, "VmRSS" its current memory.
  double Memory(std::string_view line) const;

 private:
  pid_t mProcess = -1;
  clockid_t mClock{};
  int mRequests = -1;
  int mAnswers = -1;
  std::string mAnswer;
};

// Throws std::system_error with errno: the benchmark lacks something that it needs.
[[noreturn]] void Fail(const std::string& what);

}  // namespace tallowmere::benchmark
