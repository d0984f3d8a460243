// Where an answer leads: the items that its path or its record names to whoever takes it at its
// word.
#pragma once

#include <set>
#include <string_view>
#include <vector>

#include "Graph.h"
#include "Requests.h"

namespace tallowmere::soak {

// The items in one state, none for an answer that tells neither path nor record. It is more than
// one only where "..." stands for any folder. REQUIRES: the graph is of one state.
std::set<Node> LeadsTo(const Graph& graph, const Place& place, unsigned code,
                       std::string_view response);

// The items that the request's path leads to when the tree passes through the states while its
// names are looked up, one after the other: no look-up of several names, the kernel's own included,
// is of one moment. Of code 1 also the folder in front of the last name, by which what is not there
// is told. None for codes without a path.
std::set<Node> LedToInPassing(const std::vector<const State*>& states, const Request& request);

}  // namespace tallowmere::soak
