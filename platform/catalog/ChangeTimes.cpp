#include "catalog/ChangeTimes.h"

#include <cstdint>

namespace tallowmere::catalog {
namespace {

// In nanoseconds. File systems count time in ticks, the coarsest (FAT) of two seconds.
constexpr std::uint64_t kCoarsestTick = 2'000'000'000;

}  // namespace

bool HoldsUntilChange(const volumes::Volume& volume) {
  return volume.NumbersIdentifyItems() || volume.Kind().keepsNumbers;
}

bool MayChangeUnseen(kernel::Nanoseconds change, kernel::Nanoseconds now) {
  const std::uint64_t age = static_cast<std::uint64_t>(now) - static_cast<std::uint64_t>(change);
  return now <= change || age <= kCoarsestTick;
}

}  // namespace tallowmere::catalog
