// Spreads the bits of consecutive numbers, for hash tables.
#pragma once

#include <cstddef>
#include <cstdint>

namespace tallowmere::catalog {

// An odd number that spreads the bits of what it multiplies: 2^64 divided by the golden ratio.
inline constexpr std::uint64_t kSpread = 0x9E3779B97F4A7C15;

// The slot at which to start probing. REQUIRES: `slots` is a power of two.
inline std::size_t FirstSlot(std::uint32_t number, std::size_t slots) {
  return static_cast<std::size_t>(number * kSpread >> 32) & (slots - 1);
}

}  // namespace tallowmere::catalog
