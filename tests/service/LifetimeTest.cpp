#include <gtest/gtest.h>
#include <signal.h>
#include <sys/wait.h>

#include <algorithm>

#include "support/ChildProgram.h"
#include "support/TracedService.h"
#include "support/Wire.h"

namespace tallowmere::test {
namespace {

// The id of a process that has ended and been waited for.
std::string IDOfNoProcess() {
  const pid_t process = fork();
  if (process == 0) _exit(0);
  waitpid(process, nullptr, 0);
  return std::to_string(process);
}

TEST(Lifetime, WithoutAnArgumentTheServiceSaysSoAndReadsNothing) {
  ChildProgram service(TALLOWMERE_SERVICE, {});
  service.Write(kAnyRequest);
  EXPECT_EQ(service.ReadErrorsToEnd(), "Tallowmere missing a parameter.\n");
  EXPECT_EQ(service.ReadToEnd(), "");
  EXPECT_EQ(service.Wait(), 1);
  EXPECT_EQ(service.UnreadInput(), kAnyRequest.size());
}

TEST(Lifetime, FurtherArgumentsAreIgnored) {
  ChildProgram service(TALLOWMERE_SERVICE, {std::to_string(getpid()), "0", "x"});
  service.Write(kAnyRequest + kAnyRequest + kQuit);
  EXPECT_EQ(service.ReadToEnd(), kItsResponse + kItsResponse);
  EXPECT_EQ(service.Wait(), 0);
}

// Each of these names something that exists for kill: this process group, every process, or (as P)
// this process. The service then serves request after request.
class ArgumentThatNamesAProcess : public testing::TestWithParam<const char*> {};

TEST_P(ArgumentThatNamesAProcess, KeepsTheServiceServing) {
  std::string argument = GetParam();
  if (const auto place = argument.find('P'); place != std::string::npos) {
    argument.replace(place, 1, std::to_string(getpid()));
  }
  Service service(argument);
  for (int i = 0; i < 3; ++i) ASSERT_EQ(service.Ask(kAnyRequest, 8), kItsResponse);
  service.Write(kQuit);
  EXPECT_EQ(service.Wait(), 0);
}

INSTANTIATE_TEST_SUITE_P(Lifetime, ArgumentThatNamesAProcess,
                         testing::Values("abc", "-1", "", "0", " Px", "\t+P"));

TEST(Lifetime, ANumberEndsAtTheFirstCharacterThatIsNoDigit) {
  Service service(" " + IDOfNoProcess() + "x");
  service.Write(kAnyRequest + kAnyRequest);
  EXPECT_EQ(service.ReadToEnd(), kItsResponse);
  EXPECT_EQ(service.Wait(), 0);
}

TEST(Lifetime, WithoutALivingParentTheFirstRequestIsStillServedInFull) {
  Service service(IDOfNoProcess());
  service.Write(kAnyRequest + kAnyRequest);
  EXPECT_EQ(service.ReadToEnd(), kItsResponse);
  EXPECT_EQ(service.Wait(), 0);
  EXPECT_EQ(service.UnreadInput(), kAnyRequest.size());
}

TEST(Lifetime, EndsAfterTheRequestDuringWhichItsParentDied) {
  const pid_t parent = fork();
  if (parent == 0) {
    pause();
    _exit(0);
  }
  Service service(std::to_string(parent));
  EXPECT_EQ(service.Ask(kAnyRequest, 8), kItsResponse);
  EXPECT_EQ(service.Ask(kAnyRequest, 8), kItsResponse);
  // Once the service has taken a byte of the next request, it has looked for its parent.
  service.Write(kAnyRequest.substr(0, 1));
  while (service.UnreadInput() > 0) usleep(100);
  kill(parent, SIGKILL);
  waitpid(parent, nullptr, 0);
  service.Write(kAnyRequest.substr(1) + kAnyRequest);
  EXPECT_EQ(service.ReadToEnd(), kItsResponse);
  EXPECT_EQ(service.Wait(), 0);
}

TEST(Lifetime, AParentThatDiesWhileTheServiceWaitsEndsItThroughTheClosedPipe) {
  Service service(IDOfNoProcess());
  service.CloseInput();
  EXPECT_EQ(service.ReadToEnd(), "");
  EXPECT_EQ(service.Wait(), 0);
}

TEST(Lifetime, InputClosedBeforeAnyByteEndsTheServiceWithStatus0) {
  Service service;
  service.CloseInput();
  EXPECT_EQ(service.ReadToEnd(), "");
  EXPECT_EQ(service.Wait(), 0);
}

TEST(Lifetime, QuitAfterSeveralRequestsEndsWithStatus0AndNoResponse) {
  Service service;
  service.Write(kAnyRequest + kAnyRequest + kQuit + kAnyRequest);
  EXPECT_EQ(service.ReadToEnd(), kItsResponse + kItsResponse);
  EXPECT_EQ(service.Wait(), 0);
  EXPECT_EQ(service.UnreadInput(), kAnyRequest.size());
}

TEST(Lifetime, TheParentIsLookedForAfterEveryRequestAlsoAfterOneThatFailed) {
  const auto run = RunTraced("kill", kAnyRequest + kAnyRequest);
  if (!run) GTEST_SKIP() << "strace cannot trace here";
  const std::string look = "kill(" + std::to_string(getpid()) + ", 0)";
  EXPECT_EQ(run->responses, kItsResponse + kItsResponse);
  EXPECT_EQ(std::count_if(run->calls.begin(), run->calls.end(),
                          [&](const std::string& call) { return call.starts_with(look); }),
            3);
}

class UnknownCode : public testing::TestWithParam<unsigned> {};

TEST_P(UnknownCode, EndsTheServiceWithStatus1AndNoResponse) {
  Service service;
  service.Write(kAnyRequest + U16(GetParam()) + kAnyRequest);
  EXPECT_EQ(service.ReadToEnd(), kItsResponse);
  EXPECT_EQ(service.Wait(), 1);
  EXPECT_EQ(service.UnreadInput(), kAnyRequest.size());
}

INSTANTIATE_TEST_SUITE_P(Lifetime, UnknownCode, testing::Values(11u, 255u, 256u, 65535u));

TEST(Lifetime, AResponseThatNobodyReadsRaisesTheBrokenPipeSignal) {
  Service service;
  service.CloseOutput();
  service.Write(kAnyRequest);
  EXPECT_EQ(service.Wait(), -SIGPIPE);
}

TEST(Lifetime, AResponseThatNobodyReadsEndsTheServiceWithStatus0WhereTheSignalIsIgnored) {
  Service service(std::to_string(getpid()), ChildProgram::BrokenPipe::kIsAnError);
  service.CloseOutput();
  service.Write(kAnyRequest + kAnyRequest);
  EXPECT_EQ(service.Wait(), 0);
  EXPECT_EQ(service.UnreadInput(), kAnyRequest.size());
}

}  // namespace
}  // namespace tallowmere::test
