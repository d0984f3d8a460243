// File systems that a process serves.
#pragma once

#include <functional>
#include <string>
#include <vector>

namespace tallowmere::soak {

// Runs `serve`, which does not return, in a child process that ends with this one. Returns whether
// something is mounted at `place` within a few seconds.
bool IsServed(const std::string& place, const std::function<void()>& serve);

// The same with a program, which stays in the foreground.
bool IsServedBy(const std::vector<std::string>& command, const std::string& place);

}  // namespace tallowmere::soak
