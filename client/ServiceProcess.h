// A running service: the child process and the two pipes to it.
#pragma once

#include <sys/types.h>

#include <chrono>
#include <cstddef>
#include <string>
#include <string_view>

#include "client/Result.h"

namespace tallowmere {

using Deadline = std::chrono::steady_clock::time_point;

class ServiceProcess {
 public:
  // Starts the program at `path` with this process's id as its argument.
  static Result<ServiceProcess> Start(const std::string& path);

  ServiceProcess(ServiceProcess&& other) noexcept;
  ServiceProcess& operator=(ServiceProcess&& other) noexcept;
  // Closes the pipes, which ends the service as soon as it reads, and waits for it. A service that
  // does not end by itself within a second is killed.
  ~ServiceProcess();

  // Writes all of `bytes`. The error says whether the service has ended or the deadline has passed;
  // what was sent by then is unknown. A broken pipe raises no signal in this process.
  Result<std::monostate> Send(std::string_view bytes, Deadline deadline);

  // The next `size` bytes that the service sends, with the same errors.
  Result<std::string> Receive(std::size_t size, Deadline deadline);

 private:
  ServiceProcess(pid_t process, int watch, int requests, int responses);
  void End();

  pid_t mProcess;         // -1 when moved from
  int mWatch;             // tells the process's end, and the process from a later one with its id
  int mRequests;          // written to by us, not blocking
  int mResponses;         // read from by us, not blocking
  std::string mReceived;  // read but not yet asked for
};

}  // namespace tallowmere
