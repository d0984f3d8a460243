// Judges whether an answer was true at some moment between question and answer.
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
  kExact,  // true in one of the states
  kMoved,  // each of its steps was true in one of them: what was asked for was moved. It leads
           // to what could be meant in one of them, or to no item in any
  kHonestError,  // none, or undetermined, and what was asked for changed
  kNowhere,      // leads to no item in any of the states, and what was asked for changed
  kWrong,
};
inline constexpr std::size_t kVerdicts = 5;

// How far the inode numbers of the main volume can be trusted.
enum class Numbers {
  kTrusted,
  kServed,     // but a server may say ESTALE of what has moved
  kUntrusted,  // as well; and any two items could have one number, so that any change and anything
               // that is mounted in it can make an id undetermined
};

class Judge {
 public:
  Judge(const History& history, Place place, Numbers numbers = Numbers::kTrusted)
      : mHistory(history), mPlace(std::move(place)), mNumbers(numbers) {}

  // REQUIRES: all states from the first to the last one are reached and kept.
  Verdict Of(const Request& request, const std::string& response, History::Version first,
             History::Version last);

  // What is known of a request and its answer, for a report.
  std::string Report(const Request& request, const std::string& response, History::Version first,
                     History::Version last);

 private:
  // The items, over all the states, that an answer leads to.
  enum class Destination { kNone, kMeant, kAnother };

  Destination DestinationOf(const std::vector<const State*>& states, const Request& request,
                            const std::string& response) const;
  bool IsServersError(const Request& request, const std::string& response) const;
  const Graph& GraphOf(History::Version version);

  const History& mHistory;
  Place mPlace;
  Numbers mNumbers;
  std::map<History::Version, Graph> mGraphs;  // of the states that were used last
};

}  // namespace tallowmere::soak
