#include <unistd.h>

#include <array>
#include <optional>

#include "Contest.h"
#include "FileServer.h"
#include "Measure.h"
#include "Questions.h"

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

// One contestant over another in each run.
Figure RatioIn(const std::vector<std::vector<Cost>>& runs, const std::string& what,
               std::size_t first, std::size_t second, double Cost::*kind) {
  std::vector<double> firsts;
  std::vector<double> seconds;
  for (const std::vector<Cost>& run : runs) {
    firsts.push_back(run[first].*kind);
    seconds.push_back(run[second].*kind);
  }
  return RatioOf(what, firsts, seconds, "µs");
}

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

std::vector<Figure> Take(const Row& row, const Settings& settings) {
  const Item item = AskAbout(settings.service, SettledFile(settings, row.components));
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
  std::vector<std::vector<Cost>> runs;
  runs.reserve(static_cast<std::size_t>(settings.runs));
  for (int run = 0; run < settings.runs; ++run) {
    runs.push_back(Compete(contestants, settings.requests));
  }

  const std::string code = "code " + std::to_string(row.code);
  std::vector<Figure> figures{
      AtMost(row.barOfRoundTrip,
             RatioIn(runs, code + ": round trip / floor", 0, 1, &Cost::roundTrip)),
      AtMost(row.barOfProcessor,
             RatioIn(runs, code + ": processor time / floor", 0, 1, &Cost::processor))};
  if (peer) {
    const std::string name = row.code == protocol::kRequestGetFSSpec ? "LSTAT" : "REALPATH";
    figures.push_back(RatioIn(runs, code + " / SFTP " + name, 0, 2, &Cost::roundTrip));
    figures.push_back(
        RatioIn(runs, "floor of " + code + " / SFTP " + name, 1, 2, &Cost::roundTrip));
  } else if (peerQuestion) {
    figures.push_back(Skipped(code + " / SFTP", "openssh-sftp-server is not installed"));
  }
  return figures;
}

}  // namespace

std::vector<Measure> RoundTripMeasures() {
  std::vector<Measure> measures;
  measures.reserve(kRows.size());
  for (const Row& row : kRows) {
    measures.push_back({"code" + std::to_string(row.code),
                        [&row](const Settings& settings) { return Take(row, settings); }});
  }
  return measures;
}

}  // namespace tallowmere::benchmark
