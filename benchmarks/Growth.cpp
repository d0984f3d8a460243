#include "Growth.h"

#include <unistd.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <iterator>
#include <list>
#include <thread>

#include "BigTree.h"
#include "Contest.h"
#include "Plot.h"
#include "Questions.h"
#include "support/MountNamespace.h"
#include "support/Wire.h"

namespace tallowmere::benchmark {
namespace {

constexpr const char* kRoundTripLabel = "round trip (µs)";

std::string OwnID() {
  return std::to_string(getpid());
}

// Adds each contestant's round trip, the median of the runs, to the series with the same index.
void AddRoundTrips(const Settings& settings, const std::vector<Contestant>& contestants,
                   double size, std::vector<Series>& series) {
  std::vector<std::vector<double>> times(contestants.size());
  for (int run = 0; run < settings.runs; ++run) {
    const auto costs = Compete(contestants, settings.requests);
    for (std::size_t i = 0; i < costs.size(); ++i) times[i].push_back(costs[i].roundTrip);
  }
  for (std::size_t i = 0; i < times.size(); ++i) {
    series[i].points.push_back({size, Median(times[i])});
  }
}

Contestant AskedOf(Server& server, const Question& question) {
  return {&server, question.request, question.answerSize};
}

// An item whose path has this many components. When the settings' folder is below that depth, one
// of the folders on the way to it.
std::filesystem::path ItemAtDepth(const Settings& settings, int depth) {
  std::filesystem::path item;
  for (const auto& part : settings.folder) {
    item /= part;
    if (std::distance(item.begin(), item.end()) > depth) return item;
  }
  // The names are short, so that a full HFS path has room for all of them.
  while (std::distance(item.begin(), item.end()) < depth) item /= "d";
  std::filesystem::create_directories(item);
  item /= "a track.aif";
  MakeEmptyFile(item);
  std::this_thread::sleep_for(settings.settle);
  return item;
}

Plot Depth(const Settings& settings) {
  std::vector<Series> series{
      {"code 1", {}}, {"code 7", {}}, {"code 9", {}}, {"floor of code 7", {}}};
  for (const int depth : {1, 2, 5, 10, 20, 50, 100, 200}) {
    const Item item = AskAbout(settings.service, ItemAtDepth(settings, depth));
    Server service(settings.service, {OwnID()});
    Server floor(TALLOWMERE_FLOOR, {OwnID(), item.path, item.volumeName});
    const Question record = QuestionOf(protocol::kRequestGetFSSpec, item);
    AddRoundTrips(settings,
                  {AskedOf(service, QuestionOf(protocol::kRequestMakeFullPath, item)),
                   AskedOf(service, record),
                   AskedOf(service, QuestionOf(protocol::kRequestSetFileRefFromFSSpec, item)),
                   AskedOf(floor, record)},
                  depth, series);
  }
  return {"Cost by depth", "components of the path", kRoundTripLabel, series};
}

// The question for the path of a plain name in the folder of an item.
Question PathOf(const Item& item, const std::string& name) {
  Item other = item;
  other.path = item.folder + "/" + name;
  other.record = test::Record(item.volume, item.folderID, name);
  return QuestionOf(protocol::kRequestSetFileRefFromFSSpec, other);
}

Plot FolderSize(const Settings& settings) {
  std::vector<Series> series{{"code 9, present name", {}}, {"code 9, missing name", {}}};
  const MemoryVolume volume;
  const auto folder = volume.Path() / "folder";
  std::filesystem::create_directory(folder);
  long made = 0;
  for (long size = 10; size <= settings.entries; size *= 10) {
    for (; made < size; ++made) MakeEmptyFile(folder / ("a track " + std::to_string(made)));
    const Item item = AskAbout(settings.service, folder / ("a track " + std::to_string(size / 2)));
    Server service(settings.service, {OwnID()});
    const Question record = QuestionOf(protocol::kRequestGetFSSpec, item);
    service.Ask(record.request, record.answerSize);
    AddRoundTrips(
        settings,
        {AskedOf(service, PathOf(item, item.name)), AskedOf(service, PathOf(item, "missing"))},
        static_cast<double>(size), series);
  }
  return {"Cost by size of the folder", "entries in the folder", kRoundTripLabel, series};
}

// Measures with up to this many mounts more than the machine has, asking for the last one by its
// name.
Plot Mounts(const Settings& settings, long most) {
  std::vector<Series> series{{"code 3, last volume", {}}, {"code 4", {}}, {"code 7", {}}};
  const auto folder = settings.folder / "mounts";
  std::list<test::ScopedMount> mounts;
  for (long count = 1; count <= most; count *= 10) {
    while (static_cast<long>(mounts.size()) < count) {
      const auto place = folder / ("volume " + std::to_string(mounts.size()));
      std::filesystem::create_directories(place);
      mounts.emplace_back("tmpfs", place, "tmpfs");
    }
    const auto path = folder / ("volume " + std::to_string(count - 1)) / "a track.aif";
    MakeEmptyFile(path);
    const Item item = AskAbout(settings.service, path);
    Server service(settings.service, {OwnID()});
    AddRoundTrips(settings,
                  {AskedOf(service, QuestionOf(protocol::kRequestGetVolRefnumByHFSName, item)),
                   AskedOf(service, QuestionOf(protocol::kRequestGetHFSVolumeName, item)),
                   AskedOf(service, QuestionOf(protocol::kRequestGetFSSpec, item))},
                  static_cast<double>(count), series);
  }
  return {"Cost by number of mounts, between changes", "mounts", kRoundTripLabel, series};
}

Plot Memory(const Settings& settings) {
  Series series{"code 7", {}};
  const auto& files = TheBigTree(settings.entries).tree.files;
  Server service(settings.service, {OwnID()});
  std::size_t asked = 0;
  double next = 10;
  for (const auto& path : files) {
    Item item{};
    item.path = path;
    const Question question = QuestionOf(protocol::kRequestGetFSSpec, item);
    service.Ask(question.request, question.answerSize);
    if (++asked < static_cast<std::size_t>(next) && asked < files.size()) continue;
    series.points.push_back({static_cast<double>(asked), service.Memory("VmRSS")});
    next *= std::sqrt(10);
  }
  return {"Memory by number of distinct items touched",
          "items, each in one request",
          "resident memory (KiB)",
          {series}};
}

void Write(const Plot& plot, const std::filesystem::path& file) {
  WritePlot(plot, file);
  std::printf("%s\n", plot.title.c_str());
  for (const Series& series : plot.series) {
    std::printf("  %-24s exponent %5.2f:", series.name.c_str(), Exponent(series));
    for (const auto& [size, cost] : series.points) std::printf(" %g: %.4g,", size, cost);
    std::printf("\n");
  }
  std::fflush(stdout);
}

}  // namespace

void PlotGrowth(const Settings& settings, const std::filesystem::path& folder) {
  Write(Depth(settings), folder / "growth-depth.svg");
  Write(FolderSize(settings), folder / "growth-folder.svg");
  if (test::EnterOwnMountNamespace()) {
    // At least two sizes, to get a curve.
    Write(Mounts(settings, std::max(settings.entries / 1000, 10L)), folder / "growth-mounts.svg");
  } else {
    std::printf("Cost by number of mounts: skipped, mounting is not permitted\n");
  }
  Write(Memory(settings), folder / "growth-memory.svg");
}

}  // namespace tallowmere::benchmark
