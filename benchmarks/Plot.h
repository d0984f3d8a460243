// A small plot of how cost grows, as SVG: both axes logarithmic, colours that are seen on light and
// on dark ground.
#pragma once

#include <filesystem>
#include <string>
#include <vector>

namespace tallowmere::benchmark {

struct Point {
  double size;
  double cost;
};

// Points in the order of their size, at least two of different size; everything is above 0.
struct Series {
  std::string name;
  std::vector<Point> points;
};

struct Plot {
  std::string title;
  std::string sizeLabel;  // of the horizontal axis, with its unit
  std::string costLabel;
  std::vector<Series> series;  // at most four
};

// The exponent b of cost = a · size^b, fitted by least squares of the logarithms over the larger
// half of the points, where what the cost begins with counts least.
double Exponent(const Series& series);

// The exponent of each series stands beside its name.
void WritePlot(const Plot& plot, const std::filesystem::path& file);

}  // namespace tallowmere::benchmark
