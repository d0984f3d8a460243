// In a program that links this, operator new counts.
#pragma once

namespace tallowmere::test {

// How many blocks have been taken since the program began.
int CountedAllocations();

// How many of them have not been given back.
int LiveAllocations();

}  // namespace tallowmere::test
