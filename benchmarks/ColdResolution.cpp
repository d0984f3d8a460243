// How long the first resolution of a node id takes without privilege, against a bare walk of the
// same volume with getdents64 that looks at nothing but folders.
//
// cold_resolution VOLUME ENTRIES ROUNDS: makes a tree of about ENTRIES items in the folder "tree"
// of VOLUME, a mount point, unless it is there already. Each measurement is a process of its own,
// the two kinds in turn.
#include <dirent.h>
#include <fcntl.h>
#include <grp.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <string>
#include <vector>

#include "files/Catalog.h"
#include "files/NodeID.h"

namespace {

using namespace tallowmere::files;

constexpr int kFilesInAFolder = 9;
constexpr int kFoldersInAFolder = 8;
constexpr uid_t kNobody = 65534;

[[noreturn]] void Fail(const char* what) {
  std::perror(what);
  std::exit(1);
}

// Breadth first: every folder has as many files, and folders until there are enough.
void MakeTree(const std::string& top, long entries) {
  if (mkdir(top.c_str(), 0755) != 0) return;
  std::vector<std::string> folders{top};
  for (std::size_t next = 0; next < folders.size(); ++next) {
    const std::string folder = folders[next] + "/";
    for (int i = 0; i < kFilesInAFolder; ++i) {
      const std::string path = folder + "a file " + std::to_string(i) + ".txt";
      const int file = open(path.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0644);
      if (file < 0) Fail(path.c_str());
      close(file);
    }
    const long wanted = entries / (kFilesInAFolder + 1);
    for (int i = 0; i < kFoldersInAFolder && static_cast<long>(folders.size()) < wanted; ++i) {
      folders.push_back(folder + "folder " + std::to_string(i));
      if (mkdir(folders.back().c_str(), 0755) != 0) Fail(folders.back().c_str());
    }
  }
}

struct Entry {  // struct linux_dirent64 of getdents(2)
  std::uint64_t inode;
  std::int64_t offset;
  std::uint16_t size;
  std::uint8_t type;
  char name[1];
};

// The floor: one open, one read to the end and one close for every folder.
long WalkBare(int parent, const char* name) {
  const int folder = openat(parent, name, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
  if (folder < 0) return 0;
  long seen = 0;
  std::vector<std::string> folders;
  alignas(Entry) std::array<char, 32768> buffer;
  for (ssize_t got; (got = getdents64(folder, buffer.data(), buffer.size())) > 0;) {
    for (ssize_t at = 0; at < got;) {
      const auto* const entry = reinterpret_cast<const Entry*>(buffer.data() + at);
      const char* const entryName = buffer.data() + at + offsetof(Entry, name);
      at += entry->size;
      ++seen;
      if (entry->type != DT_DIR || !std::strcmp(entryName, ".") || !std::strcmp(entryName, "..")) {
        continue;
      }
      folders.emplace_back(entryName);
    }
  }
  for (const std::string& child : folders) seen += WalkBare(folder, child.c_str());
  close(folder);
  return seen;
}

using Clock = std::chrono::steady_clock;

double Milliseconds(const std::function<void()>& work) {
  const auto begin = Clock::now();
  work();
  return std::chrono::duration<double, std::milli>(Clock::now() - begin).count();
}

// What `measure` gives in a new process without privilege.
template <std::size_t kCount>
std::array<double, kCount> InAProcess(const std::function<std::array<double, kCount>()>& measure) {
  std::array<int, 2> ends{};
  if (pipe(ends.data()) != 0) Fail("pipe");
  const pid_t child = fork();
  if (child == 0) {
    if (geteuid() == 0 &&
        (setgroups(0, nullptr) != 0 || setresuid(kNobody, kNobody, kNobody) != 0)) {
      Fail("setresuid");
    }
    const auto values = measure();
    _exit(write(ends[1], values.data(), sizeof values) == sizeof values ? 0 : 1);
  }
  std::array<double, kCount> values{};
  if (read(ends[0], values.data(), sizeof values) != sizeof values) Fail("measurement");
  waitpid(child, nullptr, 0);
  close(ends[0]);
  close(ends[1]);
  return values;
}

// The middle one.
double Median(std::vector<double> values) {
  std::sort(values.begin(), values.end());
  return values[values.size() / 2];
}

}  // namespace

int main(int count, char** arguments) {
  if (count != 4) {
    std::fprintf(stderr, "usage: %s VOLUME ENTRIES ROUNDS\n", arguments[0]);
    return 2;
  }
  const std::string volumePath = arguments[1];
  MakeTree(volumePath + "/tree", std::atol(arguments[2]));
  const int rounds = std::atoi(arguments[3]);

  // The id of a folder that is gone makes the pass go over everything.
  const std::string gonePath = volumePath + "/gone";
  if (mkdir(gonePath.c_str(), 0755) != 0) Fail(gonePath.c_str());
  const auto gone = ReadItem(AT_FDCWD, gonePath.c_str());
  if (rmdir(gonePath.c_str()) != 0) Fail(gonePath.c_str());
  const std::string nearPath = volumePath + "/tree/folder 3/folder 3/folder 3";
  const auto near = ReadItem(AT_FDCWD, nearPath.c_str());
  const std::string siblingPath = volumePath + "/tree/folder 3/folder 3/folder 4";
  const auto sibling = ReadItem(AT_FDCWD, siblingPath.c_str());
  if (!near || !sibling) Fail("the tree is too small");

  std::vector<double> bare;
  std::vector<double> cold;
  std::vector<double> second;
  std::vector<double> missing;
  std::vector<double> early;
  double entries = 0;
  for (int round = 0; round < rounds; ++round) {
    const auto walked = InAProcess<2>([&] {
      long seen = 0;
      const double time = Milliseconds([&] { seen = WalkBare(AT_FDCWD, volumePath.c_str()); });
      return std::array{time, static_cast<double>(seen)};
    });
    bare.push_back(walked[0]);
    entries = walked[1];
    const auto passed = InAProcess<3>([&] {
      const VolumePointer volume = MountTable::OfThisProcess().OfItem(*near, nearPath);
      const std::uint32_t goneID = NodeIDOf(*gone, *volume->Root());
      const std::uint32_t nearID = NodeIDOf(*near, *volume->Root());
      const double whole = Milliseconds([&] {
        if (FindItem(volume, goneID, true)) Fail("found what is gone");
      });
      const double known = Milliseconds([&] {
        if (!FindItem(volume, nearID, true)) Fail("not found");
      });
      const double again = Milliseconds([&] {
        if (FindItem(volume, goneID, true)) Fail("found what is gone");
      });
      return std::array{whole, known, again};
    });
    cold.push_back(passed[0]);
    second.push_back(passed[1]);
    missing.push_back(passed[2]);
    early.push_back(InAProcess<1>([&] {
      const VolumePointer volume = MountTable::OfThisProcess().OfItem(*near, nearPath);
      const std::uint32_t nearID = NodeIDOf(*near, *volume->Root());
      RememberPlace({siblingPath, *sibling});
      return std::array{Milliseconds([&] {
        if (!FindItem(volume, nearID, true)) Fail("not found");
      })};
    })[0]);
    std::printf("round %d: walk %.1f ms, cold %.1f ms\n", round + 1, bare.back(), cold.back());
  }
  std::printf("%.0f entries; medians of %d rounds, milliseconds\n", entries, rounds);
  std::printf("bare getdents64 walk        %10.3f\n", Median(bare));
  std::printf("cold, over everything       %10.3f\n", Median(cold));
  std::printf("ratio                       %10.3f\n", Median(cold) / Median(bare));
  std::printf("second, known folder        %10.3f\n", Median(second));
  std::printf("second, folder that is gone %10.3f\n", Median(missing));
  std::printf("cold, beside a known folder %10.3f\n", Median(early));
}
