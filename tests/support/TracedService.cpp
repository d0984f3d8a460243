#include "support/TracedService.h"

#include <unistd.h>

#include <fstream>

#include "support/ChildProgram.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {

std::optional<TracedRun> RunTraced(const std::string& calls, const std::string& requests) {
  const TemporaryFolder folder;
  const std::string log = (folder.Path() / "calls").string();
  // The leak check does not work in a traced process.
  ChildProgram service("strace", {"-E", "ASAN_OPTIONS=detect_leaks=0", "-o", log, "-e",
                                  "trace=" + calls, TALLOWMERE_SERVICE, std::to_string(getpid())});
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

}  // namespace tallowmere::test
