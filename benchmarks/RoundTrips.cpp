#include <unistd.h>

#include <array>
#include <cstdio>
#include <memory>

#include "Contest.h"
#include "FileServer.h"
#include "Measure.h"

namespace tallowmere::benchmark {
namespace {

struct Row {
  protocol::RequestCode code;
  int components;  // of the path that is asked about
  double barOfRoundTrip;
  double barOfProcessor;
};

constexpr auto kRows = std::to_array<Row>({
    {protocol::kRequestMakeFullPath, 8, 1.40, 2.5},
    {protocol::kRequestMakeFileRefFromPath, 8, 1.40, 2.5},
    {protocol::kRequestGetVolRefnumByHFSName, 6, 1.10, 1.3},
    {protocol::kRequestGetHFSVolumeName, 6, 1.10, 1.3},
    {protocol::kRequestGetHFSName, 6, 1.25, 1.8},
    {protocol::kRequestAddHFSName, 6, 1.25, 1.8},
    {protocol::kRequestGetFSSpec, 6, 1.25, 1.8},
    {protocol::kRequestSetFileRefFromFSSpecData, 6, 1.25, 1.8},
    {protocol::kRequestSetFileRefFromFSSpec, 6, 1.25, 1.8},
    {protocol::kRequestGetAIFFExportSettings, 6, 1.10, 1.3},
});

// The costs in each run, by contestant.
class Runs {
 public:
  explicit Runs(std::vector<std::vector<Cost>> costs) : mCosts(std::move(costs)) {}

  // One over the other: the median of the runs' ratios.
  Figure Ratio(const std::string& what, std::size_t first, std::size_t second,
               double Cost::*kind) const {
    std::vector<double> ratios;
    std::vector<double> firsts;
    std::vector<double> seconds;
    for (const std::vector<Cost>& run : mCosts) {
      ratios.push_back(run[first].*kind / run[second].*kind);
      firsts.push_back(run[first].*kind);
      seconds.push_back(run[second].*kind);
    }
    return {what, Median(ratios), "", {}, false, Quotient(Median(firsts), Median(seconds), "µs")};
  }

 private:
  std::vector<std::vector<Cost>> mCosts;
};

// The question of the file server that comes next to a request.
std::optional<Question> PeerQuestion(protocol::RequestCode code, const std::string& path) {
  switch (code) {
    case protocol::kRequestGetFSSpec:
      return FileServer::Attributes(path);
    case protocol::kRequestSetFileRefFromFSSpec:
      return FileServer::CanonicalPath(path);
    default:
      return std::nullopt;
  }
}

Figure WithBar(Figure figure, double bar) {
  figure.bar = bar;
  return figure;
}

std::vector<Figure> Take(const Row& row, const Settings& settings) {
  const Item item = AskAbout(settings.service, SettledFile(settings.folder, row.components));
  const Question question = QuestionOf(row.code, item);
  const std::string parent = std::to_string(getpid());
  Server service(settings.service, {parent});
  Server floor(TALLOWMERE_FLOOR, {parent, item.path, item.volumeName});
  // From then on the folder is a remembered one.
  const Question record = QuestionOf(protocol::kRequestGetFSSpec, item);
  service.Ask(record.request, record.answerSize);

  std::vector<Contestant> contestants{{&service, question.request, question.answerSize},
                                      {&floor, question.request, question.answerSize}};
  const auto peerQuestion = PeerQuestion(row.code, item.path);
  std::optional<FileServer> peer;
  if (peerQuestion && FileServer::IsInstalled()) {
    peer.emplace();
    contestants.push_back({&peer->Process(), peerQuestion->request, peerQuestion->answerSize});
  }
  std::vector<std::vector<Cost>> costs;
  for (int run = 0; run < settings.runs; ++run) {
    costs.push_back(Compete(contestants, settings.requests));
  }

  const Runs runs(std::move(costs));
  const std::string code = "code " + std::to_string(row.code);
  std::vector<Figure> figures{
      WithBar(runs.Ratio(code + ": round trip / floor", 0, 1, &Cost::roundTrip),
              row.barOfRoundTrip),
      WithBar(runs.Ratio(code + ": processor time / floor", 0, 1, &Cost::processor),
              row.barOfProcessor)};
  if (peer) {
    const std::string name = row.code == protocol::kRequestGetFSSpec ? "LSTAT" : "REALPATH";
    figures.push_back(runs.Ratio(code + " / SFTP " + name, 0, 2, &Cost::roundTrip));
    figures.push_back(runs.Ratio("floor of " + code + " / SFTP " + name, 1, 2, &Cost::roundTrip));
  } else if (peerQuestion) {
    figures.push_back(
        {code + " / SFTP", {}, "", {}, false, "openssh-sftp-server is not installed"});
  }
  return figures;
}

}  // namespace

std::vector<Measure> RoundTripMeasures() {
  std::vector<Measure> measures;
  for (const Row& row : kRows) {
    measures.push_back({"code" + std::to_string(row.code),
                        [&row](const Settings& settings) { return Take(row, settings); }});
  }
  return measures;
}

}  // namespace tallowmere::benchmark
