// A service with the fault library: the calls that a request takes, and the effect of one of them
// failing.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "faults/FaultPage.h"
#include "support/ChildProgram.h"
#include "support/Copies.h"

namespace tallowmere::test {

// One fault: the call or the allocation with this number, from 1.
struct Fault {
  enum class Kind { kNone, kCall, kAllocation };
  Kind kind = Kind::kNone;
  std::uint32_t number = 0;
  std::int32_t effect = 0;  // on a call, as on the page

  std::string Text() const;
};

// How a service handled a request.
struct Outcome {
  std::string response;       // everything that it sent
  bool hasFailed;             // whether the chosen call or allocation failed
  SeenCall failedCall;        // that call
  std::uint32_t callsBefore;  // before the failed allocation
  // The status with which it ended, as from ChildProgram::Wait(); nullopt if it lives.
  std::optional<int> status;
};

// The calls, including the one that waits for the next request, and the allocations.
struct Effort {
  std::vector<SeenCall> calls;
  std::uint32_t allocations;
};

// The resources that a service holds.
struct Holdings {
  std::int64_t allocations;
  std::size_t descriptors;

  bool operator==(const Holdings&) const = default;
};

class FaultyService {
 public:
  // What services are copied from: they have the root folder that this process has now.
  static std::unique_ptr<Copies> Original();

  // Starts a service with this process as its parent. The fault is counted from the start of its
  // program, whatever it is asked.
  explicit FaultyService(const Copies& copies, const Fault& fault = {});

  // Replaces the fault by this one, counted from now.
  void Arm(const Fault& fault);

  // Asks, and waits until the service waits for the next request or has ended.
  Outcome Ask(std::string_view request);

  // Counts everything since the last Arm, or since the start.
  Effort EffortSoFar() const;

  // REQUIRES: the service is waiting for a request.
  Holdings Holds() const;

 private:
  bool AwaitRest();

  std::unique_ptr<ChildProgram> mProgram;
  std::uint32_t mRests = 0;
};

}  // namespace tallowmere::test
