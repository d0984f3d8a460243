#include "quicktime/AtomContainer.h"

namespace tallowmere::quicktime {
namespace {

constexpr UInt32 kAtomID = 1;
constexpr std::size_t kReservedBeforeLockCount = 10;
constexpr UInt16 kLockCount = 0;

// Room for the settings of a sound.
constexpr std::size_t kUsualSize = 144;
constexpr std::size_t kUsualDepth = 3;

}  // namespace

AtomContainer::AtomContainer() {
  mBytes.reserve(kUsualSize);
  mOpen.reserve(kUsualDepth);
  mBytes.append(kReservedBeforeLockCount, '\0');
  Append(kLockCount);
}

// The size is known when the atom is closed.
void AtomContainer::Open(OSType type, UInt16 childCount) {
  mOpen.push_back(mBytes.size());
  Append(UInt32{0});
  Append(type);
  Append(kAtomID);
  Append(UInt16{0});
  Append(childCount);
  Append(UInt32{0});
}

void AtomContainer::Close() {
  const std::size_t begin = mOpen.back();
  mOpen.pop_back();
  const auto size = static_cast<UInt32>(mBytes.size() - begin);
  for (std::size_t i = 0; i < sizeof size; ++i) {
    mBytes[begin + i] = static_cast<char>(size >> (8 * (sizeof size - 1 - i)));
  }
}

void AtomContainer::AddLeaf(OSType type, UInt32 number) {
  Open(type, 0);
  Append(number);
  Close();
}

void AtomContainer::AddLeaf(OSType type, UInt16 number) {
  Open(type, 0);
  Append(number);
  Close();
}

void AtomContainer::Append(UInt32 number) {
  Append(static_cast<UInt16>(number >> 16));
  Append(static_cast<UInt16>(number));
}

void AtomContainer::Append(UInt16 number) {
  mBytes.push_back(static_cast<char>(number >> 8));
  mBytes.push_back(static_cast<char>(number));
}

}  // namespace tallowmere::quicktime
