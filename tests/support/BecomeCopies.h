// The part of a copied program, see Copies.h. Allocates nothing.
#pragma once

namespace tallowmere::test {

// The environment variable with the original's end of the socket.
inline constexpr char kCopiesSocketVariable[] = "TALLOWMERE_COPIES_SOCKET";

// Returns in each copy. The original itself ends when the other end of the socket is closed.
void BecomeCopies();

}  // namespace tallowmere::test
