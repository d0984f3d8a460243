// Asks several servers one request after the other, in turns, so that whatever else the machine
// does affects them all alike.
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

// The cost of one request, in microseconds.
struct Cost {
  double roundTrip;  // from the first byte written to the last byte of the answer read
  double processor;  // user and system time of the server
};

// Asks each server this many requests. Costs are medians: of all round trips, and of the processor
// time over some dozens of requests.
std::vector<Cost> Compete(const std::vector<Contestant>& contestants, int requests);

}  // namespace tallowmere::benchmark
