// Judges whether an answer was true at some moment between request and answer.
#pragma once

#include <cstddef>
#include <map>
#include <string>
#include <vector>

#include "Graph.h"
#include "History.h"
#include "Requests.h"

namespace tallowmere::soak {

enum class Verdict {
  kExact,        // true in one of the states
  kMoved,        // each step was true in one of the states, as the item was moved; leads to an item
                 // that could be meant in one of them, or to no item in any
  kHonestError,  // no such item, or undetermined; what was asked for changed
  kNowhere,      // leads to no item in any of the states; what was asked for changed
  kWrong,
};
inline constexpr std::size_t kVerdicts = 5;

// How far inode numbers of the main volume identify items.
enum class Numbers {
  kTrusted,
  kServed,     // fully, but the server may answer ESTALE about what has moved
  kUntrusted,  // the same, and two items may share a number: any change, and anything mounted in
               // the volume, can make an id undetermined
};

class Judge {
 public:
  Judge(const History& history, Place place, Numbers numbers = Numbers::kTrusted)
      : mHistory(history), mPlace(std::move(place)), mNumbers(numbers) {}

  // REQUIRES: every state from the first to the last has been reached and is still kept.
  Verdict Of(const Request& request, const std::string& response, History::Version first,
             History::Version last);

  // Returns what is known about a request and its answer, for a report.
  std::string Report(const Request& request, const std::string& response, History::Version first,
                     History::Version last);

 private:
  // The items that an answer leads to, over all the states.
  enum class Destination { kNone, kMeant, kAnother };

  Destination DestinationOf(const std::vector<const State*>& states, const Request& request,
                            const std::string& response) const;
  bool IsServersError(const Request& request, const std::string& response) const;
  const Graph& GraphOf(History::Version version);

  const History& mHistory;
  Place mPlace;
  Numbers mNumbers;
  std::map<History::Version, Graph> mGraphs;  // of the most recently used states
};

}  // namespace tallowmere::soak
