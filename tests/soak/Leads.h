// Where an answer leads: the items that its path or its record names to whoever takes it at its
// word.
#pragma once

#include <set>
#include <string_view>

#include "Graph.h"
#include "Requests.h"

namespace tallowmere::soak {

// The items in one state, none for an answer that tells neither path nor record. It is more than
// one only where "..." stands for any folder. REQUIRES: the graph is of one state.
std::set<Node> LeadsTo(const Graph& graph, const Place& place, unsigned code,
                       std::string_view response);

}  // namespace tallowmere::soak
