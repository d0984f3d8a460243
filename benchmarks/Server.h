// A program under measurement: a process that answers requests on its standard input and output.
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
  // Closes the pipes and waits for the end of the process.
  ~Server();

  // Writes a request and reads an answer of so many bytes, which is valid until the next one. Fails
  // when there is none.
  std::string_view Ask(std::string_view request, std::size_t answerSize);

  // What the process has used so far, user and system, in microseconds.
  double ProcessorTime() const;

  // A line of /proc/PID/status in KiB: "VmHWM" is the most memory it ever had, "VmRSS" what it has.
  double Memory(std::string_view line) const;

 private:
  pid_t mProcess = -1;
  clockid_t mClock{};
  int mRequests = -1;
  int mAnswers = -1;
  std::string mAnswer;
};

// Throws std::system_error: what the benchmark needs has failed; errno tells why.
[[noreturn]] void Fail(const std::string& what);

}  // namespace tallowmere::benchmark
