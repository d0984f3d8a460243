#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <mutex>
#include <numeric>
#include <set>
#include <stdexcept>
#include <thread>
#include <vector>

#include "cli/Crew.h"

namespace tallowmere::cli {
namespace {

using testing::ElementsAre;

// Hands over twice each number, after less work for greater ones.
std::vector<int> Doubled(std::size_t threads, int numbers) {
  std::vector<int> doubled;
  const auto work = [](int& number) {
    std::this_thread::sleep_for(std::chrono::microseconds(number % 2 == 0 ? 500 : 0));
    number *= 2;
  };
  Crew<int> crew([threads] { return threads; }, [&] { return work; },
                 [&](int number) { doubled.push_back(number); });
  for (int i = 0; i < numbers; ++i) crew.Give(i);
  crew.Finish();
  return doubled;
}

TEST(Crew, HandsOverInTheOrderOfGiving) {
  std::vector<int> expected(100);
  for (int i = 0; i < 100; ++i) expected[static_cast<std::size_t>(i)] = 2 * i;
  for (const std::size_t threads : {1U, 2U, 4U})
    EXPECT_EQ(Doubled(threads, 100), expected) << threads;
}

TEST(Crew, WorksWithAsManyThreadsAsItMayForMuchWorkAndWithOneForLittle) {
  constexpr std::size_t kThreads = 3;
  for (const auto& [numbers, expected] : {std::pair(100, kThreads), {1, 1U}, {2, 1U}}) {
    std::mutex mutex;
    std::set<std::thread::id> workers;
    const auto areAllAtWork = [&, most = expected] {
      const std::lock_guard lock(mutex);
      workers.insert(std::this_thread::get_id());
      return workers.size() >= most;
    };
    // Each keeps its first piece until the others have theirs, for ten seconds at most.
    const auto work = [&](int&) {
      for (int i = 0; i < 1000 && !areAllAtWork(); ++i) {
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
      }
    };
    {
      Crew<int> crew([] { return kThreads; }, [&] { return work; }, [](int) {});
      for (int i = 0; i < numbers; ++i) crew.Give(i);
      crew.Finish();
    }
    EXPECT_EQ(workers.size(), expected) << numbers;
  }
}

TEST(Crew, WorksWithOneThreadWhereEachPieceIsWaitedFor) {
  std::size_t hired = 0;
  Crew<int> crew([] { return std::size_t{4}; },
                 [&hired] {
                   ++hired;
                   return [](int&) {};
                 },
                 [](int) {});
  for (int i = 0; i < 20; ++i) {
    crew.Give(i);
    crew.Finish();
  }
  EXPECT_EQ(hired, 1u);
}

TEST(Crew, GoesOnWithTheThreadsThatItCanGet) {
  std::size_t asked = 0;
  std::vector<int> done;
  Crew<int> crew([] { return std::size_t{4}; },
                 [&asked]() -> Crew<int>::Work {
                   if (asked++ > 0) return nullptr;
                   return [](int&) { std::this_thread::sleep_for(std::chrono::milliseconds(1)); };
                 },
                 [&done](int number) { done.push_back(number); });
  for (int i = 0; i < 10; ++i) crew.Give(i);
  crew.Finish();
  EXPECT_EQ(done.size(), 10u);
  EXPECT_EQ(asked, 2u);
}

TEST(Crew, ThrowsWhatItsWorkHasThrownInItsTurn) {
  std::vector<int> done;
  Crew<int> crew([] { return std::size_t{2}; },
                 [] {
                   return [](int& number) {
                     if (number == 1) throw std::runtime_error("one");
                   };
                 },
                 [&](int number) { done.push_back(number); });
  EXPECT_THROW(
      {
        for (int i = 0; i < 3; ++i) crew.Give(i);
        crew.Finish();
      },
      std::runtime_error);
  EXPECT_THAT(done, ElementsAre(0));
}

TEST(Crew, MayEndBeforeItsWorkIsDone) {
  std::atomic<int> begun = 0;
  {
    Crew<int> crew([] { return std::size_t{2}; },
                   [&] {
                     return [&](int&) {
                       ++begun;
                       std::this_thread::sleep_for(std::chrono::milliseconds(5));
                     };
                   },
                   [](int) {});
    crew.Give(0);
    crew.Give(1);
  }
  EXPECT_LE(begun, 2);
}

}  // namespace
}  // namespace tallowmere::cli
