// A service with the fault library in it: which calls a request takes, and what becomes of it when
// one of them fails.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "faults/FaultPage.h"
#include "support/ChildProgram.h"

namespace tallowmere::test {

// One thing to go wrong: of all calls, or of all allocations, the one with that number, from 1.
struct Fault {
  enum class Kind { kNone, kCall, kAllocation };
  Kind kind = Kind::kNone;
  std::uint32_t number = 0;
  std::int32_t effect = 0;  // of a call, as on the page

  std::string Text() const;
};

// What a service did with a request.
struct Outcome {
  std::string response;       // all that it sent
  bool hasFailed;             // the call or the allocation that was to fail
  SeenCall failedCall;        // which call that was
  std::uint32_t callsBefore;  // of an allocation that failed
  // With which it ended, as ChildProgram::Wait() has it; none if it lives.
  std::optional<int> status;
};

// What it takes: calls, the one that waits for the next request among them, and allocations.
struct Effort {
  std::vector<SeenCall> calls;
  std::uint32_t allocations;
};

// What a service holds.
struct Holdings {
  std::int64_t allocations;
  std::size_t descriptors;

  bool operator==(const Holdings&) const = default;
};

class FaultyService {
 public:
  // Starts one with this process for its parent. The fault counts from the start of its program,
  // whatever it is asked.
  explicit FaultyService(const Fault& fault = {});

  // Whether the kernel lets the library do its work here.
  static bool IsPossible();

  // From now on nothing else goes wrong than this, counted from now.
  void Arm(const Fault& fault);

  // Asks, and waits until the service waits for the next request or has ended.
  Outcome Ask(std::string_view request);

  // Of all that it did since the last Arm, or since its start.
  Effort EffortSoFar() const;

  // While it waits for a request.
  Holdings Holds() const;

 private:
  bool AwaitRest();

  std::unique_ptr<ChildProgram> mProgram;
  std::uint32_t mRests = 0;
};

}  // namespace tallowmere::test
