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
  // Starts the program at `path`, passing this process's id as its argument.
  static Result<ServiceProcess> Start(const std::string& path);

  ServiceProcess(ServiceProcess&& other) noexcept;
  // Closes the pipes, which ends the service at its next read, and waits for it. A service that has
  // not ended within a second is killed. In a copy of this process made by fork(2), only closes
  // that copy's ends and leaves the service alone.
  ~ServiceProcess() { End(kTimeToEnd); }

  // Ends the service at once, whatever it is doing, and waits for it.
  void Kill() { End(std::chrono::milliseconds(0)); }

  // Writes as much as the pipe accepts now; returns the number of bytes. Once the service has
  // stopped reading, nothing is accepted any more; what it has sent can still be read. A broken
  // pipe raises no signal in this process.
  Result<std::size_t> Write(std::string_view bytes);

  // Reads what has arrived, at most `size` bytes; returns the number of bytes. Returns an error
  // when the service has ended and everything has been read.
  Result<std::size_t> Read(char* bytes, std::size_t size);

  // Returns when there is something to read, when the service has ended, with `forWriting` when
  // something can be written, or after `longest` at the latest. REQUIRES: `longest` is 0 or more.
  void Wait(bool forWriting, std::chrono::milliseconds longest) const;

 private:
  ServiceProcess(int watch, int requests, int responses);
  void End(std::chrono::milliseconds patience);

  static constexpr std::chrono::milliseconds kTimeToEnd{1000};

  pid_t mOwner;    // the process that started it
  int mWatch;      // reports the process's end; unlike its id, never refers to another process
  int mRequests;   // our writing end, non-blocking; -1 when nobody reads
  int mResponses;  // our reading end, non-blocking
};

}  // namespace tallowmere
