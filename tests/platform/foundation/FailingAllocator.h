// The process's operator new, made to fail on purpose. One thread.
#pragma once

#include <cstddef>

namespace tallowmere::foundation::test {

// `count` more allocations succeed, then every one throws std::bad_alloc.
void FailAllocationsAfter(long count);

// The same, but only the first one throws.
void FailOneAllocationAfter(long count);

void FailNoAllocation();

// How many allocations have not been given back.
long LiveAllocations();

// How many allocations were made by new[], and the bytes of the last one.
long ArrayAllocations();
std::size_t SizeOfLastArray();

}  // namespace tallowmere::foundation::test
