#include "quicktime/AtomContainer.h"

#include <algorithm>
#include <array>

namespace tallowmere::quicktime {
namespace {

constexpr UInt32 kAtomID = 1;

// The zero bytes before the root atom: 10 reserved ones and the lock count.
constexpr std::size_t kBeforeRoot = 12;

// An atom's header, and what is not 0 in it.
constexpr std::size_t kHeaderSize = 20;
constexpr std::size_t kTypeOffset = 4;
constexpr std::size_t kIDOffset = 8;
constexpr std::size_t kChildCountOffset = 14;

// Room for the settings of a sound.
constexpr std::size_t kUsualSize = 144;

std::array<char, 4> BytesOf(UInt32 number) {
  return {static_cast<char>(number >> 24), static_cast<char>(number >> 16),
          static_cast<char>(number >> 8), static_cast<char>(number)};
}

std::array<char, 2> BytesOf(UInt16 number) {
  return {static_cast<char>(number >> 8), static_cast<char>(number)};
}

template <class Number>
void Store(Number number, char* place) {
  const auto bytes = BytesOf(number);
  std::copy(bytes.begin(), bytes.end(), place);
}

template <class Number>
void Append(Number number, std::string& text) {
  const auto bytes = BytesOf(number);
  text.append(bytes.data(), bytes.size());
}

}  // namespace

AtomContainer::AtomContainer() {
  mBytes.reserve(kUsualSize);
  mBytes.append(kBeforeRoot, '\0');
}

// The size is known when the atom is closed.
std::size_t AtomContainer::Open(OSType type, UInt16 childCount) {
  std::array<char, kHeaderSize> header{};
  Store(type, header.data() + kTypeOffset);
  Store(kAtomID, header.data() + kIDOffset);
  Store(childCount, header.data() + kChildCountOffset);
  mBytes.append(header.data(), header.size());
  return mBytes.size() - header.size();
}

void AtomContainer::Close(std::size_t begin) {
  Store(static_cast<UInt32>(mBytes.size() - begin), mBytes.data() + begin);
}

void AtomContainer::AddLeaf(OSType type, UInt32 number) {
  const std::size_t leaf = Open(type, 0);
  Append(number, mBytes);
  Close(leaf);
}

void AtomContainer::AddLeaf(OSType type, UInt16 number) {
  const std::size_t leaf = Open(type, 0);
  Append(number, mBytes);
  Close(leaf);
}

}  // namespace tallowmere::quicktime
