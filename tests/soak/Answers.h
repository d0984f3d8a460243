// The correct answers to a request while the tree is in given states.
#pragma once

#include <set>
#include <string>

#include "Graph.h"
#include "Requests.h"

namespace tallowmere::soak {

struct Truth {
  std::set<std::string> responses;
  // Only for several states; the judge must check that these lead nowhere:
  std::set<std::string> nowhere;       // answers that lead to no item
  std::set<std::string> byMadeUpID;    // records with a made-up id, given here as 0
  std::set<std::string> honestErrors;  // errors: no such item, or undetermined
  std::string trace;                   // differs whenever a visited item differs
};

// Returns the correct answers. For one state, that is one response. For several states, it is every
// response each of whose steps was true in some state, not necessarily the same one: the item may
// have moved mid-request.
Truth Answers(const Graph& graph, const Place& place, const Request& request);

}  // namespace tallowmere::soak
