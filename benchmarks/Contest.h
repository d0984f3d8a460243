// Several servers are asked one request after the other, in turn, so that whatever the machine does
// meanwhile happens to all of them.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include "Server.h"

namespace tallowmere::benchmark {

struct Contestant {
  Server* server;
  std::string request;
  std::size_t answerSize;  // in bytes
};

// For one request, in microseconds.
struct Cost {
  double roundTrip;  // from its first byte written to the last byte of its answer read
  double processor;  // user and system time of the server
};

// Asks each so many requests. Costs are medians: of all round trips, and of the processor time over
// some dozens of requests.
std::vector<Cost> Compete(const std::vector<Contestant>& contestants, int requests);

}  // namespace tallowmere::benchmark
