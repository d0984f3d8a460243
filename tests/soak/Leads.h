// Where an answer leads: the items that its path or its record names, taken literally.
#pragma once

#include <set>
#include <string_view>
#include <vector>

#include "Graph.h"
#include "Requests.h"

namespace tallowmere::soak {

// The items in one state; none for an answer with neither path nor record. More than one only where
// "..." stands for any folder. REQUIRES: the graph is of one state.
std::set<Node> LeadsTo(const Graph& graph, const Place& place, unsigned code,
                       std::string_view response);

// The items that the request's path leads to when the tree passes through the states while its
// names are looked up one by one: no look-up of several names, not even the kernel's own, happens
// at one moment. For code 1 also the folder before the last name, by which a missing item is
// reported. None for codes without a path.
std::set<Node> LedToInPassing(const std::vector<const State*>& states, const Request& request);

}  // namespace tallowmere::soak
