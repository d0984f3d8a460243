// The floor is one only as long as it does what the service cannot do without, and nothing else.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <optional>
#include <string>
#include <vector>

#include "support/EveryRequest.h"
#include "support/TracedService.h"

namespace tallowmere::test {
namespace {

// "read(0, … = 2" for each call by which a request and its response travel.
std::vector<std::string> TravelOf(const std::vector<std::string>& calls) {
  std::vector<std::string> travel;
  for (const std::string& call : calls) {
    if (IsCall(call, "read") || IsCall(call, "write")) {
      travel.push_back(call.substr(0, call.find(',')) + call.substr(call.rfind(" = ")));
    }
  }
  return travel;
}

class Floor : public testing::TestWithParam<unsigned> {};

TEST_P(Floor, ReadsAndWritesAsTheServiceDoes) {
  const EveryRequest requests;
  if (!requests.IsMade()) GTEST_SKIP() << "the folder for temporary files is too deep";
  const std::string twice = requests.Of(GetParam()) + requests.Of(GetParam()) + kQuit;
  const auto service = RunTraced("read,write,kill", twice);
  const auto floor = RunTraced("read,write,kill", twice, TALLOWMERE_FLOOR,
                               {requests.Path(), requests.VolumeName()});
  if (!service || !floor) GTEST_SKIP() << "strace cannot trace here";
  const auto travel = TravelOf(CallsOfLastRequest(*floor));
  EXPECT_THAT(travel, testing::Not(testing::IsEmpty()));
  EXPECT_EQ(travel, TravelOf(CallsOfLastRequest(*service)));
}

INSTANTIATE_TEST_SUITE_P(OfEachCode, Floor, testing::Range(1u, 11u),
                         testing::PrintToStringParamName());

}  // namespace
}  // namespace tallowmere::test
