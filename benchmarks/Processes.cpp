#include <tallowmere/Batch.h>
#include <tallowmere/Client.h>
#include <unistd.h>

#include <algorithm>

#include "BigTree.h"
#include "InAProcess.h"
#include "Measure.h"
#include "Questions.h"
#include "Server.h"

namespace tallowmere::benchmark {
namespace {

// From no process to the answer to the first request, in microseconds.
double TimeToStart(const std::string& program, const std::vector<std::string>& arguments,
                   const Question& question) {
  const double begin = Now();
  Server server(program, arguments);
  server.Ask(question.request, question.answerSize);
  return Now() - begin;
}

// The first request reads the mount table, in both programs.
std::vector<Figure> Start(const Settings& settings) {
  const Item item = AskAbout(settings.service, SettledFile(settings, 6));
  const Question question = QuestionOf(protocol::kRequestGetFSSpec, item);
  const std::string parent = std::to_string(getpid());
  const int starts = std::max(settings.requests / 50, 1);
  std::vector<double> service;
  std::vector<double> floor;
  for (int run = 0; run < settings.runs; ++run) {
    std::vector<double> serviceTimes;
    std::vector<double> floorTimes;
    for (int i = 0; i < starts; ++i) {
      serviceTimes.push_back(TimeToStart(settings.service, {parent}, question));
      floorTimes.push_back(
          TimeToStart(TALLOWMERE_FLOOR, {parent, item.path, item.volumeName}, question));
    }
    service.push_back(Median(serviceTimes));
    floor.push_back(Median(floorTimes));
  }
  return {AtMost(1.25,
                 RatioOf("start, to the answer of a first request / floor", service, floor, "µs"))};
}

// The time per request in microseconds, asked one at a time and in one batch, in turns.
std::vector<double> TimesOfBatch(const Settings& settings, const std::string& path) {
  Client client(ClientOptions{settings.service});
  const auto request = request::GetFSSpec(path);
  const auto mustHaveRecord = [](const Result<std::optional<FSSpec>>& answer) {
    if (!answer || !answer->has_value()) Fail("no record in a batch");
  };
  mustHaveRecord(client.Ask(request));
  const double begin = Now();
  for (int i = 0; i < settings.requests; ++i) mustHaveRecord(client.Ask(request));
  const double middle = Now();
  Batch batch(client);
  for (int i = 0; i < settings.requests; ++i) batch.Add(request, mustHaveRecord);
  batch.Finish();
  const double end = Now();
  return {(middle - begin) / settings.requests, (end - middle) / settings.requests};
}

Figure BatchRatio(const Settings& settings, const std::string& what, bool usesAllCores) {
  const std::string path = SettledFile(settings, 6);
  std::vector<double> alone;
  std::vector<double> inBatch;
  for (int run = 0; run < settings.runs; ++run) {
    const auto times = InAProcess([&] {
      if (usesAllCores) UseAllCores();
      return TimesOfBatch(settings, path);
    });
    alone.push_back(times[0]);
    inBatch.push_back(times[1]);
  }
  return AtLeast(4, RatioOf(what, alone, inBatch, "µs"));
}

std::vector<Figure> InBatches(const Settings& settings) {
  return {BatchRatio(settings, "batch, how many times as fast as one at a time", false),
          BatchRatio(settings, "the same, not pinned to one core", true)};
}

constexpr int kMixedRequests = 10'000;

// Asks requests of all codes in turn, about items in several folders.
std::vector<Figure> Memory(const Settings& settings) {
  constexpr double kKiBInAMiB = 1024;
  const std::filesystem::path top = settings.folder / "mixed";
  std::filesystem::create_directory(top);
  std::vector<Item> items;
  for (const auto& path : MakeTree(top, 200).files) {
    items.push_back(AskAbout(settings.service, path));
  }
  std::vector<double> peaks;
  for (int run = 0; run < settings.runs; ++run) {
    Server service(settings.service, {std::to_string(getpid())});
    for (int i = 0; i < kMixedRequests; ++i) {
      const auto code = static_cast<protocol::RequestCode>(1 + i % protocol::kLastRequestCode);
      const auto which = static_cast<std::size_t>(i / protocol::kLastRequestCode) % items.size();
      const Question question = QuestionOf(code, items[which]);
      service.Ask(question.request, question.answerSize);
    }
    peaks.push_back(service.Memory("VmHWM") / kKiBInAMiB);
  }
  return {AtMost(6, {"peak memory after 10,000 mixed requests", Median(peaks), "MiB", "", {}})};
}

}  // namespace

std::vector<Measure> ProcessMeasures() {
  return {{"start", Start}, {"batch", InBatches}, {"memory", Memory}};
}

}  // namespace tallowmere::benchmark
