// What is measured: named measures, each of which gives one or more figures, lines of the table.
#pragma once

#include <filesystem>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "Questions.h"

namespace tallowmere::benchmark {

// A line of the table.
struct Figure {
  std::string what;
  std::optional<double> value = {};  // none when it was skipped
  std::string unit = {};             // empty for a ratio
  std::optional<double> bar = {};    // none where the figure is only shown
  bool isLeast = false;              // the bar is the least that the value may be, not the most
  std::string remark = {};           // what the ratio is of, or why it was skipped

  bool IsMet() const;
};

// What the measures share.
struct Settings {
  std::string service;  // the program
  int runs;
  int requests;                  // of each server in a run
  long entries;                  // in a big tree
  std::filesystem::path folder;  // for whatever files are needed; removed by somebody else
};

struct Measure {
  std::string name;  // to choose it by
  std::function<std::vector<Figure>(const Settings&)> take;
};

// Code 1 to 10 against the floor, round trip and processor time, each a measure of its own called
// "code1" and so on; the codes 7 and 9 also against a file server.
std::vector<Measure> RoundTripMeasures();

// "1.23 ÷ 1.00 µs", for the remark of a ratio.
std::string Quotient(double first, double second, const char* unit);

}  // namespace tallowmere::benchmark
