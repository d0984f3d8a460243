// From a node id to its item on various kinds of file systems, which differ in what proves an
// item's identity.
#include <sys/mount.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cstdint>
#include <memory>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "BareWalk.h"
#include "BigTree.h"
#include "Contest.h"
#include "InAProcess.h"
#include "Measure.h"
#include "Questions.h"
#include "Server.h"

namespace tallowmere::benchmark {
namespace {

using Path = std::filesystem::path;

constexpr double kMicrosecondsInAMillisecond = 1000;
constexpr std::uintmax_t kGigabyte = std::uintmax_t{1} << 30;

// The question that leads from an item's record back to its path.
Question WayBack(const Item& item) {
  return QuestionOf(protocol::kRequestSetFileRefFromFSSpec, item);
}

// In microseconds. Fails when the answer is not the item's path.
double TimeOfWayBack(Server& service, const Item& item) {
  const auto [request, answerSize] = WayBack(item);
  const double begin = Now();
  const std::string_view answer = service.Ask(request, answerSize);
  const double end = Now();
  if (answer[0] != 1 || answer.find(item.path) == std::string_view::npos) Fail(item.path);
  return end - begin;
}

double MedianOfWayBack(Server& service, const Item& item) {
  constexpr std::size_t kTimes = 15;
  std::vector<double> times(kTimes);
  for (double& time : times) time = TimeOfWayBack(service, item);
  return Median(times);
}

// --- Warm, by kind ------------------------------------------------------------------------------

// Other folders beside the requested one; a pass over the whole volume would visit them.
constexpr long kFoldersBeside = 6000;

void MakeFolder(const Path& path) {
  if (mkdir(path.c_str(), 0755) != 0) Fail(path);
}

std::uint64_t InodeOf(const Path& path) {
  struct stat about {};
  if (stat(path.c_str(), &about) != 0) Fail(path);
  return about.st_ino;
}

struct Kind {
  const char* type;                  // as for mount(2)
  const char* what;                  // what is measured
  std::vector<std::string> command;  // fills an image; empty for tmpfs
  std::uintmax_t size;               // of the sparse image
  bool isSubvolume;                  // its inode numbers start where the volume's own do
  std::uint64_t from;                // the lowest inode number of the requested folder
  std::uint64_t to;                  // one above the highest
};

// The others are compared with the first. Two TiB of xfs have four allocation groups, the third of
// which begins with the number 2^31.
std::vector<Kind> Kinds() {
  constexpr std::uint64_t kFirst = 16;
  constexpr std::uint64_t kBit31 = std::uint64_t{1} << 31;
  return {{"ext4", "ext4", {"mkfs.ext4", "-q", "-F"}, kGigabyte, false, kFirst, kBit31},
          {"btrfs", "btrfs subvolume", {"mkfs.btrfs", "-q", "-f"}, kGigabyte, true, 0, kBit31},
          {"tmpfs", "tmpfs, first folders", {}, 0, false, 0, kFirst},
          {"xfs",
           "xfs, numbers from 2^31",
           {"mkfs.xfs", "-q", "-f", "-l", "size=64m"},
           2048 * kGigabyte,
           false,
           kBit31,
           2 * kBit31}};
}

// Makes "outer", and "inner" in it, on a new volume. xfs places new folders in one allocation group
// after the other.
void MakeInner(const Kind& kind, const Path& outer) {
  constexpr int kMostTries = 64;
  if (!kind.isSubvolume) {
    MakeFolder(outer);
  } else if (!test::RunTool({"btrfs", "subvolume", "create", outer})) {
    Fail("btrfs subvolume create");
  }
  for (int i = 0; i < kMostTries; ++i) {
    const Path folder = outer / ("try " + std::to_string(i));
    MakeFolder(folder);
    const std::uint64_t inode = InodeOf(folder);
    if (inode < kind.from || inode >= kind.to) continue;
    std::filesystem::rename(folder, outer / "inner");
    return;
  }
  Fail(std::string("an inode number for ") + kind.what);
}

// A mounted volume of some kind with a file in "outer/inner" and many folders beside those.
class KindVolume {
 public:
  KindVolume(const Kind& kind, long foldersBeside) {
    Mount(kind);
    if (!mObstacle.empty()) return;
    MakeInner(kind, mTop / "outer");
    MakeEmptyFile(File());
    for (long i = 0; i < foldersBeside; ++i) {
      MakeFolder(mTop / "outer" / ("folder " + std::to_string(i)));
    }
  }

  // Why the volume could not be made; empty when it was.
  const std::string& Obstacle() const { return mObstacle; }
  Path File() const { return mTop / "outer" / "inner" / "a track.aif"; }

