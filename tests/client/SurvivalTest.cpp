// What a client does about a service that fails it.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/prctl.h>

#include <array>
#include <ctime>
#include <thread>

#include "client/ClientSupport.h"

namespace tallowmere {
namespace {

using std::chrono::milliseconds;
using std::chrono::steady_clock;
using test::Impostor;
using test::ImpostorOnce;
using test::kEnded;
using test::kMalformed;
using test::kNotInTime;
using test::MessageOf;
using test::TemporaryFolder;
using testing::EndsWith;

constexpr const char* kTakeRequest = "head -c 4 >/dev/null\n";

std::string FailureOfFirstRequest(const std::string& service) {
  Client client({.service = service, .deadline = milliseconds(1000)});
  return MessageOf(client.GetHFSVolumeName(0));
}

// The message of a service that takes the request, prints this (by printf(1)) and goes on reading.
std::string FailureOfAnswer(const std::string& answer) {
  const TemporaryFolder folder;
  return FailureOfFirstRequest(
      Impostor(folder, kTakeRequest + ("printf '" + answer + "'; exec cat >/dev/null")));
}

TEST(Client, AMissingProgramIsSaid) {
  EXPECT_EQ(FailureOfFirstRequest("/nonexistent/tallowmere"),
            "the service /nonexistent/tallowmere could not be started: No such file or directory");
}

TEST(Client, AProgramThatMayNotBeRunIsSaid) {
  const TemporaryFolder folder;
  EXPECT_THAT(FailureOfFirstRequest(folder.MakeFile("service").string()),
              EndsWith("/service could not be started: Permission denied"));
}

TEST(Client, AProgramThatExitsAtOnceIsSaid) {
  EXPECT_EQ(FailureOfFirstRequest("/bin/true"), kEnded);
}

TEST(Client, AProgramThatAppearsLaterIsStartedForTheNextRequest) {
  const TemporaryFolder folder;
  const std::string path = folder.Path() / "service";
  Client client({.service = path});
  EXPECT_FALSE(client.GetHFSVolumeName(0));
  folder.MakeLink("service", TALLOWMERE_SERVICE);
  EXPECT_TRUE(client.GetHFSVolumeName(0));
}

TEST(Client, ATruncatedAnswerIsSaid) {
  const TemporaryFolder folder;
  EXPECT_EQ(
      FailureOfFirstRequest(Impostor(folder, std::string(kTakeRequest) + "printf '\\001\\005'")),
      kEnded);
}

TEST(Client, AnAnswerWithoutItsTrailerIsSaid) {
  const TemporaryFolder folder;
  EXPECT_EQ(FailureOfFirstRequest(
                Impostor(folder, std::string(kTakeRequest) + "printf '\\000\\001\\000\\000MWL'")),
            kEnded);
}

TEST(Client, AnAnswerWithAnotherTrailerIsSaid) {
  EXPECT_EQ(FailureOfAnswer("\\000\\001\\000\\000mwlt"),
            "the service's answer does not end as the protocol says");
}

TEST(Client, AnAnswerThatIsNotTheProtocolsIsSaidAtOnce) {
  const auto start = steady_clock::now();
  EXPECT_EQ(FailureOfAnswer("\\002"), kMalformed);
  EXPECT_LT(steady_clock::now() - start, milliseconds(900));
}

TEST(Client, AnAnswerInPiecesIsRead) {
  EXPECT_EQ(FailureOfAnswer("\\001\\003'; sleep 0.1; printf '\\000a'; sleep 0.1; printf 'b'\n"
                            "sleep 0.1; printf '\\000MW'; sleep 0.1; printf 'LT"),
            "");
}

TEST(Client, AServiceThatAnswersTwiceIsSaidByTheNextRequest) {
  const TemporaryFolder folder;
  const std::string answer = "\\000\\001\\000\\000MWLT";
  Client client({.service = ImpostorOnce(
                     folder, kTakeRequest + ("printf '" + answer + answer + "'; cat >/dev/null"))});
  EXPECT_TRUE(client.GetHFSVolumeName(32767));
  EXPECT_EQ(MessageOf(client.GetFSSpec("/")), "the service answered what it had not been asked");
  EXPECT_TRUE(client.GetFSSpec("/"));
}

TEST(Client, AServiceThatAnswersOnceMoreLaterIsSaidByTheNextRequest) {
  const TemporaryFolder folder;
  const std::string answer = "printf '\\000\\001\\000\\000MWLT'";
  Client client({.service = ImpostorOnce(folder, kTakeRequest + answer + "; sleep 0.1; " + answer +
                                                     "; touch answered; exec cat >/dev/null")});
  EXPECT_TRUE(client.GetHFSVolumeName(32767));
  while (!exists(folder.Path() / "answered")) std::this_thread::sleep_for(milliseconds(10));
  EXPECT_EQ(MessageOf(client.GetHFSVolumeName(0)),
            "the service answered what it had not been asked");
  EXPECT_TRUE(client.GetHFSVolumeName(0));
}

TEST(Client, AnAnswerToARequestThatIsNotYetWholeIsSaid) {
  const TemporaryFolder folder;
  const std::string service =
      Impostor(folder, "sleep 0.2; printf '\\001\\002\\000x\\000MWLT'; exec sleep 60");
  Client client({.service = service});
  // More than a pipe holds.
  EXPECT_EQ(MessageOf(client.GetHFSName(std::string(65534, 'x'))),
            "the service answered what it had not been asked");
}

TEST(Client, AServiceKilledBetweenRequestsIsSaidAndStartedAgain) {
  const test::MortalService service;
  Client client({.service = service.Path()});
  ASSERT_TRUE(client.GetHFSVolumeName(0));
  service.Kill();
  siginfo_t ended;
  waitid(P_PID, static_cast<id_t>(service.Process()), &ended, WEXITED | WNOWAIT);
  EXPECT_EQ(MessageOf(client.GetHFSVolumeName(0)), kEnded);
  EXPECT_TRUE(client.GetHFSVolumeName(0));
}

TEST(Client, AServiceThatKillsItselfDuringARequestIsSaidAndStartedAgain) {
  const TemporaryFolder folder;
  Client client({.service = ImpostorOnce(folder, std::string(kTakeRequest) + "kill -9 $$")});
  EXPECT_EQ(MessageOf(client.GetHFSVolumeName(0)), kEnded);
  EXPECT_TRUE(client.GetHFSVolumeName(0));
}

TEST(Client, AServiceKilledDuringARequestIsSaidAndStartedAgain) {
  const test::MortalService service;
  Client client({.service = service.Path()});
  ASSERT_TRUE(client.GetHFSVolumeName(0));
  kill(service.Process(), SIGSTOP);
  std::thread killer([&service] {
    std::this_thread::sleep_for(milliseconds(100));
    service.Kill();
  });
  EXPECT_EQ(MessageOf(client.GetHFSVolumeName(0)), kEnded);
  killer.join();
  EXPECT_TRUE(client.GetHFSVolumeName(0));
}

TEST(Client, AServiceThatNeverAnswersIsKilledAtTheDeadlineAndStartedAgain) {
  const TemporaryFolder folder;
  Client client({.service = ImpostorOnce(folder, "trap '' PIPE TERM; exec sleep 60"),
                 .deadline = milliseconds(1500)});
  const auto start = steady_clock::now();
  EXPECT_THAT(MessageOf(client.GetHFSVolumeName(0)), testing::StartsWith(kNotInTime));
  const auto taken = steady_clock::now() - start;
  EXPECT_GE(taken, milliseconds(1500));
  // Without the second in which one may end by itself.
  EXPECT_LT(taken, milliseconds(2400));
  EXPECT_TRUE(test::HasNoChild());
  EXPECT_TRUE(client.GetHFSVolumeName(0));
}

TEST(Client, AServiceThatAnswersAByteAtATimeMissesTheDeadlineToo) {
  const TemporaryFolder folder;
  Client client({.service = Impostor(folder, std::string(kTakeRequest) +
                                                 "printf '\\001\\377\\000'\n"
                                                 "while printf x; do sleep 0.01; done"),
                 .deadline = milliseconds(300)});
  EXPECT_THAT(MessageOf(client.GetHFSVolumeName(0)), testing::StartsWith(kNotInTime));
}

TEST(Client, AServiceThatNoLongerReadsMissesTheDeadline) {
  const TemporaryFolder folder;
  Client client({.service = Impostor(folder, "exec sleep 60 <&-"), .deadline = milliseconds(600)});
  EXPECT_THAT(MessageOf(client.GetHFSName(std::string(65534, 'x'))),
              testing::StartsWith(kNotInTime));
}

TEST(Client, WaitingForAServiceThatNoLongerReadsTakesNoProcessorTime) {
  const TemporaryFolder folder;
  Client client({.service = Impostor(folder, "exec sleep 60 <&-"), .deadline = milliseconds(600)});
  const std::clock_t before = std::clock();
  EXPECT_FALSE(client.GetHFSName(std::string(65534, 'x')));
  EXPECT_LT(std::clock() - before, CLOCKS_PER_SEC / 5);
}

TEST(Client, AServiceThatTakesNothingOfARequestMissesTheDeadline) {
  const TemporaryFolder folder;
  Client client(
      {.service = Impostor(folder, std::string(kTakeRequest) + "printf '\\000\\001\\000\\000MWLT'\n"
                                                               "exec sleep 60 <&-"),
       .deadline = milliseconds(500)});
  EXPECT_TRUE(client.GetHFSVolumeName(0));
  std::this_thread::sleep_for(milliseconds(100));
  EXPECT_THAT(MessageOf(client.GetHFSVolumeName(0)), testing::StartsWith(kNotInTime));
}

TEST(Client, TheDeadlineCountsFromARequestThatNobodyTakes) {
  const TemporaryFolder folder;
  Client client(
      {.service = Impostor(folder, std::string(kTakeRequest) + "printf '\\000\\001\\000\\000MWLT'\n"
                                                               "exec <&-; sleep 1.6"),
       .deadline = milliseconds(1000)});
  EXPECT_TRUE(client.GetHFSVolumeName(0));
  std::this_thread::sleep_for(milliseconds(1200));
  EXPECT_EQ(MessageOf(client.GetHFSVolumeName(0)), kEnded);
}

TEST(Client, TheDeadlineCountsFromEachRequest) {
  const TemporaryFolder folder;
  const std::string answer =
      std::string(kTakeRequest) + "sleep 0.3; printf '\\000\\001\\000\\000MWLT'\n";
  Client client({.service = Impostor(folder, answer + answer + answer + "cat"),
                 .deadline = milliseconds(700)});
  for (int i = 0; i < 3; ++i) {
    EXPECT_EQ(MessageOf(client.GetHFSVolumeName(0)), "");
    std::this_thread::sleep_for(milliseconds(100));
  }
}

TEST(Client, TheLongestDeadlineIsNone) {
  Client client({.service = TALLOWMERE_SERVICE, .deadline = milliseconds::max()});
  EXPECT_TRUE(client.GetHFSVolumeName(0));
  const TemporaryFolder folder;
  Client slow({.service = Impostor(folder, std::string(kTakeRequest) +
                                               "sleep 0.3; printf '\\000\\001\\000\\000MWLT'; cat"),
               .deadline = milliseconds::max()});
  EXPECT_TRUE(slow.GetHFSVolumeName(0));
}

TEST(Client, ADeadlineOfNothingIsMissedAtOnce) {
  for (const milliseconds deadline : {milliseconds(0), milliseconds(-1), milliseconds::min()}) {
    Client client({.service = TALLOWMERE_SERVICE, .deadline = deadline});
    EXPECT_THAT(MessageOf(client.GetHFSVolumeName(0)), testing::StartsWith(kNotInTime));
    EXPECT_TRUE(test::HasNoChild());
  }
}

TEST(Client, ADeadlineOfNothingStartsNoService) {
  Client client({.service = "/nonexistent/tallowmere", .deadline = milliseconds(0)});
  EXPECT_THAT(MessageOf(client.GetHFSVolumeName(0)), testing::StartsWith(kNotInTime));
}

TEST(Client, ACopyOfThisProcessLeavesTheServiceAlone) {
  Client client = test::StartClient();
  ASSERT_TRUE(client.GetHFSVolumeName(0));
  const pid_t copy = fork();
  if (copy == 0) {
    { const Client itsOwn = std::move(client); }
    _exit(0);
  }
  waitpid(copy, nullptr, 0);
  EXPECT_TRUE(client.GetHFSVolumeName(0));
}

TEST(Client, ABrokenPipeSignalThatWasPendingStaysPending) {
  sigset_t brokenPipe;
  sigemptyset(&brokenPipe);
  sigaddset(&brokenPipe, SIGPIPE);
  sigset_t before;
  pthread_sigmask(SIG_BLOCK, &brokenPipe, &before);
  raise(SIGPIPE);
  const TemporaryFolder folder;
  Client client({.service = Impostor(folder, "exec sleep 60 <&-"), .deadline = milliseconds(200)});
  EXPECT_FALSE(client.GetHFSVolumeName(0));
  EXPECT_FALSE(client.GetHFSVolumeName(0));
  sigset_t pending;
  sigpending(&pending);
  EXPECT_TRUE(sigismember(&pending, SIGPIPE));
  const timespec atOnce{};
  sigtimedwait(&brokenPipe, nullptr, &atOnce);
  pthread_sigmask(SIG_SETMASK, &before, nullptr);
}

TEST(Client, AThousandRestartsLeaveNeitherProcessNorDescriptor) {
  const test::MortalService service;
  Client client({.service = service.Path()});
  ASSERT_TRUE(client.GetHFSVolumeName(0));
  const auto before = test::OpenDescriptors();
  for (int i = 0; i < 1000; ++i) {
    service.Kill();
    ASSERT_EQ(MessageOf(client.GetHFSVolumeName(0)), kEnded);
    ASSERT_TRUE(test::HasNoChild());
    ASSERT_TRUE(client.GetHFSVolumeName(0));
  }
  EXPECT_EQ(test::OpenDescriptors(), before);
}

TEST(Client, AThousandProgramsThatEndAtOnceLeaveNeitherProcessNorDescriptor) {
  const auto before = test::OpenDescriptors();
  Client client({.service = "/bin/true"});
  for (int i = 0; i < 1000; ++i) ASSERT_EQ(MessageOf(client.GetHFSVolumeName(0)), kEnded);
  EXPECT_EQ(test::OpenDescriptors(), before);
  EXPECT_TRUE(test::HasNoChild());
}

TEST(Client, OneThatTakesTheNameOfAnotherEndsTheOthersService) {
  Client client = test::StartClient();
  ASSERT_TRUE(client.GetHFSVolumeName(0));
  client = test::StartClient();
  EXPECT_TRUE(test::HasNoChild());
  ASSERT_TRUE(client.GetHFSVolumeName(0));
  const Client itsHeir = std::move(client);
  EXPECT_FALSE(test::HasNoChild());
}

// A host with two clients, and a child that outlives it and holds what it inherited.
TEST(Client, AHostThatIsKilledTakesItsServicesWithIt) {
  prctl(PR_SET_CHILD_SUBREAPER, 1);
  std::array<int, 2> ready{};
  ASSERT_EQ(pipe(ready.data()), 0);
  const pid_t host = fork();
  if (host == 0) {
    Client first = test::StartClient();
    Client second = test::StartClient();
    const bool live = first.GetHFSVolumeName(0) && second.GetHFSVolumeName(0);
    const pid_t child = live ? fork() : -1;
    if (child == 0) {
      execlp("sleep", "sleep", "60", nullptr);
      _exit(1);
    }
    if (write(ready[1], &child, sizeof child) != sizeof child) _exit(1);
    pause();
  }
  pid_t child = -1;
  ASSERT_EQ(read(ready[0], &child, sizeof child), static_cast<ssize_t>(sizeof child));
  ASSERT_GT(child, 0);
  kill(host, SIGKILL);
  ASSERT_EQ(waitpid(host, nullptr, 0), host);

  const auto deadline = steady_clock::now() + milliseconds(10'000);
  int ended = 0;
  while (ended < 2 && steady_clock::now() < deadline) {
    int status = -1;
    const pid_t service = waitpid(-1, &status, WNOHANG);
    if (service > 0) {
      ++ended;
      EXPECT_NE(service, child);
      EXPECT_EQ(status, 0);
    }
    std::this_thread::sleep_for(milliseconds(1));
  }
  EXPECT_EQ(ended, 2);
  kill(child, SIGKILL);
  while (waitpid(-1, nullptr, 0) > 0) {
  }
  prctl(PR_SET_CHILD_SUBREAPER, 0);
  close(ready[0]);
  close(ready[1]);
}

}  // namespace
}  // namespace tallowmere
