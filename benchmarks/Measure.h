// What is measured: named measures, each of which gives one or more figures, lines of the table.
#pragma once

#include <chrono>
#include <filesystem>
#include <functional>
#include <optional>
#include <string>
#include <vector>

namespace tallowmere::benchmark {

// What the measures share.
struct Settings {
  std::string service;               // the program
  int runs;                          // of which a figure is the median
  int requests;                      // of each server in a run
  long entries;                      // in a big tree
  std::chrono::milliseconds settle;  // how long a new file is left alone
  std::filesystem::path folder;      // for whatever files are needed; removed by somebody else
};

// A line of the table.
struct Figure {
  std::string what;
  std::optional<double> value;  // none when it was skipped
  std::string unit;             // empty for a ratio
  std::string remark;           // what the ratio is of, or why it was skipped
  std::optional<double> bar;    // none where the figure is only shown
  bool isLeast = false;         // the bar is the least that the value may be, not the most

  bool IsMet() const;
};

// The median of the ratios of each run; `unit` is that of the two. REQUIRES: as many of both.
Figure RatioOf(const std::string& what, const std::vector<double>& firsts,
               const std::vector<double>& seconds, const std::string& unit);
Figure Skipped(const std::string& what, const std::string& why);
Figure AtMost(double bar, Figure figure);
Figure AtLeast(double bar, Figure figure);

struct Measure {
  std::string name;  // to choose it by
  std::function<std::vector<Figure>(const Settings&)> take;
};

// Each request against the floor, "code1" to "code10".
std::vector<Measure> RoundTripMeasures();

// The service as a process, "start", "batch" and "memory".
std::vector<Measure> ProcessMeasures();

// From a node id to its item, "warm" and "cold".
std::vector<Measure> NodeIDMeasures();

// The same on kinds of file systems, "kinds", "privileged" and "untrusted".
std::vector<Measure> FileSystemMeasures();

// The middle one; of an even number the upper one of two. REQUIRES: there is one.
double Median(std::vector<double> values);

// In microseconds, since some moment.
double Now();

}  // namespace tallowmere::benchmark
