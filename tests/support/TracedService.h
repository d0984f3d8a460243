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

}  // namespace tallowmere::test
