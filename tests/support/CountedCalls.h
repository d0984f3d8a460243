// The system calls that a piece of code makes.
#pragma once

#include <functional>
#include <optional>
#include <vector>

namespace tallowmere::test {

// The numbers of the calls that `work` makes after `prepare`, except those for memory. Both run in
// a traced child process. Nullopt where tracing is not possible; throws when they end the child.
std::optional<std::vector<long>> CallsOf(const std::function<void()>& prepare,
                                         const std::function<void()>& work);

}  // namespace tallowmere::test
