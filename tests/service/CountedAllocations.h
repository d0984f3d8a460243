// Counts operator new and operator delete in the program that links this.
#pragma once

namespace tallowmere::test {

// Returns the number of blocks allocated since the program started.
int CountedAllocations();

// Returns how many of them have not been freed.
int LiveAllocations();

}  // namespace tallowmere::test
