// What is to be answered while the tree is like that.
#pragma once

#include <set>
#include <string>

#include "Graph.h"
#include "Requests.h"

namespace tallowmere::soak {

struct Truth {
  std::set<std::string> responses;
  // For several states, where it is for the judge to see that they lead nowhere:
  std::set<std::string> nowhere;       // those that lead to no item
  std::set<std::string> byMadeUpID;    // records by a made-up id, which is 0 here
  std::set<std::string> honestErrors;  // that there is none, or that it cannot be told
  std::string trace;                   // differs when any of the items that were met is another
};

// What is to be answered while the tree is like that: one response for one state. For several,
// every response of which each step was true in one of them, though perhaps not in the same: the
// item was moved while it was asked for.
Truth Answers(const Graph& graph, const Place& place, const Request& request);

}  // namespace tallowmere::soak
