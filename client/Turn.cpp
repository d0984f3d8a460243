#include "client/Turn.h"

#include <pthread.h>

namespace tallowmere {
namespace {

constexpr int kGenerationShift = 32;

std::atomic<std::uint32_t> gGeneration{0};

// Registered for good: there is no way to take it back, and nothing else is done in a child.
void CountForks() {
  static const int registered =
      pthread_atfork(nullptr, nullptr, [] { gGeneration.fetch_add(1, std::memory_order_relaxed); });
  static_cast<void>(registered);
}

// A number of this thread, from 1, that no other thread has or had.
std::uint32_t ThisThread() {
  static std::atomic<std::uint32_t> latest{0};
  thread_local const std::uint32_t number = ++latest;
  return number;
}

}  // namespace

std::uint32_t ProcessGeneration() {
  CountForks();
  return gGeneration.load(std::memory_order_relaxed);
}

bool Turn::Take() {
  const std::uint64_t generation = ProcessGeneration();
  const std::uint64_t wanted = generation << kGenerationShift | ThisThread();
  std::uint64_t holder = mHolder.load();
  while (true) {
    const bool isOfThisProcess = holder >> kGenerationShift == generation;
    if (static_cast<std::uint32_t>(holder) == ThisThread()) return false;
    if (holder != 0 && isOfThisProcess) {
      mHolder.wait(holder);
      holder = mHolder.load();
    } else if (mHolder.compare_exchange_strong(holder, wanted)) {
      return true;
    }
  }
}

void Turn::Release() {
  mHolder.store(0);
  mHolder.notify_one();
}

}  // namespace tallowmere
