#include <sys/stat.h>
#include <unistd.h>

#include <string>
#include <vector>

#include "BareWalk.h"
#include "BigTree.h"
#include "Contest.h"
#include "InAProcess.h"
#include "Measure.h"
#include "Questions.h"
#include "Server.h"

namespace tallowmere::benchmark {
namespace {

constexpr double kMicrosecondsInAMillisecond = 1000;

// --- Warm ---------------------------------------------------------------------------------------

std::vector<Figure> Warm(const Settings& settings) {
  const Item item = AskAbout(settings.service, SettledFile(settings, 6));
  Server service(settings.service, {std::to_string(getpid())});
  const Question there = QuestionOf(protocol::kRequestGetFSSpec, item);
  const Question back = QuestionOf(protocol::kRequestSetFileRefFromFSSpec, item);
  std::vector<double> codes7;
  std::vector<double> codes9;
  for (int run = 0; run < settings.runs; ++run) {
    const auto costs = Compete(
        {{&service, there.request, there.answerSize}, {&service, back.request, back.answerSize}},
        settings.requests);
    codes7.push_back(costs[0].roundTrip);
    codes9.push_back(costs[1].roundTrip);
  }
  return {AtMost(1.5, RatioOf("node id, warm (code 9) / code 7", codes9, codes7, "µs"))};
}

// --- Cold, without privilege --------------------------------------------------------------------

std::vector<std::filesystem::path> FoldersIn(const std::filesystem::path& folder) {
  std::vector<std::filesystem::path> folders;
  for (const auto& entry : std::filesystem::directory_iterator(folder)) {
    if (entry.is_directory()) folders.push_back(entry.path());
  }
  return folders;
}

bool MayRunWithoutPrivilege(const std::string& program) {
  return InAProcess([&]() -> std::vector<double> {
           DropPrivilege();
           return {access(program.c_str(), X_OK) == 0 ? 1.0 : 0.0};
         })[0] == 1.0;
}

// The time to the answer about the item, in milliseconds, and the service's memory growth, in MiB.
std::vector<double> FindCold(const Settings& settings, const Item& item) {
  DropPrivilege();
  Server service(settings.service, {std::to_string(getpid())});
  const Question volume = QuestionOf(protocol::kRequestGetHFSVolumeName, item);
  service.Ask(volume.request, volume.answerSize);
  const Question question = QuestionOf(protocol::kRequestSetFileRefFromFSSpec, item);
  const double memoryBefore = service.Memory("VmRSS");
  const double begin = Now();
  const std::string answer(service.Ask(question.request, question.answerSize));
  const double end = Now();
  if (answer[0] != 1 || answer.find(item.path) == std::string::npos) Fail("a cold node id");
  return {(end - begin) / kMicrosecondsInAMillisecond,
          (service.Memory("VmRSS") - memoryBefore) / 1024};
}

// A file in a folder; if possible, one in the first of its subfolders.
std::filesystem::path FileBelow(const std::filesystem::path& folder) {
  const auto folders = FoldersIn(folder);
  for (const auto& entry :
       std::filesystem::directory_iterator(folders.empty() ? folder : folders.front())) {
    if (!entry.is_directory()) return entry.path();
  }
  Fail("no file below " + folder.string());
}

// The last folder that a pass visits, whatever its order: descends from the top, always into the
// folder below which a new service takes longest to find something.
std::filesystem::path LastFolder(const Settings& settings, const std::filesystem::path& top) {
  std::filesystem::path last = top;
  for (auto folders = FoldersIn(top); !folders.empty(); folders = FoldersIn(last)) {
    double most = 0;
    for (const auto& folder : folders) {
      const Item item = AskAbout(settings.service, FileBelow(folder));
      const double time = InAProcess([&] { return FindCold(settings, item); })[0];
      if (time <= most) continue;
      most = time;
      last = folder;
    }
  }
  return last;
}

std::vector<double> WalkCold(const std::filesystem::path& top, long entries) {
  DropPrivilege();
  const double begin = Now();
  const long seen = WalkBare(top);
  const double end = Now();
  if (seen != entries) Fail("a walk");
  return {(end - begin) / kMicrosecondsInAMillisecond};
}

std::vector<double> Search(const std::string& program, const std::filesystem::path& top,
                           std::uint64_t inode) {
  DropPrivilege();
  const double time = TimeOf({program, top, "-xdev", "-inum", std::to_string(inode)});
  return {time / kMicrosecondsInAMillisecond};
}

struct Peer {
  std::string program;
  std::vector<double> times;
};

std::vector<Figure> FiguresOfCold(const std::string& what, const std::vector<double>& cold,
                                  const std::vector<double>& walks,
                                  const std::vector<Peer>& peers) {
  std::vector<Figure> figures{AtMost(1.2, RatioOf(what + " / bare walk", cold, walks, "ms"))};
  for (const auto& [program, times] : peers) {
    std::string name = what;
    name.append(" / ").append(program).append(" -inum");
    figures.push_back(times.empty() ? Skipped(name, program + " is not installed")
                                    : AtMost(0.7, RatioOf(name, cold, times, "ms")));
  }
  return figures;
}

std::vector<Figure> Cold(const Settings& settings) {
  const std::string what = "node id, cold, no privilege";
  if (!MayRunWithoutPrivilege(settings.service)) {
    return {Skipped(what, "not everybody may run " + settings.service)};
  }
  const BigTree& big = TheBigTree(settings.entries);
  if (!big.volume.IsMounted()) return {Skipped(what, "mounting is not permitted")};
  const auto& top = big.volume.Path();
  const auto last = LastFolder(settings, top);
  const Item item = AskAbout(settings.service, FileBelow(last));
  struct stat folder {};
  if (stat(last.c_str(), &folder) != 0) Fail(last);

  std::vector<double> cold;
  std::vector<double> memory;
  std::vector<double> walks;
  std::vector<Peer> peers{{"find", {}}, {"bfs", {}}};
  for (int run = 0; run < settings.runs; ++run) {
    const auto found = InAProcess([&] { return FindCold(settings, item); });
    cold.push_back(found[0]);
    memory.push_back(found[1]);
    walks.push_back(InAProcess([&] { return WalkCold(top, settings.entries); })[0]);
    for (Peer& peer : peers) {
      if (!IsOnPath(peer.program)) continue;
      const auto search = [&] { return Search(peer.program, top, folder.st_ino); };
      peer.times.push_back(InAProcess(search)[0]);
    }
  }

  std::vector<Figure> figures = FiguresOfCold(what, cold, walks, peers);
  figures.push_back(AtMost(16, {"memory left behind by that pass", Median(memory), "MiB", "", {}}));
  return figures;
}

}  // namespace

std::vector<Measure> NodeIDMeasures() {
  return {{"warm", Warm}, {"cold", Cold}};
}

}  // namespace tallowmere::benchmark
