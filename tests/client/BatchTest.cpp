#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <tallowmere/Batch.h>

#include <stdexcept>
#include <thread>
#include <vector>

#include "client/ClientSupport.h"
#include "support/Wire.h"

namespace tallowmere {
namespace {

using std::chrono::milliseconds;
using test::ImpostorOnce;
using test::MessageOf;
using test::StartClient;
using test::TemporaryFolder;
using testing::Each;

using Text = std::optional<std::string>;

// The answer for a number that no volume has, as printf(1) writes it.
constexpr const char* kNoSuchVolume = "\\000\\001\\000\\000MWLT";

std::string PathNumbered(std::size_t i) {
  return "/missing " + std::to_string(i);
}

// Where AddHFSName leads from PathNumbered(i), which is no folder.
std::string Added(std::size_t i) {
  return PathNumbered(i) + "/x";
}

Request<Text> RequestNumbered(std::size_t i) {
  return request::AddHFSName(PathNumbered(i), "x");
}

// Asks that many questions. Returns a message for each, empty where the answer is right.
std::vector<std::string> AskedIn(Batch& batch, std::size_t count) {
  std::vector<std::string> messages;
  for (std::size_t i = 0; i < count; ++i) {
    batch.Add(RequestNumbered(i), [&messages, i](Result<Text> answer) {
      const bool isInOrder = messages.size() == i;
      messages.push_back(!isInOrder            ? "out of order"
                         : !answer             ? answer.Failure().message
                         : *answer == Added(i) ? ""
                                               : "wrong");
    });
  }
  batch.Finish();
  return messages;
}

TEST(Batch, AnswersAreThoseOfSingleRequestsInTheirOrder) {
  Client client = StartClient();
  Batch batch(client);
  const auto messages = AskedIn(batch, 5000);
  EXPECT_EQ(messages.size(), 5000u);
  EXPECT_THAT(messages, Each(""));
}

TEST(Batch, RequestsOfAllKindsAreAnsweredInTheirOrderAlsoThoseThatAreNotSent) {
  const TemporaryFolder folder;
  const std::string file = folder.MakeFile("f");
  Client client = StartClient();
  Batch batch(client);
  std::vector<int> order;
  for (int i = 0; i < 300; ++i) {
    batch.Add(request::GetHFSName(file), [&](Result<Text> name) {
      order.push_back(0);
      EXPECT_EQ(*name, "f");
    });
    batch.Add(request::GetHFSName(std::string(70000, 'x')), [&](Result<Text> name) {
      order.push_back(1);
      EXPECT_EQ(*name, std::nullopt);
    });
    batch.Add(request::GetFSSpec(file), [&](Result<std::optional<FSSpec>> spec) {
      order.push_back(2);
      EXPECT_EQ((*spec)->name, "f");
    });
    batch.Add(request::GetVolRefnumByHFSName("no such volume"), [&](const auto& number) {
      order.push_back(3);
      EXPECT_EQ(*number, std::nullopt);
    });
    batch.Add(request::MakeFullPath("x"), [&](const auto& path) {
      order.push_back(4);
      EXPECT_EQ(*path, ":");
    });
    batch.Add(request::GetAIFFExportSettings({0, 0, 0, 0}), [&](const auto& settings) {
      order.push_back(5);
      EXPECT_EQ(settings->result, -206);
    });
  }
  batch.Finish();
  ASSERT_EQ(order.size(), 1800u);
  for (std::size_t i = 0; i < order.size(); ++i) ASSERT_EQ(order[i], static_cast<int>(i % 6));
}

TEST(Batch, FinishingWithoutRequestsStartsNoService) {
  Client client = StartClient();
  Batch batch(client);
  batch.Finish();
  EXPECT_TRUE(test::HasNoChild());
}

TEST(Batch, IsUsedAgainAfterItHasFinished) {
  Client client = StartClient();
  Batch batch(client);
  EXPECT_THAT(AskedIn(batch, 3), Each(""));
  EXPECT_THAT(AskedIn(batch, 3), Each(""));
}

TEST(Batch, AHundredThousandRequestsAndAnswersOf60000BytesComeToAnEnd) {
  Client client({.service = TALLOWMERE_ECHO_SERVICE});
  Batch batch(client);
  const auto request = request::GetHFSName(std::string(60000, 'x'));
  std::size_t answered = 0;
  for (int i = 0; i < 100'000; ++i) {
    batch.Add(request, [&](const Result<Text>& name) {
      if (name && *name && (*name)->size() == 60000) ++answered;
    });
  }
  batch.Finish();
  EXPECT_EQ(answered, 100'000u);
}

TEST(Batch, LongRequestsAndAnswersOfTheServiceComeToAnEnd) {
  Client client = StartClient();
  Batch batch(client);
  const std::string path = '/' + std::string(60000, 'x');
  std::size_t answered = 0;
  for (int i = 0; i < 200; ++i) {
    batch.Add(request::AddHFSName(path, "x"), [&](Result<Text> added) {
      if (added && *added == path + "/x") ++answered;
    });
  }
  batch.Finish();
  EXPECT_EQ(answered, 200u);
}

TEST(Batch, AnswersThatAreLongerThanTheirRequestsComeToAnEnd) {
  Client client = StartClient();
  Batch batch(client);
  std::size_t answered = 0;
  for (int i = 0; i < 20'000; ++i) {
    batch.Add(request::MakeFullPath("x"), [&](Result<std::string> path) {
      if (path && *path == ":") ++answered;
    });
  }
  batch.Finish();
  EXPECT_EQ(answered, 20'000u);
}

// Adds requests to a service that never answers until one is given up. Returns how many.
std::size_t RequestsUntilFull(const Request<Text>& request) {
  const TemporaryFolder folder;
  Client client(
      {.service = test::Impostor(folder, "exec sleep 60"), .deadline = milliseconds(100)});
  Batch batch(client);
  for (std::size_t i = 1;; ++i) {
    try {
      batch.Add(request, [](const auto&) { throw std::runtime_error("full"); });
    } catch (const std::runtime_error&) {
      return i;
    }
  }
}

TEST(Batch, NoMoreThan256RequestsAreUnderWay) {
  EXPECT_EQ(RequestsUntilFull(request::GetHFSVolumeName(0)), 256u);
}

TEST(Batch, NoMoreThan64KiBAreUnderWay) {
  // 1,024 bytes with code, count, NUL and room.
  EXPECT_EQ(RequestsUntilFull(request::GetHFSName(std::string(1017, 'x'))), 64u);
  EXPECT_EQ(RequestsUntilFull(request::GetHFSName(std::string(1016, 'x'))), 65u);
}

TEST(Batch, NoMoreThan64KiBAreSentBeforeAnAnswer) {
  const TemporaryFolder folder;
  Client client(
      {.service = test::Impostor(folder, "cat >sent; exit"), .deadline = milliseconds(300)});
  Batch batch(client);
  const auto add = [&] {
    batch.Add(request::GetHFSName(std::string(60000, 'x')), [&](const auto& answer) {
      EXPECT_THAT(MessageOf(answer), testing::StartsWith(test::kNotInTime));
      throw std::runtime_error("full");
    });
  };
  add();
  EXPECT_THROW(add(), std::runtime_error);
  std::this_thread::sleep_for(milliseconds(200));
  EXPECT_EQ(file_size(folder.Path() / "sent"), 65536u);
}

TEST(Batch, RequestsAreSentWhileMoreAreAdded) {
  const TemporaryFolder folder;
  Client client({.service = test::Impostor(folder, "cat >sent; exit")});
  Batch batch(client);
  for (int i = 0; i < 10; ++i) {
    batch.Add(request::GetHFSName(std::string(1000, 'x')), [](const auto&) { FAIL(); });
  }
  for (int i = 0; i < 500; ++i) {
    if (exists(folder.Path() / "sent") && file_size(folder.Path() / "sent") > 0) return;
    std::this_thread::sleep_for(milliseconds(10));
  }
  FAIL() << "nothing was sent";
}

TEST(Batch, TheFirstUnansweredRequestGetsTheErrorAndAllOthersAreAnswered) {
  const TemporaryFolder folder;
  const std::string three = std::string(kNoSuchVolume) + kNoSuchVolume + kNoSuchVolume;
  Client client({.service = ImpostorOnce(
                     folder, "head -c 16 >/dev/null; printf '" + three + "'; kill -9 $$")});
  const Text name = *StartClient().GetHFSVolumeName(0);
  ASSERT_TRUE(name);
  Batch batch(client);
  std::vector<std::string> answers;
  for (int i = 0; i < 200; ++i) {
    batch.Add(request::GetHFSVolumeName(0), [&](Result<Text> answer) {
      answers.push_back(answer ? answer->value_or("none") : answer.Failure().message);
    });
  }
  batch.Finish();
  std::vector<std::string> expected(200, *name);
  expected[0] = expected[1] = expected[2] = "none";
  expected[3] = test::kEnded;
  EXPECT_EQ(answers, expected);
}

TEST(Batch, HalfAnAnswerToALaterRequestIsForgottenWithTheServiceThatGaveIt) {
  const TemporaryFolder folder;
  Client client(
      {.service = ImpostorOnce(folder, std::string("head -c 16 >/dev/null; printf '") +
                                           kNoSuchVolume + "\\001\\005\\000ha'; kill -9 $$")});
  const Text name = *StartClient().GetHFSVolumeName(0);
  ASSERT_TRUE(name);
  Batch batch(client);
  std::vector<std::string> answers;
  for (int i = 0; i < 4; ++i) {
    batch.Add(request::GetHFSVolumeName(0), [&](Result<Text> answer) {
      answers.push_back(answer ? answer->value_or("none") : answer.Failure().message);
    });
  }
  batch.Finish();
  EXPECT_EQ(answers, (std::vector<std::string>{"none", test::kEnded, *name, *name}));
}

TEST(Batch, AServiceKilledInTheMiddleCostsOneAnswer) {
  const test::MortalService service;
  Client client({.service = service.Path()});
  Batch batch(client);
  std::vector<std::size_t> failed;
  std::size_t answered = 0;
  for (std::size_t i = 0; i < 3000; ++i) {
    batch.Add(RequestNumbered(i), [&, i](Result<Text> answer) {
      if (!answer) failed.push_back(i);
      if (answer && *answer == Added(i)) ++answered;
      if (i == 1000) service.Kill();
    });
  }
  batch.Finish();
  EXPECT_EQ(failed.size(), 1u);
  EXPECT_EQ(answered, 2999u);
}

TEST(Batch, AMissedDeadlineCostsOneAnswer) {
  const TemporaryFolder folder;
  Client client({.service = ImpostorOnce(folder, "exec sleep 60"), .deadline = milliseconds(1500)});
  Batch batch(client);
  const auto messages = AskedIn(batch, 1000);
  ASSERT_EQ(messages.size(), 1000u);
  EXPECT_THAT(messages[0], testing::StartsWith(test::kNotInTime));
  EXPECT_THAT(std::vector(messages.begin() + 1, messages.end()), Each(""));
}

TEST(Batch, AMissingProgramIsSaidToEach) {
  Client client({.service = "/nonexistent/tallowmere"});
  Batch batch(client);
  const auto messages = AskedIn(batch, 300);
  EXPECT_EQ(messages.size(), 300u);
  EXPECT_THAT(messages, Each(testing::HasSubstr("could not be started")));
}

TEST(Batch, TheDeadlineOfARequestCountsFromTheAnswerBeforeIt) {
  const TemporaryFolder folder;
  const std::string answer = std::string("sleep 0.3; printf '") + kNoSuchVolume + "'\n";
  Client client({.service = test::Impostor(folder, "head -c 16 >/dev/null\n" + answer + answer +
                                                       answer + answer + "exec cat >/dev/null"),
                 .deadline = milliseconds(800)});
  Batch batch(client);
  std::vector<std::string> messages;
  for (int i = 0; i < 4; ++i) {
    batch.Add(request::GetHFSVolumeName(0),
              [&](const auto& name) { messages.push_back(MessageOf(name)); });
  }
  batch.Finish();
  EXPECT_EQ(messages.size(), 4u);
  EXPECT_THAT(messages, Each(""));
}

TEST(Batch, TheDeadlineDoesNotCountBeforeARequestIsSent) {
  const TemporaryFolder folder;
  Client client(
      {.service = test::Impostor(folder, "head -c 4 >/dev/null; sleep 0.3; printf '" +
                                             std::string(kNoSuchVolume) + "'; exec cat >/dev/null"),
       .deadline = milliseconds(1000)});
  Batch batch(client);
  std::string message = "not answered";
  batch.Add(request::GetHFSVolumeName(0), [&](const auto& name) { message = MessageOf(name); });
  std::this_thread::sleep_for(milliseconds(1100));
  batch.Finish();
  EXPECT_EQ(message, "");
}

TEST(Batch, AnAnswerThatCameInTimeCountsHoweverLateItIsLookedAt) {
  Client client({.service = TALLOWMERE_SERVICE, .deadline = milliseconds(1500)});
  Batch batch(client);
  int answered = 0;
  // Enough to be sent at once.
  for (int i = 0; i < 20; ++i) {
    batch.Add(request::GetHFSName(std::string(1000, 'x')), [&](const auto& name) {
      if (name) ++answered;
    });
  }
  std::this_thread::sleep_for(milliseconds(2000));
  batch.Finish();
  EXPECT_EQ(answered, 20);
}

TEST(Batch, DestroyedUnfinishedItAnswersNoMoreAndTheClientGoesOn) {
  Client client = StartClient();
  bool isGone = false;
  {
    Batch batch(client);
    for (std::size_t i = 0; i < 250; ++i) {
      batch.Add(RequestNumbered(i), [&](const auto&) { EXPECT_FALSE(isGone); });
    }
  }
  isGone = true;
  EXPECT_EQ(*client.AddHFSName("/missing", "y"), "/missing/y");
  Batch next(client);
  EXPECT_THAT(AskedIn(next, 1000), Each(""));
}

TEST(Batch, DestroyedBeforeItSentAnythingItLeavesTheServiceAlone) {
  const test::MortalService service;
  Client client({.service = service.Path()});
  ASSERT_TRUE(client.GetHFSVolumeName(0));
  const pid_t process = service.Process();
  {
    Batch batch(client);
    batch.Add(RequestNumbered(0), [](const auto&) { FAIL(); });
  }
  EXPECT_EQ(*client.AddHFSName("/missing", "y"), "/missing/y");
  EXPECT_EQ(service.Process(), process);
}

TEST(Batch, WhatAHandlerThrowsLeavesAddAndFinishAndTheRequestsBehindAreAnswered) {
  Client client = StartClient();
  Batch batch(client);
  std::vector<std::size_t> order;
  int thrown = 0;
  for (std::size_t i = 0; i < 1000; ++i) {
    try {
      batch.Add(RequestNumbered(i), [&, i](Result<Text> answer) {
        EXPECT_EQ(*answer, Added(i));
        order.push_back(i);
        if (i % 10 == 0) throw std::runtime_error("handler");
      });
    } catch (const std::runtime_error&) {
      ++thrown;
    }
  }
  EXPECT_GT(thrown, 0);
  EXPECT_LT(thrown, 100);
  for (bool isFinished = false; !isFinished;) {
    try {
      batch.Finish();
      isFinished = true;
    } catch (const std::runtime_error&) {
      ++thrown;
    }
  }
  EXPECT_EQ(thrown, 100);
  ASSERT_EQ(order.size(), 1000u);
  for (std::size_t i = 0; i < order.size(); ++i) ASSERT_EQ(order[i], i);
}

TEST(Batch, WhatAHandlerOfAFailureThrowsLeavesTheRestToBeAnswered) {
  const TemporaryFolder folder;
  Client client({.service = ImpostorOnce(folder, "exit")});
  Batch batch(client);
  std::size_t answered = 0;
  for (std::size_t i = 0; i < 10; ++i) {
    batch.Add(RequestNumbered(i), [&, i](Result<Text> answer) {
      if (!answer) throw std::runtime_error(answer.Failure().message);
      if (*answer == Added(i)) ++answered;
    });
  }
  EXPECT_THROW(batch.Finish(), std::runtime_error);
  batch.Finish();
  EXPECT_EQ(answered, 9u);
}

}  // namespace
}  // namespace tallowmere
