// Checks the slices that a parser returns.
#pragma once

#include <string_view>

#include "fuzz/Check.h"

namespace tallowmere::fuzz {

// Checks that the piece lies within the bytes, and reads all of it.
inline void CheckPiece(std::string_view piece, std::string_view bytes) {
  Check(piece.size() <= bytes.size());
  Check(piece.empty() || (piece.data() >= bytes.data() &&
                          piece.data() + piece.size() <= bytes.data() + bytes.size()));
  unsigned sum = 0;
  for (const char byte : piece) sum += static_cast<unsigned char>(byte);
  [[maybe_unused]] static volatile unsigned sink;
  sink = sum;
}

}  // namespace tallowmere::fuzz
