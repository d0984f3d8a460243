// The ways in which a system call can fail.
#pragma once

#include <cstdint>
#include <vector>

#include "faults/FaultPage.h"

namespace tallowmere::test {

// The effects on the page that a call can plausibly have, by its manual page; none for a call that
// cannot fail.
std::vector<std::int32_t> PlausibleEffects(const SeenCall& call);

}  // namespace tallowmere::test
