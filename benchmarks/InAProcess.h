// Measuring in a process of its own, and where and as whom a process runs.
#pragma once

#include <functional>
#include <string>
#include <vector>

namespace tallowmere::benchmark {

// What `measure` gives in a forked process; what it throws fails here too. REQUIRES: this process
// has one thread.
std::vector<double> InAProcess(const std::function<std::vector<double>()>& measure);

// From now on this process may do no more than a user without any files of his own.
void DropPrivilege();

// This process and what it starts: on the last core that it may use, where the fewest interrupts
// are; and again on all that it could use before.
void PinToOneCore();
void UseAllCores();

// Runs a program to its end, its output thrown away, and gives the time that takes, in
// microseconds. Fails when the program does.
double TimeOf(const std::vector<std::string>& command);

// Whether PATH has a program.
bool IsOnPath(const std::string& program);

}  // namespace tallowmere::benchmark
