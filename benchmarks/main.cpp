// tallowmere_bench: takes the measures in one run and prints them as one Markdown table.

#include <signal.h>
#include <sys/utsname.h>

#include <CLI/CLI.hpp>
#include <algorithm>
#include <array>
#include <cstdio>
#include <fstream>
#include <iostream>
#include <nlohmann/json.hpp>

#include "Growth.h"
#include "InAProcess.h"
#include "Measure.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::benchmark {
namespace {

// For two seconds, a newborn item's time of birth is not enough to identify it.
constexpr std::chrono::milliseconds kTimeToSettle{3'200};

std::string Format(const char* format, double value) {
  char text[64];
  std::snprintf(text, sizeof text, format, value);
  return text;
}

std::string TextOf(double value, const std::string& unit) {
  return unit.empty() ? Format("%.2f", value) : Format("%.1f ", value) + unit;
}

std::string BarOf(const Figure& figure) {
  if (!figure.bar) return "";
  return (figure.isLeast ? "≥ " : "≤ ") + TextOf(*figure.bar, figure.unit);
}

std::string VerdictOf(const Figure& figure) {
  if (!figure.value) return "skipped";
  if (!figure.bar) return "shown";
  return figure.IsMet() ? "met" : "NOT MET";
}

// Assumes that every character of UTF-8 is one column wide.
std::string Padded(std::string text, std::size_t width) {
  for (const char byte : std::string(text)) width += (byte & 0xC0) == 0x80 ? 1 : 0;
  if (text.size() < width) text.resize(width, ' ');
  return text;
}

void PrintRow(const std::vector<std::string>& cells) {
  static constexpr std::array<std::size_t, 5> kWidths{60, 9, 9, 7, 24};
  for (std::size_t i = 0; i < cells.size(); ++i) {
    std::cout << "| " << Padded(cells[i], kWidths[i]) << ' ';
  }
  std::cout << "|" << std::endl;
}

nlohmann::json JSONOf(const Figure& figure) {
  nlohmann::json object{{"measure", figure.what},
                        {"unit", figure.unit.empty() ? "ratio" : figure.unit},
                        {"remark", figure.remark},
                        {"verdict", VerdictOf(figure)}};
  if (figure.value) object["value"] = *figure.value;
  if (figure.bar) object[figure.isLeast ? "least" : "most"] = *figure.bar;
  return object;
}

std::string MachineLine() {
  utsname system{};
  uname(&system);
  std::string load;
  std::ifstream("/proc/loadavg") >> load;
  return std::string(system.sysname) + " " + system.release + " " + system.machine +
         ", load before " + load;
}

std::vector<Measure> AllMeasures() {
  std::vector<Measure> all;
  for (const auto& measures :
       {RoundTripMeasures(), ProcessMeasures(), NodeIDMeasures(), FileSystemMeasures()}) {
    all.insert(all.end(), measures.begin(), measures.end());
  }
  return all;
}

// The command line's choices.
struct Choices {
  Settings settings{TALLOWMERE_SERVICE, 5, 5000, 1'000'000, kTimeToSettle, {}};
  bool isTrial = false;
  std::vector<std::string> measures;  // empty: all
  std::string json;
  std::string plots;

  bool Has(const Measure& measure) const {
    return measures.empty() ||
           std::find(measures.begin(), measures.end(), measure.name) != measures.end();
  }
};

void AddOptions(CLI::App& app, Choices& choices, const std::vector<Measure>& all) {
  std::vector<std::string> names;
  names.reserve(all.size());
  for (const Measure& measure : all) names.push_back(measure.name);
  Settings& settings = choices.settings;
  app.add_option("--only", choices.measures, "A measure to take, of all of them; can be repeated")
      ->check(CLI::IsMember(names));
  app.add_option("--runs", settings.runs, "How often a measure is taken; the table has medians")
      ->check(CLI::Range(1, 1000))
      ->capture_default_str();
  app.add_option("--requests", settings.requests, "How often a request is asked in each run")
      ->check(CLI::Range(1, 10'000'000))
      ->capture_default_str();
  app.add_option("--entries", settings.entries, "How many entries a big tree has")
      ->check(CLI::Range(100, 100'000'000))
      ->capture_default_str();
  app.add_option("--service", settings.service, "The program to measure")->capture_default_str();
  app.add_option("--json", choices.json,
                 "A file for the same figures as JSON; \"-\" for standard output");
  app.add_option("--plots", choices.plots, "Plot how cost grows instead, into that folder")
      ->check(CLI::ExistingDirectory);
  app.add_flag("--trial", choices.isTrial, "Only see that it runs: the figures mean nothing");
}

void PrintFigure(const Figure& figure) {
  PrintRow({figure.what, figure.value ? TextOf(*figure.value, figure.unit) : "", BarOf(figure),
            VerdictOf(figure), figure.remark});
}

void TakeMeasures(const Choices& choices, const std::vector<Measure>& all) {
  const bool printsTable = choices.json != "-";
  if (printsTable) {
    std::cout << MachineLine() << ", medians of " << choices.settings.runs << " runs\n\n";
    PrintRow({"Measure", "Figure", "Bar", "", "Of"});
    PrintRow({"---", "---", "---", "---", "---"});
  }
  auto objects = nlohmann::json::array();
  for (const Measure& measure : all) {
    if (!choices.Has(measure)) continue;
    for (const Figure& figure : measure.take(choices.settings)) {
      objects.push_back(JSONOf(figure));
      if (printsTable) PrintFigure(figure);
    }
  }
  if (choices.json == "-") {
    std::cout << objects.dump(2) << '\n';
  } else if (!choices.json.empty()) {
    std::ofstream(choices.json) << objects.dump(2) << '\n';
  }
}

int Run(int argumentCount, char** arguments) {
  const std::vector<Measure> all = AllMeasures();
  Choices choices;
  CLI::App app("Measures the service against floors and peers and prints one table.");
  AddOptions(app, choices, all);
  CLI11_PARSE(app, argumentCount, arguments);
  if (choices.isTrial) choices.settings = {choices.settings.service, 1, 10, 300, {}, {}};

  signal(SIGPIPE, SIG_IGN);
  const test::TemporaryFolder folder;
  choices.settings.folder = folder.Path();
  PinToOneCore();
  if (choices.plots.empty()) {
    TakeMeasures(choices, all);
  } else {
    PlotGrowth(choices.settings, choices.plots);
  }
  return EXIT_SUCCESS;
}

}  // namespace

}  // namespace tallowmere::benchmark

int main(int count, char** arguments) {
  try {
    return tallowmere::benchmark::Run(count, arguments);
  } catch (const std::exception& error) {
    std::cerr << error.what() << '\n';
    return EXIT_FAILURE;
  }
}
