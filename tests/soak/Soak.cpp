// tallowmere_soak: sends one service millions of requests of every kind about a tree that changes
// all the time, and compares each answer with the states of the tree between request and answer.
// docs/reliability.md explains the verdicts.

#include <dirent.h>
#include <fcntl.h>
#include <sys/mount.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <optional>
#include <random>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "Churner.h"
#include "Judge.h"
#include "MainVolume.h"
#include "Requests.h"
#include "support/AtomReader.h"
#include "support/ChildProgram.h"
#include "support/EveryRequest.h"
#include "support/MountNamespace.h"
#include "support/SmallRoot.h"
#include "support/Wire.h"

namespace tallowmere::soak {
namespace {

using namespace tallowmere::test;
using Clock = std::chrono::steady_clock;

// The exit status that means "skipped" to ctest.
constexpr int kSkipped = 77;
// The usual exit status for invalid arguments.
constexpr int kMisused = 2;

using tallowmere::test::kRateOfACD;
constexpr unsigned kExport = 10;
constexpr unsigned kCodes = 11;
constexpr std::size_t kMostReports = 20;
constexpr int kProgressLines = 20;
// A request is about the latest state or one shortly before it.
constexpr std::size_t kStatesAskedAbout = 40;
// An answer that spans more states is not judged.
constexpr History::Version kMostStates = 1024;
static_assert(kMostStates < History::kKept);

struct Options {
  std::uint64_t requests = 1'000'000;
  std::uint64_t seed = std::random_device{}();
  std::string service = TALLOWMERE_SERVICE;
  std::string on = "tmpfs";
  unsigned pause = 300;  // microseconds between changes, on average
  unsigned group = 24;   // the most requests written ahead
  long slack = 1024;     // KiB that memory use may grow after the first tenth
};

// --- The service ------------------------------------------------------------------------------

class Asked : public ChildProgram {
 public:
  explicit Asked(const std::string& service) : ChildProgram(service, {std::to_string(getpid())}) {}

  // Reads the response to the request. Calls `onRead` whenever bytes have arrived.
  template <class OnRead>
  std::string Response(const Request& request, OnRead onRead) {
    std::optional<std::size_t> size;
    while (!(size = SizeOfResponse(request)) || mRead.size() - mUsed < *size) {
      mRead.erase(0, std::exchange(mUsed, 0));
      const std::string more = ReadSome();
      if (more.empty()) throw std::runtime_error("the service does not answer");
      mRead += more;
      onRead();
    }
    std::string response = mRead.substr(mUsed, *size);
    mUsed += *size;
    if (!response.ends_with(kTrailer)) throw std::runtime_error("a response without its trailer");
    return response;
  }

  long KiBInUse() const {
    std::ifstream file("/proc/" + std::to_string(Process()) + "/statm");
    long size = 0;
    long resident = 0;
    file >> size >> resident;
    return resident * (sysconf(_SC_PAGESIZE) / 1024);
  }

  int OpenDescriptors() const {
    int count = -2;  // "." and ".."
    DIR* const folder = opendir(("/proc/" + std::to_string(Process()) + "/fd").c_str());
    while (folder != nullptr && readdir(folder) != nullptr) ++count;
    if (folder != nullptr) closedir(folder);
    return count;
  }

 private:
  // Returns nullopt until enough bytes have arrived.
  std::optional<std::size_t> SizeOfResponse(const Request& request) const {
    constexpr std::size_t kRecord = 1 + 70;
    constexpr std::size_t kSettingsSize = 2;
    switch (request.code) {
      case 1:
        return sizeof(std::uint16_t) + request.room + kTrailer.size();
      case 3:
        return 2 + kTrailer.size();
      case 7:
        return kRecord + kTrailer.size();
      case kExport:
        return SizeWithCount<std::uint32_t>(kSettingsSize);
      case 2:
        return SizeWithCount<std::uint16_t>(2);
      default:
        return SizeWithCount<std::uint16_t>(1);
    }
  }

