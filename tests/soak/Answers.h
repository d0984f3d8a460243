// The right answers while the tree is in a given state.
#pragma once

#include <set>
#include <string>

#include "Graph.h"
#include "Requests.h"

namespace tallowmere::soak {

struct Truth {
  std::set<std::string> responses;
  // For several states, where the judge must check that they lead nowhere:
  std::set<std::string> nowhere;       // those that lead to no item
  std::set<std::string> byMadeUpID;    // records with a made-up id, which is 0 here
  std::set<std::string> honestErrors;  // that there is no item, or that it cannot be determined
  std::string trace;                   // differs when any item that was visited differs
};

// The right answers while the tree is in this state; for one state, one response. For several
// states, all responses each of whose steps was true in one of them, though perhaps not in the same
// one: the item was moved during the request.
Truth Answers(const Graph& graph, const Place& place, const Request& request);

}  // namespace tallowmere::soak
