#include "FailingAllocator.h"

#include <cstdlib>
#include <new>

namespace {

constexpr long kNever = -1;
long gUntilFailure = kNever;
bool gFailsOnce = false;
long gLive = 0;
long gArrays = 0;
std::size_t gLastArraySize = 0;

}  // namespace

void* operator new(std::size_t size) {
  if (gUntilFailure == 0) {
    if (gFailsOnce) gUntilFailure = kNever;
    throw std::bad_alloc();
  }
  if (gUntilFailure > 0) --gUntilFailure;
  void* const memory = std::malloc(size == 0 ? 1 : size);
  if (memory == nullptr) throw std::bad_alloc();
  ++gLive;
  return memory;
}

void* operator new[](std::size_t size) {
  ++gArrays;
  gLastArraySize = size;
  return operator new(size);
}

void* operator new[](std::size_t size, const std::nothrow_t&) noexcept {
  try {
    return operator new[](size);
  } catch (const std::bad_alloc&) {
    return nullptr;
  }
}

void operator delete(void* memory) noexcept {
  if (memory != nullptr) --gLive;
  std::free(memory);
}

void operator delete(void* memory, std::size_t) noexcept {
  operator delete(memory);
}

void operator delete[](void* memory) noexcept {
  operator delete(memory);
}

void operator delete[](void* memory, std::size_t) noexcept {
  operator delete(memory);
}

namespace tallowmere::foundation::test {

void FailAllocationsAfter(long count) {
  gUntilFailure = count;
  gFailsOnce = false;
}

void FailOneAllocationAfter(long count) {
  gUntilFailure = count;
  gFailsOnce = true;
}

void FailNoAllocation() {
  gUntilFailure = kNever;
}

long LiveAllocations() {
  return gLive;
}

long ArrayAllocations() {
  return gArrays;
}

std::size_t SizeOfLastArray() {
  return gLastArraySize;
}

}  // namespace tallowmere::foundation::test
