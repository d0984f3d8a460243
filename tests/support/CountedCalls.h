// The system calls that a piece of work makes.
#pragma once

#include <functional>
#include <optional>
#include <vector>

namespace tallowmere::test {

// The numbers of the calls that `work` makes after `prepare`, but those for memory: both run in a
// child process, traced. None where nothing can be traced; throws when they end the child.
std::optional<std::vector<long>> CallsOf(const std::function<void()>& prepare,
                                         const std::function<void()>& work);

}  // namespace tallowmere::test
