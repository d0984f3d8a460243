// Resolves an answer: finds the items that its path or record names, taken literally.
#pragma once

#include <set>
#include <string_view>
#include <vector>

#include "Graph.h"
#include "Requests.h"

namespace tallowmere::soak {

// Returns the items in one state, or none for an answer with neither path nor record. Returns more
// than one only where "..." stands for any folder. REQUIRES: the graph is of one state.
std::set<Node> LeadsTo(const Graph& graph, const Place& place, unsigned code,
                       std::string_view response);

// Returns the items that the request's path leads to when the tree passes through the states while
// the names are looked up one by one; not even the kernel looks up a whole path at one moment. For
// code 1, includes the folder in front of the last name, which stands in for a missing item.
// Returns none for codes without a path.
std::set<Node> LedToInPassing(const std::vector<const State*>& states, const Request& request);

}  // namespace tallowmere::soak