  template <class Count>
  std::optional<std::size_t> SizeWithCount(std::size_t offset) const {
    if (mRead.size() - mUsed < offset + sizeof(Count)) return std::nullopt;
    Count count = 0;
    std::memcpy(&count, mRead.data() + mUsed + offset, sizeof count);
    return offset + sizeof count + count + kTrailer.size();
  }

  std::string mRead;
  std::size_t mUsed = 0;
};

// --- Questions --------------------------------------------------------------------------------

class Asker {
 public:
  explicit Asker(std::uint64_t seed) : mRandom(seed) {}

  std::size_t Below(std::size_t end) { return mRandom() % end; }

  // Returns a request about the tree's current or recent state.
  Request AnyRequest(const State& state) {
    static constexpr std::array<unsigned, 24> kCodesByWeight{1, 1, 2, 2, 2, 3, 4, 5, 5, 5, 6, 6,
                                                             7, 7, 7, 7, 7, 8, 8, 8, 9, 9, 9, 9};
    // In this tree, only buffers of 17 to 19 bytes cause shortening.
    static constexpr std::array<std::uint16_t, 8> kRooms{
        0, kLeastRoom, kLeastRoom + 1, kLeastRoom + 2, kLeastRoom + 3, 768, kMostRoom, kMostRoom};
    Request request{};
    request.code = Below(2000) == 0 ? kExport : kCodesByWeight[Below(kCodesByWeight.size())];
    request.room = kRooms[Below(kRooms.size())];
    request.flag = Below(2) == 0;
    switch (request.code) {
      case 4:
        request.volume = Below(4) == 0 ? state.main.number : state.other.number;
        break;
      case 6:
        request.path = AnyFolderPath();
        request.hfsName = AnyHFSName(state, request.code);
        break;
      case 8:
      case 9:
        FillRecord(state, request);
        break;
      default:
        request.path = AnyPath();
        request.byOther =
            request.code == 2 && request.path.count > 1 && request.path.names[0] == kVolumePlace;
    }
    return request;
  }

 private:
  NameIndex AnyOuterName() { return static_cast<NameIndex>(Below(kEndOfSlots)); }
  NameIndex AnyInnerName() {
    return static_cast<NameIndex>(kSubfolder + Below(kEndOfFiles - kSubfolder));
  }
  NameIndex AnyFileName() {
    return static_cast<NameIndex>(kFirstFile + Below(kEndOfFiles - kFirstFile));
  }

  Path AnyFolderPath() {
    Path path;
    path.names[path.count++] = AnyOuterName();
    if (Below(4) == 0) path.names[path.count++] = Below(3) == 0 ? kInnerLink : kSubfolder;
    return path;
  }

  Path AnyPath() {
    Path path = AnyFolderPath();
    const std::size_t kind = Below(10);
    if (kind == 0) path = {{AnyFileName()}, 1};
    if (kind > 1) {
      const NameIndex name = path.count == 1 ? AnyInnerName() : AnyFileName();
      path.names[path.count++] = name;
    }
    return path;
  }

  std::string AnyHFSName(const State& state, unsigned code) {
    const NameIndex name = AnyInnerName();
    std::string whole = NameAt(name).hfsName;
    const bool isWhole = code != 9 && Below(2) == 0;
    if (isWhole || whole.size() <= kLongestRecordName) return whole;
    // The short form of an existing item.
    const std::size_t start = Below(state.count);
    for (std::size_t i = 0; i < state.count; ++i) {
      const Entry& entry = state.entries[(start + i) % state.count];
      if (entry.name == name && entry.inode != 0) return RecordName(entry);
    }
    return NameAt(kFirstFile).hfsName;
  }

