// Runs the service under strace to count its system calls.
#pragma once

#include <optional>
#include <string>
#include <vector>

namespace tallowmere::test {

// The answers and the system calls, one line each as strace writes them.
struct TracedRun {
  std::string responses;
  int status;
  std::vector<std::string> calls;
};

// Runs the service with exactly these requests, with this process as its parent. `calls` names the
// system calls, separated by commas. Nullopt where strace cannot trace.
std::optional<TracedRun> RunTraced(const std::string& calls, const std::string& requests);

// The same with another program that serves requests, with its arguments after the parent's id.
std::optional<TracedRun> RunTraced(const std::string& calls, const std::string& requests,
                                   const std::string& program,
                                   const std::vector<std::string>& arguments);

// Whether a line is a call with this name.
bool IsCall(const std::string& line, const std::string& name);

// The calls between the last two checks for the parent. REQUIRES: there were two.
std::vector<std::string> CallsOfLastRequest(const TracedRun& run);

}  // namespace tallowmere::test
