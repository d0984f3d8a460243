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
  int components;  // of the requested path
  double barOfRoundTrip;
  double barOfProcessor;
};

constexpr auto kRows = std::to_array<Row>({
    {protocol::kRequestMakeFullPath, 8, 1.70, 2.00},
    {protocol::kRequestMakeFileRefFromPath, 8, 1.45, 1.45},
    {protocol::kRequestGetVolRefnumByHFSName, 6, 1.10, 1.10},
    {protocol::kRequestGetHFSVolumeName, 6, 1.10, 1.10},
    {protocol::kRequestGetHFSName, 6, 1.30, 1.45},
    {protocol::kRequestAddHFSName, 6, 1.45, 1.55},
    {protocol::kRequestGetFSSpec, 6, 1.30, 1.30},
    {protocol::kRequestSetFileRefFromFSSpecData, 6, 1.45, 1.45},
    {protocol::kRequestSetFileRefFromFSSpec, 6, 1.45, 1.45},
    {protocol::kRequestGetAIFFExportSettings, 6, 1.10, 1.20},
});

// For the processor time relative to the sound floor, for every code.
constexpr double kBarOverSoundFloor = 1.25;

// The contestants, in their order.
enum : std::size_t { kService, kFloor, kSoundFloor, kPeer };

// The ratio of one contestant to another in each run.
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

// The file server's question that comes closest to a request.
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

std::vector<Figure> FiguresOf(const Row& row, const std::vector<std::vector<Cost>>& runs) {
  const std::string code = "code " + std::to_string(row.code);
  return {AtMost(row.barOfRoundTrip,
                 RatioIn(runs, code + ": round trip / floor", kService, kFloor, &Cost::roundTrip)),
          AtMost(row.barOfProcessor, RatioIn(runs, code + ": processor time / floor", kService,
                                             kFloor, &Cost::processor)),
          AtMost(kBarOverSoundFloor, RatioIn(runs, code + ": processor time / sound floor",
                                             kService, kSoundFloor, &Cost::processor))};
}

std::vector<Figure> FiguresBesidePeer(const Row& row, const std::vector<std::vector<Cost>>& runs) {
  const std::string code = "code " + std::to_string(row.code);
  const std::string name = row.code == protocol::kRequestGetFSSpec ? "LSTAT" : "REALPATH";
  return {RatioIn(runs, code + " / SFTP " + name, kService, kPeer, &Cost::roundTrip),
          RatioIn(runs, "floor of " + code + " / SFTP " + name, kFloor, kPeer, &Cost::roundTrip)};
}

std::vector<Figure> Take(const Row& row, const Settings& settings) {
  const Item item = AskAbout(settings.service, SettledFile(settings, row.components));
  const Question question = QuestionOf(row.code, item);
  const std::string parent = std::to_string(getpid());
  Server service(settings.service, {parent});
  Server floor(TALLOWMERE_FLOOR, {parent, item.path, item.volumeName});
  Server soundFloor(TALLOWMERE_FLOOR, {parent, item.path, item.volumeName, "sound"});
  // From here on the folder is a remembered one.
  const Question record = QuestionOf(protocol::kRequestGetFSSpec, item);
  service.Ask(record.request, record.answerSize);

  std::vector<Contestant> contestants{{&service, question.request, question.answerSize},
                                      {&floor, question.request, question.answerSize},
                                      {&soundFloor, question.request, question.answerSize}};
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

  std::vector<Figure> figures = FiguresOf(row, runs);
  if (peer) {
    for (const Figure& figure : FiguresBesidePeer(row, runs)) figures.push_back(figure);
  } else if (peerQuestion) {
    const std::string what = "code " + std::to_string(row.code) + " / SFTP";
    figures.push_back(Skipped(what, "openssh-sftp-server is not installed"));
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
