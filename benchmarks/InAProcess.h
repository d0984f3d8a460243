// Measuring in a process of its own; choosing a process's core and privileges.
#pragma once

#include <functional>
#include <string>
#include <vector>

namespace tallowmere::benchmark {

// Returns what `measure` returns in a forked process; fails here too when it throws. REQUIRES: this
// process has one thread.
std::vector<double> InAProcess(const std::function<std::vector<double>()>& measure);

// Takes from this process, for good, every right beyond those of a user without files.
void DropPrivilege();

// PinToOneCore keeps this process, and what it starts, on the last core that it may use, which has
// the fewest interrupts. The other lets it use all its cores again.
void PinToOneCore();
void UseAllCores();

// Runs a program to its end, discarding its output; returns the time taken in microseconds. Fails
// when the program does.
double TimeOf(const std::vector<std::string>& command);

// Whether a program is on PATH.
bool IsOnPath(const std::string& program);

}  // namespace tallowmere::benchmark
