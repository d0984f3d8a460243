// A small plot of how cost grows, as SVG: both axes logarithmic, colours visible on light and dark
// backgrounds.
#pragma once

#include <filesystem>
#include <string>
#include <vector>

namespace tallowmere::benchmark {

struct Point {
  double size;
  double cost;
};

// Points in order of size, at least two of them of different size; all values are above 0.
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
// half of the points, where constant costs count least.
double Exponent(const Series& series);

// Writes the plot, with the exponent of each series beside its name.
void WritePlot(const Plot& plot, const std::filesystem::path& file);

}  // namespace tallowmere::benchmark
