// What is to be answered while the tree is like that.
#pragma once

#include <set>
#include <string>

#include "Graph.h"
#include "Requests.h"

namespace tallowmere::soak {

struct Truth {
  std::set<std::string> responses;
  std::set<std::string> nowhere;  // for several states: those that lead to no item in any of them
  std::string trace;              // of the items that were met: differs when any of them is another
};

// What is to be answered while the tree is like that: one response for one state. For several,
// every response of which each step was true in one of them, though perhaps not in the same: the
// item was moved while it was asked for.
Truth Answers(const Graph& graph, const Place& place, const Request& request);

// The answers that say that there is none, or that it cannot be told.
std::set<std::string> HonestErrors(const Place& place, const Request& request);

}  // namespace tallowmere::soak
