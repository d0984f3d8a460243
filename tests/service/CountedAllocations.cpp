#include "CountedAllocations.h"

#include <cstdlib>
#include <new>

namespace {

int allocations = 0;
int released = 0;

}  // namespace

void* operator new(std::size_t size) {
  ++allocations;
  void* const block = std::malloc(size == 0 ? 1 : size);
  if (block == nullptr) throw std::bad_alloc();
  return block;
}

void operator delete(void* block) noexcept {
  if (block != nullptr) ++released;
  std::free(block);
}

void operator delete(void* block, std::size_t) noexcept {
  operator delete(block);
}

int tallowmere::test::CountedAllocations() {
  return allocations;
}

int tallowmere::test::LiveAllocations() {
  return allocations - released;
}
