#include "Contest.h"

#include <algorithm>

#include "Measure.h"

namespace tallowmere::benchmark {
namespace {

// How many requests one server is asked before the next one has its turn.
constexpr int kTurn = 50;

}  // namespace

std::vector<Cost> Compete(const std::vector<Contestant>& contestants, int requests) {
  const int turn = std::min(kTurn, requests);
  struct Times {
    std::vector<double> roundTrips;
    std::vector<double> processor;
  };
  std::vector<Times> times(contestants.size());
  for (int asked = -turn; asked < requests; asked += turn) {  // the first turn is a warm-up
    for (std::size_t i = 0; i < contestants.size(); ++i) {
      const auto& [server, request, answerSize] = contestants[i];
      const double usedBefore = server->ProcessorTime();
      for (int j = 0; j < turn; ++j) {
        const double begin = Now();
        server->Ask(request, answerSize);
        const double end = Now();
        if (asked >= 0) times[i].roundTrips.push_back(end - begin);
      }
      const double used = server->ProcessorTime() - usedBefore;
      if (asked >= 0) times[i].processor.push_back(used / turn);
    }
  }
  std::vector<Cost> costs;
  costs.reserve(times.size());
  for (const auto& [roundTrips, processor] : times) {
    costs.push_back({Median(roundTrips), Median(processor)});
  }
  return costs;
}

}  // namespace tallowmere::benchmark
