// How many system calls each request takes after an earlier request about the same item.
#include <gtest/gtest.h>

#include <array>
#include <filesystem>
#include <optional>
#include <ostream>
#include <string>
#include <vector>

#include "faults/TwoVolumeRoot.h"
#include "support/EveryRequest.h"
#include "support/MountNamespace.h"
#include "support/TracedService.h"

namespace tallowmere::test {
namespace {

struct Calls {
  unsigned code;
  int reads;        // one for each part of a field
  int writes;       // one for each part of a field and one for the trailer
  int mostOfFiles;  // all others but kill, for a new item, which takes an extra handle
};

std::ostream& operator<<(std::ostream& out, const Calls& calls) {
  return out << "code " << calls.code;
}

// Runs in a root folder on a volume of its own where permitted: on a file system that is mounted at
// several places, each answer takes more calls.
class SystemCalls : public testing::TestWithParam<Calls> {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) return;
    const std::filesystem::path temporary = std::filesystem::temp_directory_path();
    mRoot.emplace(std::vector<std::string>{TALLOWMERE_SERVICE, "/usr/bin/strace"});
    if (mRoot->IsEntered()) std::filesystem::create_directories(temporary);
  }

 private:
  std::optional<TwoVolumeRoot> mRoot;
};

TEST_P(SystemCalls, AreAtMostThese) {
  const auto [code, reads, writes, mostOfFiles] = GetParam();
  const EveryRequest requests;
  if (!requests.IsMade()) GTEST_SKIP() << "the path of the temporary folder is too long";
  const std::string request = requests.Of(code);
  const auto run = RunTraced("%file,%desc,kill", requests.Of(7) + request + request + kQuit);
  if (!run) GTEST_SKIP() << "strace cannot trace here";
  ASSERT_EQ(run->status, 0);

  int read = 0;
  int written = 0;
  int ofFiles = 0;
  for (const std::string& call : CallsOfLastRequest(*run)) {
    if (IsCall(call, "mmap")) continue;  // memory only
    ++(IsCall(call, "read") ? read : IsCall(call, "write") ? written : ofFiles);
  }
  EXPECT_EQ(read, reads);
  EXPECT_EQ(written, writes);
  EXPECT_LE(ofFiles, mostOfFiles);
}

INSTANTIATE_TEST_SUITE_P(OfEachCode, SystemCalls,
                         testing::ValuesIn(std::to_array<Calls>({{1, 5, 3, 38},
                                                                 {2, 6, 4, 15},
                                                                 {3, 3, 2, 1},
                                                                 {4, 2, 4, 1},
                                                                 {5, 4, 4, 9},
                                                                 {6, 6, 4, 23},
                                                                 {7, 3, 3, 8},
                                                                 {8, 6, 4, 15},
                                                                 {9, 4, 4, 10},
                                                                 {10, 5, 4, 0}})),
                         [](const auto& calls) {
                           return "Code" + std::to_string(calls.param.code);
                         });

}  // namespace
}  // namespace tallowmere::test
