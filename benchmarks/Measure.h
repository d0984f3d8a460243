// What is measured: named measures, each of which returns one or more figures, the lines of the
// table.
#pragma once

#include <chrono>
#include <filesystem>
#include <functional>
#include <optional>
#include <string>
#include <vector>

namespace tallowmere::benchmark {

// What all measures share.
struct Settings {
  std::string service;               // the program
  int runs;                          // a figure is their median
  int requests;                      // to each server in a run
  long entries;                      // of a big tree
  std::chrono::milliseconds settle;  // the time before a new file is used
  std::filesystem::path folder;      // for all files needed; removed by the caller
};

// A line of the table.
struct Figure {
  std::string what;
  std::optional<double> value;  // nullopt when it was skipped
  std::string unit;             // empty for a ratio
  std::string remark;           // what the ratio relates, or why it was skipped
  std::optional<double> bar;    // nullopt when the figure is only shown
  bool isLeast = false;         // the bar is a minimum, not a maximum

  bool IsMet() const;
};

// The median of the ratios of each run; `unit` is that of the two series. REQUIRES: both series
// have the same length.
Figure RatioOf(const std::string& what, const std::vector<double>& firsts,
               const std::vector<double>& seconds, const std::string& unit);
Figure Skipped(const std::string& what, const std::string& why);
Figure AtMost(double bar, Figure figure);
Figure AtLeast(double bar, Figure figure);

struct Measure {
  std::string name;  // selects it on the command line
  std::function<std::vector<Figure>(const Settings&)> take;
};

// Each request compared with the floor: "code1" to "code10".
std::vector<Measure> RoundTripMeasures();

// The service as a process: "start", "batch" and "memory".
std::vector<Measure> ProcessMeasures();

// From a node id to its item: "warm" and "cold".
std::vector<Measure> NodeIDMeasures();

// The same on various kinds of file systems: "kinds", "privileged" and "untrusted".
std::vector<Measure> FileSystemMeasures();

// The middle value; of an even number of values, the upper of the two. REQUIRES: at least one
// value.
double Median(std::vector<double> values);

// The time in microseconds since a fixed moment.
double Now();

}  // namespace tallowmere::benchmark
