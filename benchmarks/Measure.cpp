#include "Measure.h"

#include <algorithm>
#include <cstdio>
#include <ctime>
#include <utility>

namespace tallowmere::benchmark {

bool Figure::IsMet() const {
  return !value || !bar || (isLeast ? *value >= *bar : *value <= *bar);
}

Figure RatioOf(const std::string& what, const std::vector<double>& firsts,
               const std::vector<double>& seconds, const std::string& unit) {
  std::vector<double> ratios;
  for (std::size_t i = 0; i < firsts.size(); ++i) ratios.push_back(firsts[i] / seconds[i]);
  char quotient[64];
  std::snprintf(quotient, sizeof quotient, "%.2f ÷ %.2f %s", Median(firsts), Median(seconds),
                unit.c_str());
  return {what, Median(ratios), "", quotient, {}};
}

Figure Skipped(const std::string& what, const std::string& why) {
  return {what, {}, "", why, {}};
}

Figure AtMost(double bar, Figure figure) {
  figure.bar = bar;
  return figure;
}

Figure AtLeast(double bar, Figure figure) {
  figure.isLeast = true;
  return AtMost(bar, std::move(figure));
}

double Median(std::vector<double> values) {
  const auto middle = values.begin() + static_cast<std::ptrdiff_t>(values.size() / 2);
  std::nth_element(values.begin(), middle, values.end());
  return *middle;
}

double Now() {
  timespec now{};
  clock_gettime(CLOCK_MONOTONIC, &now);
  return static_cast<double>(now.tv_sec) * 1e6 + static_cast<double>(now.tv_nsec) / 1e3;
}

}  // namespace tallowmere::benchmark