  void FillRecord(const State& state, Request& request) {
    request.search = request.code == 9 && Below(8) == 0;
    const std::size_t kind = Below(16);
    const bool isOther = kind == 0 || kind == 1;
    request.volume = isOther ? state.other.number : state.main.number;
    if (kind == 0) {
      request.folder = 1;
      request.hfsName = NameAt(kVolumePlace).hfsName;
      return;
    }
    if (kind <= 3) {
      request.folder = 2;
      request.hfsName = isOther || Below(4) == 0 ? AnyHFSName(state, request.code)
                                                 : NameAt(AnyOuterName()).hfsName;
      return;
    }
    const std::size_t start = Below(state.count);
    for (std::size_t i = 0; i < state.count; ++i) {
      const Entry& entry = state.entries[(start + i) % state.count];
      if (entry.kind != Kind::kFolder || entry.inode == 0) continue;
      request.folder = static_cast<std::uint32_t>(entry.inode);
      if (entry.folder == state.other.root) request.volume = state.other.number;
    }
    if (request.folder == 0) request.folder = 2;
    request.hfsName = AnyHFSName(state, request.code);
    // Usually an existing name.
    for (std::size_t i = 0; Below(3) != 0 && i < state.count; ++i) {
      const Entry& entry = state.entries[(start + i) % state.count];
      if (entry.inode == request.folder && entry.kind == Kind::kFolder) {
        for (const Entry& inner : state) {
          if (inner.folder == entry.node && inner.inode != 0 && Below(3) == 0) {
            request.hfsName = RecordName(inner);
          }
        }
      }
    }
  }

  std::mt19937_64 mRandom;
};

// --- The run ----------------------------------------------------------------------------------

struct Counts {
  std::array<std::array<std::uint64_t, kVerdicts>, kCodes> ofVerdict{};
  std::uint64_t asked = 0;
  std::uint64_t wrong = 0;
  std::uint64_t states = 0;  // total number of states used by the judge
};

class Run {
 public:
  Run(const Options& options, const std::string& folder, Numbers numbers)
      : mOptions(options),
        mChurner(folder, options.seed, options.pause),
        mService(options.service),
        mPlace{folder, NameOfMainVolume(folder)},
        mJudge(mChurner.Changes(), mPlace, numbers),
        mAsker(options.seed + 1) {}

  bool Everything() {
    mChurner.Start();
    mStart = Clock::now();
    bool isLevel = true;
    const std::uint64_t step = mOptions.requests / kProgressLines + 1;
    std::uint64_t next = step;
    while (mCounts.asked < mOptions.requests) {
      AskGroup();
      if (mCounts.asked < next && mCounts.asked < mOptions.requests) continue;
      next += step;
      isLevel &= WatchLevel();
    }
    mChurner.Stop();
    Summarise();
    mService.Write(kQuit);
    const int status = mService.Wait();
    if (status != 0) std::printf("the service ended with status %d\n", status);
    return isLevel && mCounts.wrong == 0 && status == 0;
  }

 private:
  std::string NameOfMainVolume(const std::string& folder) {
    // The last component of the mount point.
    return folder.substr(folder.rfind('/') + 1);
  }

  void AskGroup() {
    const History& history = mChurner.Changes();
    const auto first = history.Reached();
    const auto shown = first - std::min<History::Version>(first, mAsker.Below(kStatesAskedAbout));
    std::vector<Request> requests;
    std::string bytes;
    const std::size_t size = 1 + mAsker.Below(mOptions.group);
    for (std::size_t i = 0; i < size; ++i) {
      requests.push_back(mAsker.AnyRequest(history.At(shown)));
      bytes += BytesOf(requests.back(), mPlace);
    }
    mService.Write(bytes);
    struct Answered {
      std::string response;
      History::Version last;
    };
    std::vector<Answered> answers;
    History::Version last = history.Begun();
    for (const Request& request : requests) {
      std::string response = mService.Response(request, [&] { last = history.Begun(); });
      answers.push_back({std::move(response), last});
    }
    while (history.Reached() < last) std::this_thread::yield();
    // A busy machine can take so many states that working out the answers in steps is too
    // expensive. Other requests are judged instead.
    if (history.Begun() - first > kMostStates) return;
    for (std::size_t i = 0; i < size; ++i) {
      JudgeOne(requests[i], answers[i].response, first, answers[i].last);
    }
  }

