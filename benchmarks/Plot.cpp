#include "Plot.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>
#include <fstream>
#include <limits>

namespace tallowmere::benchmark {
namespace {

// In pixels.
constexpr double kWidth = 640;
constexpr double kHeight = 360;
constexpr double kLeft = 76;
constexpr double kRight = 32;
constexpr double kTop = 40;
constexpr double kBottom = 52;
constexpr double kLineOfText = 18;

constexpr std::array<const char*, 4> kColours{"#3b82c4", "#d9772b", "#3f9b57", "#b0569e"};

// One axis: maps values to pixels, with its ends at powers of ten.
class Axis {
 public:
  Axis(double least, double most, double begin, double end)
      : mLow(static_cast<int>(std::floor(std::log10(least)))),
        mHigh(std::max(static_cast<int>(std::ceil(std::log10(most))), mLow + 1)),
        mBegin(begin),
        mEnd(end) {}

  // Exponents of ten.
  int Low() const { return mLow; }
  int High() const { return mHigh; }
  double At(double value) const {
    return mBegin + (mEnd - mBegin) * (std::log10(value) - mLow) / (mHigh - mLow);
  }

 private:
  int mLow;
  int mHigh;
  double mBegin;
  double mEnd;
};

std::string Number(const char* format, double value) {
  char text[32];
  std::snprintf(text, sizeof text, format, value);
  return text;
}

std::string Pixels(double value) {
  return Number("%.1f", value);
}

std::string Escaped(const std::string& text) {
  std::string escaped;
  for (const char c : text) {
    escaped += c == '<' ? "&lt;" : c == '&' ? "&amp;" : std::string(1, c);
  }
  return escaped;
}

std::string Text(double x, double y, const std::string& attributes, const std::string& text) {
  return "<text x=\"" + Pixels(x) + "\" y=\"" + Pixels(y) + "\" " + attributes + ">" +
         Escaped(text) + "</text>\n";
}

std::string Line(double x1, double y1, double x2, double y2) {
  return "<path class=\"grid\" d=\"M" + Pixels(x1) + " " + Pixels(y1) + "L" + Pixels(x2) + " " +
         Pixels(y2) + "\"/>\n";
}

std::string Grid(const Axis& sizes, const Axis& costs) {
  std::string svg;
  for (int power = sizes.Low(); power <= sizes.High(); ++power) {
    const double x = sizes.At(std::pow(10, power));
    svg += Line(x, kTop, x, kHeight - kBottom);
    svg += Text(x, kHeight - kBottom + kLineOfText, "text-anchor=\"middle\"",
                Number("%.7g", std::pow(10, power)));
  }
  for (int power = costs.Low(); power <= costs.High(); ++power) {
    const double y = costs.At(std::pow(10, power));
    svg += Line(kLeft, y, kWidth - kRight, y);
    svg += Text(kLeft - 6, y + 4, "text-anchor=\"end\"", Number("%.7g", std::pow(10, power)));
  }
  return svg;
}

std::string Curve(const Series& series, const char* colour, const Axis& sizes, const Axis& costs) {
  std::string path;
  std::string marks;
  for (const auto& [size, cost] : series.points) {
    const std::string x = Pixels(sizes.At(size));
    const std::string y = Pixels(costs.At(cost));
    path.append(path.empty() ? "M" : "L").append(x).append(" ").append(y);
    marks.append("<circle cx=\"").append(x).append("\" cy=\"").append(y);
    marks.append("\" r=\"3\" fill=\"").append(colour).append("\"/>\n");
  }
  return "<path d=\"" + path + "\" fill=\"none\" stroke-width=\"2\" stroke=\"" + colour + "\"/>\n" +
         marks;
}

}  // namespace

double Exponent(const Series& series) {
  const std::size_t first = std::min(series.points.size() / 2, series.points.size() - 2);
  double n = 0;
  double sumX = 0;
  double sumY = 0;
  double sumXX = 0;
  double sumXY = 0;
  for (std::size_t i = first; i < series.points.size(); ++i) {
    const double x = std::log(series.points[i].size);
    const double y = std::log(series.points[i].cost);
    ++n;
    sumX += x;
    sumY += y;
    sumXX += x * x;
    sumXY += x * y;
  }
  return (n * sumXY - sumX * sumY) / (n * sumXX - sumX * sumX);
}

void WritePlot(const Plot& plot, const std::filesystem::path& file) {
  Point least{std::numeric_limits<double>::max(), std::numeric_limits<double>::max()};
  Point most{0, 0};
  for (const Series& series : plot.series) {
    for (const auto& [size, cost] : series.points) {
      least = {std::min(least.size, size), std::min(least.cost, cost)};
      most = {std::max(most.size, size), std::max(most.cost, cost)};
    }
  }
  const Axis sizes(least.size, most.size, kLeft, kWidth - kRight);
  const Axis costs(least.cost, most.cost, kHeight - kBottom, kTop);

  std::ofstream svg(file);
  svg << "<svg xmlns=\"http://www.w3.org/2000/svg\" viewBox=\"0 0 " << kWidth << ' ' << kHeight
      << "\" font-family=\"sans-serif\" font-size=\"12\" fill=\"#808080\">\n"
      << "<style>.grid{stroke:#808080;stroke-opacity:.3}</style>\n"
      << Text(kLeft, kLineOfText, "font-size=\"14\"", plot.title) << Grid(sizes, costs);
  for (std::size_t i = 0; i < plot.series.size(); ++i) {
    const Series& series = plot.series[i];
    svg << Curve(series, kColours.at(i), sizes, costs)
        << Text(kLeft + 10, kTop + kLineOfText * static_cast<double>(i + 1),
                std::string("fill=\"") + kColours.at(i) + "\"",
                series.name + ": exponent " + Number("%.2f", Exponent(series)));
  }
  svg << Text((kLeft + kWidth - kRight) / 2, kHeight - 10, "text-anchor=\"middle\"", plot.sizeLabel)
      << Text(0, 0,
              "text-anchor=\"middle\" transform=\"translate(16 " +
                  Pixels((kTop + kHeight - kBottom) / 2) + ") rotate(-90)\"",
              plot.costLabel)
      << "</svg>\n";
}

}  // namespace tallowmere::benchmark
