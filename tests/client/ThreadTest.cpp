// One client in several threads, and on both sides of fork(2).
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <tallowmere/Batch.h>
#include <tallowmere/Converter.h>

#include <atomic>
#include <future>
#include <thread>
#include <vector>

#include "client/ClientSupport.h"
#include "support/Privileges.h"

namespace tallowmere {
namespace {

using test::MessageOf;
using test::StartClient;

constexpr const char* kInUse = "this thread uses the client already";

// Whether this many names come back, each asked for by its own path.
bool AnswersAreItsOwn(Client& client, const std::string& thread, int count) {
  for (int i = 0; i < count; ++i) {
    const std::string folder = "/missing " + thread + std::to_string(i);
    if (client.AddHFSName(folder, "x").ValueOr(std::nullopt) != folder + "/x") return false;
  }
  return true;
}

TEST(Threads, EachHasTheAnswersToItsOwnRequests) {
  Client client = StartClient();
  std::vector<std::future<bool>> threads;
  for (const char* const name : {"a", "b", "c", "d"}) {
    threads.push_back(std::async(std::launch::async,
                                 [&client, name] { return AnswersAreItsOwn(client, name, 500); }));
  }
  for (auto& thread : threads) EXPECT_TRUE(thread.get());
}

TEST(Threads, EachHasItsBatchToItself) {
  Client client = StartClient();
  std::atomic<int> right = 0;
  const auto ask = [&](const std::string& thread) {
    Batch batch(client);
    for (int i = 0; i < 1000; ++i) {
      const std::string folder = "/missing " + thread + std::to_string(i);
      batch.Add(request::AddHFSName(folder, "x"),
                [&right, folder](const auto& path) { right += path && *path == folder + "/x"; });
    }
    batch.Finish();
  };
  std::thread first(ask, "first");
  std::thread second(ask, "second");
  EXPECT_TRUE(AnswersAreItsOwn(client, "third", 100));
  first.join();
  second.join();
  EXPECT_EQ(right, 2000);
}

TEST(Threads, EachHasItsConversionsRight) {
  Client client = StartClient();
  const test::TemporaryFolder folder;
  const auto convert = [&](const std::string& name) {
    const std::string path = folder.MakeFile(name);
    for (int i = 0; i < 100; ++i) {
      const auto record = client.RecordOf(path);
      if (!record || client.PathOf(record->value).ValueOr({}).value != path) return false;
    }
    return true;
  };
  auto first = std::async(std::launch::async, convert, "first");
  auto second = std::async(std::launch::async, convert, "second");
  EXPECT_TRUE(first.get());
  EXPECT_TRUE(second.get());
}

TEST(Threads, OneThatHasABatchUnderWayIsRefusedAtOnce) {
  Client client = StartClient();
  Batch batch(client);
  std::vector<std::string> messages;
  const auto keep = [&messages](const auto& answer) { messages.push_back(MessageOf(answer)); };
  batch.Add(request::GetHFSVolumeName(0), keep);
  const auto answer = client.GetHFSVolumeName(0);
  EXPECT_EQ(MessageOf(answer), kInUse);
  EXPECT_EQ(answer.Failure().outcome, Outcome::kServiceFailed);
  EXPECT_EQ(MessageOf(client.RecordOf("/")), kInUse);
  Batch other(client);
  other.Add(request::GetHFSVolumeName(0), keep);
  other.Finish();
  batch.Finish();
  EXPECT_THAT(messages, testing::ElementsAre(kInUse, ""));
}

TEST(Threads, AHandlerThatAsksIsRefused) {
  Client client = StartClient();
  Batch batch(client);
  std::string message;
  batch.Add(request::GetHFSVolumeName(0),
            [&](const auto&) { message = MessageOf(client.GetHFSVolumeName(0)); });
  batch.Finish();
  EXPECT_EQ(message, kInUse);
}

TEST(Threads, ABatchThatHasFinishedOrThrownLeavesTheClientToOthers) {
  Client client = StartClient();
  Batch batch(client);
  batch.Add(request::GetHFSVolumeName(0), [](const auto&) {});
  batch.Finish();
  EXPECT_TRUE(client.GetHFSVolumeName(0));
  batch.Add(request::GetHFSVolumeName(0), [](const auto&) { throw std::runtime_error("thrown"); });
  EXPECT_THROW(batch.Finish(), std::runtime_error);
  EXPECT_TRUE(client.GetHFSVolumeName(0));
}

// Whether `work` returns true in a child made by fork(2), within the deadline of a test.
bool HoldsInFork(const std::function<bool()>& work) {
  return test::HoldsInChild([] { return alarm(60) == 0; }, work);
}

TEST(Fork, TheChildAsksAServiceOfItsOwn) {
  const test::MortalService service;
  Client client({.service = service.Path()});
  ASSERT_TRUE(AnswersAreItsOwn(client, "parent", 1));
  const pid_t process = service.Process();
  EXPECT_TRUE(HoldsInFork(
      [&] { return AnswersAreItsOwn(client, "child", 10) && service.Process() != process; }));
  EXPECT_EQ(kill(process, 0), 0);
  EXPECT_TRUE(AnswersAreItsOwn(client, "parent", 10));
}

TEST(Fork, BothSidesAskAtOnceAndHaveTheirOwnAnswers) {
  Client client = StartClient();
  ASSERT_TRUE(AnswersAreItsOwn(client, "parent", 1));
  const pid_t child = fork();
  if (child == 0) {
    alarm(60);
    _exit(AnswersAreItsOwn(client, "child", 1000) ? 0 : 1);
  }
  EXPECT_TRUE(AnswersAreItsOwn(client, "parent", 1000));
  int status = -1;
  waitpid(child, &status, 0);
  EXPECT_EQ(status, 0);
}

TEST(Fork, TheChildsEndLeavesTheParentsServiceAlone) {
  const test::MortalService service;
  auto client = std::make_unique<Client>(ClientOptions{.service = service.Path()});
  ASSERT_TRUE(AnswersAreItsOwn(*client, "parent", 1));
  const pid_t process = service.Process();
  EXPECT_TRUE(HoldsInFork([&] {
    client.reset();
    return true;
  }));
  EXPECT_TRUE(AnswersAreItsOwn(*client, "parent", 10));
  EXPECT_EQ(service.Process(), process);
}

TEST(Fork, ABatchUnderWayIsAskedAnewInTheChild) {
  Client client = StartClient();
  Batch batch(client);
  int right = 0;
  for (int i = 0; i < 200; ++i) {
    const std::string folder = "/missing " + std::to_string(i);
    batch.Add(request::AddHFSName(folder, "x"),
              [&right, folder](const auto& path) { right += path && *path == folder + "/x"; });
  }
  EXPECT_TRUE(HoldsInFork([&] {
    batch.Finish();
    return right == 200;
  }));
  batch.Finish();
  EXPECT_EQ(right, 200);
}

TEST(Fork, WhatAnotherThreadHadIsFreeInTheChild) {
  Client client = StartClient();
  std::promise<void> taken;
  std::promise<void> forked;
  std::thread other([&] {
    Batch batch(client);
    batch.Add(request::GetHFSVolumeName(0), [](const auto&) {});
    taken.set_value();
    forked.get_future().wait();
  });
  taken.get_future().wait();
  EXPECT_TRUE(HoldsInFork([&] { return AnswersAreItsOwn(client, "child", 1); }));
  forked.set_value();
  other.join();
}

}  // namespace
}  // namespace tallowmere