  Verdict VerdictOn(const Request& request, const std::string& response, History::Version first,
                    History::Version last) {
    if (request.code != kExport) return mJudge.Of(request, response, first, last);
    const auto settings = ReadAtomContainer(
        std::string_view(response).substr(6, response.size() - 6 - kTrailer.size()));
    const bool isIt =
        response.starts_with(I16(0)) && settings == SettingsOf("twos", kRateOfACD, 16, 2);
    return isIt ? Verdict::kExact : Verdict::kWrong;
  }

  void JudgeOne(const Request& request, const std::string& response, History::Version first,
                History::Version last) {
    const Verdict verdict = VerdictOn(request, response, first, last);
    std::string report;
    if (verdict == Verdict::kWrong) report = mJudge.Report(request, response, first, last);
    // The tree kept changing. A verdict based on overwritten states does not count.
    if (!mChurner.Changes().Keeps(first)) return;
    ++mCounts.asked;
    mCounts.states += last - first + 1;
    ++mCounts.ofVerdict[request.code][static_cast<std::size_t>(verdict)];
    if (verdict != Verdict::kWrong) return;
    if (++mCounts.wrong <= kMostReports) {
      std::printf("WRONG after %llu requests\n%s\n", static_cast<unsigned long long>(mCounts.asked),
                  report.c_str());
      std::fflush(stdout);
    }
  }

  // Between two groups, the service must hold nothing open for a request.
  bool WatchLevel() {
    const long memory = mService.KiBInUse();
    const int descriptors = mService.OpenDescriptors();
    const double seconds = std::chrono::duration<double>(Clock::now() - mStart).count();
    std::printf("%12llu requests %9llu changes %8.1f s %8ld KiB %3d descriptors %6llu wrong\n",
                static_cast<unsigned long long>(mCounts.asked),
                static_cast<unsigned long long>(mChurner.Changes().Reached()), seconds, memory,
                descriptors, static_cast<unsigned long long>(mCounts.wrong));
    std::fflush(stdout);
    if (mCounts.asked < mOptions.requests / 10) return true;
    if (!mMemory) {
      mMemory = memory;
      mDescriptors = descriptors;
      mExports = Exports();
    }
    // As documented, the service keeps less than half a KiB for each export.
    const long allowed = *mMemory + mOptions.slack + static_cast<long>(Exports() - mExports) / 2;
    if (memory > allowed)
      std::printf("memory use grew to %ld KiB; %ld KiB are allowed\n", memory, allowed);
    if (descriptors != mDescriptors) std::printf("the number of open descriptors changed\n");
    return memory <= allowed && descriptors == mDescriptors;
  }

  std::uint64_t Exports() const { return mCounts.ofVerdict[kExport][0]; }

  void Summarise() {
    std::printf("\ncode       exact       moved  honest error     nowhere       wrong\n");
    for (unsigned code = 1; code < kCodes; ++code) {
      const auto& of = mCounts.ofVerdict[code];
      std::printf("%4u%12llu%12llu%14llu%12llu%12llu\n", code,
                  static_cast<unsigned long long>(of[0]), static_cast<unsigned long long>(of[1]),
                  static_cast<unsigned long long>(of[2]), static_cast<unsigned long long>(of[3]),
                  static_cast<unsigned long long>(of[4]));
    }
    std::printf("\n%.1f states per request on average\n",
                static_cast<double>(mCounts.states) / static_cast<double>(mCounts.asked));
    for (std::size_t kind = 0; kind < Churner::Kinds().size(); ++kind) {
      std::printf("%12llu × %s\n",
                  static_cast<unsigned long long>(mChurner.CountOfEachKind()[kind]),
                  Churner::Kinds()[kind]);
    }
  }

  Options mOptions;
  Churner mChurner;
  Asked mService;
  Place mPlace;
  Judge mJudge;
  Asker mAsker;
  Counts mCounts;
  Clock::time_point mStart;
  std::optional<long> mMemory;
  int mDescriptors = 0;
  std::uint64_t mExports = 0;
};

constexpr const char* kFolder = "/soaked";

// Mounts the main volume at kFolder, in a small root folder of its own.
class Stage {
 public:
  Stage(MainVolume& volume, const std::string& service)
      : mIsSet(EnterOwnMountNamespace() && IsSet(volume, service)) {}
  Stage(const Stage&) = delete;
  Stage& operator=(const Stage&) = delete;
  // The server ends when its file system is no longer mounted anywhere.
  ~Stage() { umount2(kFolder, MNT_DETACH); }

