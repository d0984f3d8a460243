// The process's operator new, made to fail on purpose. One thread.
#pragma once

namespace tallowmere::foundation::test {

// `count` more allocations succeed, then every one throws std::bad_alloc.
void FailAllocationsAfter(long count);
void FailNoAllocation();

// How many allocations have not been given back.
long LiveAllocations();

}  // namespace tallowmere::foundation::test
