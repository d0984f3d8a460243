// Makes the process's operator new fail on purpose. For one thread only.
#pragma once

#include <cstddef>

namespace tallowmere::foundation::test {

// Lets `count` more allocations succeed; all later ones throw std::bad_alloc.
void FailAllocationsAfter(long count);

// Lets `count` more allocations succeed; the next one throws, and later ones succeed again.
void FailOneAllocationAfter(long count);

void FailNoAllocation();

// Returns the number of allocations that have not been freed.
long LiveAllocations();

// The number of allocations by new[], and the size of the last one in bytes.
long ArrayAllocations();
std::size_t SizeOfLastArray();

}  // namespace tallowmere::foundation::test
