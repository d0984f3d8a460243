// File systems served by a process.
#pragma once

#include <functional>
#include <string>
#include <vector>

namespace tallowmere::soak {

// Runs `serve`, which does not return, in a child process that ends with this one. Returns whether
// a file system is mounted at `place` within a few seconds.
bool IsServed(const std::string& place, const std::function<void()>& serve);

// Runs a program that stays in the foreground, likewise.
bool IsServedBy(const std::vector<std::string>& command, const std::string& place);

}  // namespace tallowmere::soak
