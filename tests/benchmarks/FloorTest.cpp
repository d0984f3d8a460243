// A floor is one only as long as it does what the service cannot do without, and nothing else.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <optional>
#include <string>
#include <tuple>
#include <vector>

#include "support/EveryRequest.h"
#include "support/TracedService.h"

namespace tallowmere::test {
namespace {

using Strings = std::vector<std::string>;

// "read(0, … = 2" for each call by which a request and its response travel.
Strings TravelOf(const Strings& calls) {
  Strings travel;
  for (const std::string& call : calls) {
    if (IsCall(call, "read") || IsCall(call, "write")) {
      travel.push_back(call.substr(0, call.find(',')) + call.substr(call.rfind(" = ")));
    }
  }
  return travel;
}

// The names of all others that succeeded, of the variants of one call the oldest name.
Strings LooksOf(const Strings& calls) {
  Strings looks;
  for (const std::string& call : calls) {
    if (IsCall(call, "read") || IsCall(call, "write") || call.find(" = -1 ") != std::string::npos) {
      continue;
    }
    const std::string name = call.substr(0, call.find('('));
    looks.push_back(name == "newfstatat" ? "lstat" : name == "ppoll" ? "poll" : name);
  }
  return looks;
}

// The calls of a floor for the second one of two requests with a code; "lean" is without the last
// argument.
std::optional<Strings> CallsOfFloor(const EveryRequest& requests, unsigned code,
                                    const std::string& floor) {
  Strings arguments{requests.Path(), requests.VolumeName()};
  if (floor != "lean") arguments.push_back(floor);
  const std::string twice = requests.Of(code) + requests.Of(code) + kQuit;
  const auto run = RunTraced("%file,%desc,kill", twice, TALLOWMERE_FLOOR, arguments);
  if (!run) return std::nullopt;
  return CallsOfLastRequest(*run);
}

class Floor : public testing::TestWithParam<std::tuple<std::string, unsigned>> {};

TEST_P(Floor, ReadsAndWritesAsTheServiceDoes) {
  const auto& [name, code] = GetParam();
  const EveryRequest requests;
  if (!requests.IsMade()) GTEST_SKIP() << "the folder for temporary files is too deep";
  const std::string twice = requests.Of(code) + requests.Of(code) + kQuit;
  const auto service = RunTraced("read,write,kill", twice);
  const auto floor = CallsOfFloor(requests, code, name);
  if (!service || !floor) GTEST_SKIP() << "strace cannot trace here";
  const auto travel = TravelOf(*floor);
  EXPECT_THAT(travel, testing::Not(testing::IsEmpty()));
  EXPECT_EQ(travel, TravelOf(CallsOfLastRequest(*service)));
}

INSTANTIATE_TEST_SUITE_P(
    OfEachCode, Floor, testing::Combine(testing::Values("lean", "sound"), testing::Range(1u, 11u)),
    [](const auto& parameters) {
      return std::get<0>(parameters.param) + "Code" + std::to_string(std::get<1>(parameters.param));
    });

struct SoundAnswer {
  unsigned code;
  Strings looks;
};

class SoundFloor : public testing::TestWithParam<SoundAnswer> {};

// As docs/performance.md has them.
TEST_P(SoundFloor, MakesTheCallsOfASoundAnswer) {
  const EveryRequest requests;
  if (!requests.IsMade()) GTEST_SKIP() << "the folder for temporary files is too deep";
  const auto calls = CallsOfFloor(requests, GetParam().code, "sound");
  if (!calls) GTEST_SKIP() << "strace cannot trace here";
  EXPECT_EQ(LooksOf(*calls), GetParam().looks);
}

const Strings kPathBehindHeldFolder{"openat2", "statx", "poll", "statx", "statx", "close"};
INSTANTIATE_TEST_SUITE_P(
    OfEachCode, SoundFloor,
    testing::Values(
        SoundAnswer{1, {"lstat", "lstat", "openat2", "statx", "poll", "statx", "close"}},
        SoundAnswer{2, kPathBehindHeldFolder}, SoundAnswer{3, {"poll"}}, SoundAnswer{4, {"poll"}},
        SoundAnswer{5, {"lstat", "openat2", "statx", "poll", "statx", "close"}},
        SoundAnswer{6, {"lstat", "openat2", "statx", "poll", "statx", "statx", "close"}},
        SoundAnswer{7, {"openat2", "statx", "poll", "statx", "close"}},
        SoundAnswer{8, kPathBehindHeldFolder}, SoundAnswer{9, kPathBehindHeldFolder},
        SoundAnswer{10, {}}),
    [](const auto& answer) { return "Code" + std::to_string(answer.param.code); });

}  // namespace
}  // namespace tallowmere::test