 private:
  void Mount(const Kind& kind) {
    if (kind.command.empty()) {
      mTop = mFolder.MakeFolder("mounted");
      mMemory = std::make_unique<test::ScopedMount>("tmpfs", mTop, kind.type);
      if (!mMemory->IsMounted()) mObstacle = "mounting is not permitted";
      return;
    }
    try {
      mImage = std::make_unique<test::FileSystemImage>(kind.type, kind.command, kind.size);
    } catch (const std::filesystem::filesystem_error& error) {
      mObstacle = error.code().message();
      return;
    }
    mTop = mImage->Path();
    if (!mImage->IsMade()) {
      mObstacle = kind.command.front() + " fails or is not installed";
    } else if (!mImage->Mount("noatime")) {
      mObstacle = std::string("no loop device, or a kernel without ") + kind.type;
    }
  }

  test::TemporaryFolder mFolder;
  std::unique_ptr<test::ScopedMount> mMemory;
  std::unique_ptr<test::FileSystemImage> mImage;
  Path mTop;
  std::string mObstacle;
};

// Measures one volume against another, in turns.
std::vector<Figure> WarmBeside(const Settings& settings, const std::string& what, const Path& file,
                               const Path& reference) {
  const std::vector<Item> items{AskAbout(settings.service, file),
                                AskAbout(settings.service, reference)};
  std::vector<std::unique_ptr<Server>> services;
  std::vector<Contestant> contestants;
  for (const Item& item : items) {
    services.push_back(std::make_unique<Server>(
        settings.service, std::vector<std::string>{std::to_string(getpid())}));
    const Question record = QuestionOf(protocol::kRequestGetFSSpec, item);
    services.back()->Ask(record.request, record.answerSize);
    contestants.push_back({services.back().get(), WayBack(item).request, WayBack(item).answerSize});
  }
  std::vector<std::vector<double>> roundTrips(2);
  std::vector<std::vector<double>> processor(2);
  for (int run = 0; run < settings.runs; ++run) {
    const auto costs = Compete(contestants, settings.requests);
    for (std::size_t i = 0; i < costs.size(); ++i) {
      roundTrips[i].push_back(costs[i].roundTrip);
      processor[i].push_back(costs[i].processor);
    }
  }
  constexpr double kBar = 1.3;
  return {AtMost(kBar, RatioOf(what + ": round trip", roundTrips[0], roundTrips[1], "µs")),
          AtMost(kBar, RatioOf(what + ": processor time", processor[0], processor[1], "µs"))};
}

std::vector<Figure> WarmByKind(const Settings& settings) {
  const std::string what = "node id, warm";
  if (!test::EnterOwnMountNamespace()) return {Skipped(what, "mounting is not permitted")};
  const auto kinds = Kinds();
  std::vector<std::unique_ptr<KindVolume>> volumes;
  volumes.reserve(kinds.size());
  for (const Kind& kind : kinds) {
    volumes.push_back(
        std::make_unique<KindVolume>(kind, std::min(kFoldersBeside, settings.entries)));
  }
  std::this_thread::sleep_for(settings.settle);
  std::vector<Figure> figures;
  for (std::size_t i = 1; i < kinds.size(); ++i) {
    const std::string name = what + ", " + kinds[i].what + " / " + kinds[0].what;
    const std::string obstacle = volumes[0]->Obstacle() + volumes[i]->Obstacle();
    if (!obstacle.empty()) {
      figures.push_back(Skipped(name, obstacle));
      continue;
    }
    for (const Figure& figure :
         WarmBeside(settings, name, volumes[i]->File(), volumes[0]->File())) {
      figures.push_back(figure);
    }
  }
  return figures;
}

// --- Cold, privileged ---------------------------------------------------------------------------

struct PrivilegedKind {
  const char* type;
  std::vector<std::string> command;
  double bar;
};

// Sparse, with room for this many empty files.
std::vector<PrivilegedKind> PrivilegedKinds(long inodes) {
  return {{"ext4", {"mkfs.ext4", "-q", "-F", "-N", std::to_string(inodes)}, 3},
          {"btrfs", {"mkfs.btrfs", "-q", "-f", "-m", "single"}, 10},
          {"xfs", {"mkfs.xfs", "-q", "-f"}, 10}};
}

// Files in different folders that are spread over the tree.
std::vector<Path> SpreadFiles(const Tree& tree) {
  constexpr std::size_t kMost = 20;
  const std::size_t step = std::max<std::size_t>(tree.files.size() / kMost, 1);
  std::vector<Path> paths;
  // Skips the first files, which are in the top.
  for (std::size_t i = step - 1; i < tree.files.size(); i += step) {
    if (paths.empty() || tree.files[i].parent_path() != paths.back().parent_path()) {
      paths.push_back(tree.files[i]);
    }
  }
  return paths;
}

// Cold means the first question to a new service about the id of a folder other than the root.
std::vector<Figure> PrivilegedOn(const PrivilegedKind& kind, const Settings& settings) {
  const std::string what = std::string("node id, cold, privileged, ") + kind.type + " / warm";
  constexpr std::uintmax_t kBytesOfAFile = 8192;
  test::FileSystemImage image(
      kind.type, kind.command,
      kGigabyte + static_cast<std::uintmax_t>(settings.entries) * kBytesOfAFile);
  if (!image.IsMade()) return {Skipped(what, kind.command.front() + " is not installed")};
  if (!image.Mount("noatime")) return {Skipped(what, "no loop device, or no such file system")};
  const Tree tree = MakeTree(image.Path(), settings.entries);
  const Item top = AskAbout(settings.service, tree.files.front());
  const auto items = RecordsOf(settings.service, SpreadFiles(tree));

  std::vector<double> cold;
  std::vector<double> warm;
  for (int run = 0; run < settings.runs; ++run) {
    std::vector<double> coldTimes;
    std::vector<double> warmTimes;
    for (const Item& item : items) {
      Server service(settings.service, {std::to_string(getpid())});
      MedianOfWayBack(service, top);
      coldTimes.push_back(TimeOfWayBack(service, item));
      warmTimes.push_back(MedianOfWayBack(service, item));
    }
    cold.push_back(Median(coldTimes));
    warm.push_back(Median(warmTimes));
  }
  return {AtMost(kind.bar, RatioOf(what, cold, warm, "µs"))};
}

std::vector<Figure> Privileged(const Settings& settings) {
  if (!test::EnterOwnMountNamespace()) {
    return {Skipped("node id, cold, privileged", "mounting is not permitted")};
  }
  std::vector<Figure> figures;
  for (const PrivilegedKind& kind : PrivilegedKinds(settings.entries + 10'000)) {
    for (const Figure& figure : PrivilegedOn(kind, settings)) figures.push_back(figure);
  }
  return figures;
}

// --- Where numbers prove nothing ----------------------------------------------------------------

// A folder shown a second time by a file system in user space, as long as the object lives.
class UserSpaceMount {
 public:
  UserSpaceMount(const Path& source, Path place)
      : mPlace(std::move(place)), mIsMounted(test::RunTool({"bindfs", source, mPlace})) {}
  UserSpaceMount(const UserSpaceMount&) = delete;
  UserSpaceMount& operator=(const UserSpaceMount&) = delete;
  ~UserSpaceMount() {
    if (mIsMounted) umount2(mPlace.c_str(), MNT_DETACH);
  }

  bool IsMounted() const { return mIsMounted; }

 private:
  Path mPlace;
  bool mIsMounted;
};

std::vector<Figure> Untrusted(const Settings& settings) {
  constexpr long kMostEntries = 18'000;  // 1,980 of them folders
  const std::string what = "node id, bindfs";
  if (!test::EnterOwnMountNamespace()) return {Skipped(what, "mounting is not permitted")};
  const test::TemporaryFolder folder;
  const Path top = folder.MakeFolder("mounted");
  const long entries = std::min(kMostEntries, settings.entries);
  const Tree tree = MakeTree(folder.MakeFolder("source"), entries);
  const UserSpaceMount mount(folder.Path() / "source", top);
  if (!mount.IsMounted()) return {Skipped(what, "bindfs is not installed, or not permitted")};
  std::this_thread::sleep_for(settings.settle);
  const Path file = top / tree.files.back().lexically_relative(folder.Path() / "source");
  const Item item = AskAbout(settings.service, file);

  std::vector<double> cold;
  std::vector<double> warm;
  std::vector<double> walks;
  for (int run = 0; run < settings.runs; ++run) {
    Server service(settings.service, {std::to_string(getpid())});
    const Question volume = QuestionOf(protocol::kRequestGetHFSVolumeName, item);
    service.Ask(volume.request, volume.answerSize);
    cold.push_back(TimeOfWayBack(service, item) / kMicrosecondsInAMillisecond);
    warm.push_back(MedianOfWayBack(service, item) / kMicrosecondsInAMillisecond);
    const double begin = Now();
    if (WalkBare(top) != entries) Fail("a walk");
    walks.push_back((Now() - begin) / kMicrosecondsInAMillisecond);
  }
  return {RatioOf(what + ", cold / bare walk", cold, walks, "ms"),
          RatioOf(what + ", warm / bare walk", warm, walks, "ms")};
}

}  // namespace

std::vector<Measure> FileSystemMeasures() {
  return {{"kinds", WarmByKind}, {"privileged", Privileged}, {"untrusted", Untrusted}};
}

}  // namespace tallowmere::benchmark
