// The service under strace, for counting its system calls.
#pragma once

#include <optional>
#include <string>
#include <vector>

namespace tallowmere::test {

// What it answered and the calls that it made, a line each as strace writes them.
struct TracedRun {
  std::string responses;
  int status;
  std::vector<std::string> calls;
};

// Runs the service with these requests and nothing behind them, with this process for its parent.
// `calls` names the system calls, separated by commas. None where strace cannot trace.
std::optional<TracedRun> RunTraced(const std::string& calls, const std::string& requests);

// The same with another program that serves requests, and its arguments behind the parent's id.
std::optional<TracedRun> RunTraced(const std::string& calls, const std::string& requests,
                                   const std::string& program,
                                   const std::vector<std::string>& arguments);

// Whether a line is a call by that name.
bool IsCall(const std::string& line, const std::string& name);

// The calls between the last two looks for the parent. REQUIRES: there were two.
std::vector<std::string> CallsOfLastRequest(const TracedRun& run);

}  // namespace tallowmere::test
