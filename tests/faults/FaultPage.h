// What a test and a service with the fault library tell each other through shared memory.
//
// The library counts the service's system calls and its allocations, each from 1, and makes one of
// them fail as the page says. The test resets the counts while the service waits for a request.
#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>

namespace tallowmere::test {

// The environment variable with the page's descriptor. Without it the library does nothing.
inline constexpr char kFaultPageVariable[] = "TALLOWMERE_FAULT_PAGE";

// The exit status of a service in which the library cannot work.
inline constexpr int kCannotCatchCalls = 121;

// Effects on the call other than an error, which is a number above 0.
inline constexpr std::int32_t kShortened = -1;    // carried out for fewer bytes than requested
inline constexpr std::int32_t kWithoutBytes = 0;  // not carried out; returns 0

inline constexpr std::size_t kMostCalls = 8192;

struct SeenCall {
  std::int64_t number;  // of the system call
  std::int64_t first;   // its first argument
  std::int64_t size;    // its third argument
};

struct FaultPage {
  // Set by the test; 0 for none.
  std::atomic<std::uint32_t> failingCall;
  std::atomic<std::int32_t> effect;  // an error number, or one of the above
  std::atomic<std::uint32_t> failingAllocation;

  // Set by the library.
  std::atomic<std::uint32_t> calls;
  std::atomic<std::uint32_t> allocations;
  std::atomic<std::uint32_t> rests;  // how often the service began to wait for a request; a futex
  std::atomic<std::int64_t> liveAllocations;
  std::atomic<std::uint32_t> failed;       // whether the chosen one has failed
  SeenCall failedCall;                     // that call
  std::atomic<std::uint32_t> callsBefore;  // the number of calls before the failed allocation
  SeenCall seen[kMostCalls];
};

}  // namespace tallowmere::test
