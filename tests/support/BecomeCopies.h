// The part of a copied program, see Copies.h. Allocates nothing.
#pragma once

namespace tallowmere::test {

// The environment variable with the original's end of the socket.
inline constexpr char kCopiesSocketVariable[] = "TALLOWMERE_COPIES_SOCKET";

// Returns in each copy, with the socket, which the copy closes. The original itself ends when the
// other end is closed. Returns -1 at once in a program that is not to be copied.
int BecomeCopies();

}  // namespace tallowmere::test
