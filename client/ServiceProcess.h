// A running service: the child process and the two pipes to it.
#pragma once

#include <sys/types.h>
#include <tallowmere/Result.h>

#include <chrono>
#include <cstddef>
#include <string>
#include <string_view>

namespace tallowmere {

class ServiceProcess {
 public:
  // Starts the program at `path` with this process's id as its argument.
  static Result<ServiceProcess> Start(const std::string& path);

  ServiceProcess(ServiceProcess&& other) noexcept;
  // Closes the pipes, which ends the service as soon as it reads, and waits for it. A service that
  // does not end by itself within a second is killed. A copy of this process that fork(2) made
  // closes its ends and leaves the service alone.
  ~ServiceProcess() { End(kTimeToEnd); }

  // Ends the service at once, whatever it is doing, and waits for it.
  void Kill() { End(std::chrono::milliseconds(0)); }

  // Writes as much as the pipe takes now and gives its size. Nothing is taken from the moment on in
  // which the service has stopped reading; what it has sent can still be read. A broken pipe raises
  // no signal in this process.
  Result<std::size_t> Write(std::string_view bytes);

  // Reads what has arrived, at most `size` bytes, and gives its size. An error when the service has
  // ended and everything has been read.
  Result<std::size_t> Read(char* bytes, std::size_t size);

  // Returns when there is something to read, or the service has ended, or, if so wished, something
  // can be written, and at the latest after that time. REQUIRES: 0 or more.
  void Wait(bool forWriting, std::chrono::milliseconds longest) const;

 private:
  ServiceProcess(int watch, int requests, int responses);
  void End(std::chrono::milliseconds patience);

  static constexpr std::chrono::milliseconds kTimeToEnd{1000};

  pid_t mOwner;    // the process that started it
  int mWatch;      // tells the process's end, and the process from a later one with its id
  int mRequests;   // written to by us, not blocking; -1 when nobody reads
  int mResponses;  // read from by us, not blocking
};

}  // namespace tallowmere
