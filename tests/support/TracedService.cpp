#include "support/TracedService.h"

#include <unistd.h>

#include <algorithm>
#include <fstream>
#include <iterator>

#include "support/ChildProgram.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {

std::optional<TracedRun> RunTraced(const std::string& calls, const std::string& requests) {
  return RunTraced(calls, requests, TALLOWMERE_SERVICE, {});
}

std::optional<TracedRun> RunTraced(const std::string& calls, const std::string& requests,
                                   const std::string& program,
                                   const std::vector<std::string>& arguments) {
  const TemporaryFolder folder;
  const std::string log = (folder.Path() / "calls").string();
  // The leak check does not work in a traced process.
  std::vector<std::string> command{
      "-E",    "ASAN_OPTIONS=detect_leaks=0", "-o", log, "-e", "trace=" + calls,
      program, std::to_string(getpid())};
  command.insert(command.end(), arguments.begin(), arguments.end());
  ChildProgram service("strace", command);
  service.Write(requests);
  service.CloseInput();
  TracedRun run;
  run.responses = service.ReadToEnd();
  const std::string errors = service.ReadErrorsToEnd();
  run.status = service.Wait();
  if (errors.find("PTRACE") != std::string::npos) return std::nullopt;
  std::ifstream lines(log);
  for (std::string line; std::getline(lines, line);) run.calls.push_back(line);
  return run;
}

bool IsCall(const std::string& line, const std::string& name) {
  return line.starts_with(name + "(");
}

std::vector<std::string> CallsOfLastRequest(const TracedRun& run) {
  const auto isKill = [](const std::string& call) { return IsCall(call, "kill"); };
  const auto last = std::find_if(run.calls.rbegin(), run.calls.rend(), isKill);
  const auto before = std::find_if(std::next(last), run.calls.rend(), isKill);
  return {before.base(), std::prev(last.base())};
}

}  // namespace tallowmere::test
