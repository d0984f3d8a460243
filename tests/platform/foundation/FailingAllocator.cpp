#include "FailingAllocator.h"

#include <cstdlib>
#include <new>

namespace {

constexpr long kNever = -1;
long gUntilFailure = kNever;
long gLive = 0;

}  // namespace

void* operator new(std::size_t size) {
  if (gUntilFailure == 0) throw std::bad_alloc();
  if (gUntilFailure > 0) --gUntilFailure;
  void* const memory = std::malloc(size == 0 ? 1 : size);
  if (memory == nullptr) throw std::bad_alloc();
  ++gLive;
  return memory;
}

void operator delete(void* memory) noexcept {
  if (memory != nullptr) --gLive;
  std::free(memory);
}

void operator delete(void* memory, std::size_t) noexcept {
  operator delete(memory);
}

namespace tallowmere::foundation::test {

void FailAllocationsAfter(long count) {
  gUntilFailure = count;
}

void FailNoAllocation() {
  gUntilFailure = kNever;
}

long LiveAllocations() {
  return gLive;
}

}  // namespace tallowmere::foundation::test