  bool IsSet() const { return mIsSet; }

 private:
  // Mounts the volume in the old root folder and moves the mount into the new one.
  static bool IsSet(MainVolume& volume, const std::string& service) {
    const auto place = volume.Mount();
    if (!place) return false;
    const int tree = static_cast<int>(
        syscall(SYS_open_tree, AT_FDCWD, place->c_str(), OPEN_TREE_CLONE | OPEN_TREE_CLOEXEC));
    if (tree < 0 || !EnterSmallRoot({service})) return false;
    std::filesystem::create_directory(kFolder);
    const bool isMoved =
        syscall(SYS_move_mount, tree, "", AT_FDCWD, kFolder, MOVE_MOUNT_F_EMPTY_PATH) == 0;
    close(tree);
    return isMoved;
  }

  bool mIsSet;
};

int RunOn(MainVolume& volume, const Options& options) {
  const Stage stage(volume, options.service);
  if (!stage.IsSet()) {
    std::printf("%s cannot be mounted here\n", options.on.c_str());
    return kSkipped;
  }
  std::printf("seed %llu, on %s\n", static_cast<unsigned long long>(options.seed),
              options.on.c_str());
  std::fflush(stdout);
  return Run(options, kFolder, volume.InodeNumbers()).Everything() ? 0 : 1;
}

int Main(Options options) {
  options.service = std::filesystem::absolute(options.service);
  MainVolume volume(options.on);
  // The child enters the small root folder. This process keeps the machine's root folder, so it can
  // remove the volume's files at the end.
  const pid_t child = fork();
  if (child == 0) {
    int status = 1;
    try {
      status = RunOn(volume, options);
    } catch (const std::exception& error) {
      std::printf("tallowmere_soak: %s\n", error.what());
    }
    std::fflush(stdout);
    _exit(status);
  }
  int status = 0;
  waitpid(child, &status, 0);
  return WIFEXITED(status) ? WEXITSTATUS(status) : 1;
}

std::optional<Options> ReadOptions(int count, char** words) {
  Options options;
  for (int i = 1; i < count; i += 2) {
    const std::string name = words[i];
    if (i + 1 == count) return std::nullopt;
    const std::string value = words[i + 1];
    if (name == "--requests") {
      options.requests = std::stoull(value);
    } else if (name == "--seed") {
      options.seed = std::stoull(value);
    } else if (name == "--service") {
      options.service = value;
    } else if (name == "--on") {
      if (!MainVolume::IsKind(value)) return std::nullopt;
      options.on = value;
    } else if (name == "--pause") {
      options.pause = static_cast<unsigned>(std::stoul(value));
    } else if (name == "--group") {
      options.group = static_cast<unsigned>(std::stoul(value));
    } else if (name == "--slack") {
      options.slack = std::stol(value);
    } else {
      return std::nullopt;
    }
  }
  return options;
}

}  // namespace
}  // namespace tallowmere::soak

int main(int count, char** words) {
  try {
    const auto options = tallowmere::soak::ReadOptions(count, words);
    if (options) return tallowmere::soak::Main(*options);
    std::fprintf(stderr,
                 "usage: tallowmere_soak [--requests N] [--seed N] [--service PROGRAM]\n"
                 "                       [--on FILESYSTEM] [--pause MICROSECONDS] [--group N]\n"
                 "                       [--slack KIB]\nfile systems:");
    for (const std::string& kind : tallowmere::soak::MainVolume::Kinds()) {
      std::fprintf(stderr, " %s", kind.c_str());
    }
    std::fprintf(stderr, "\n");
    return tallowmere::soak::kMisused;
  } catch (const std::exception& error) {
    std::fprintf(stderr, "tallowmere_soak: %s\n", error.what());
  }
  return 1;
}
