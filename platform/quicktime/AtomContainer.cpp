#include "quicktime/AtomContainer.h"

#include "quicktime/FourCharacterCode.h"

namespace tallowmere::quicktime {
namespace {

constexpr OSType kRootType = FourCharacterCode("sean");
constexpr UInt32 kAtomID = 1;
constexpr std::size_t kHeaderSize = 20;
constexpr std::size_t kReservedBeforeLockCount = 10;
constexpr UInt16 kLockCount = 0;

std::string Atom(OSType type, std::size_t childCount, std::string_view content) {
  std::string atom;
  atom.reserve(kHeaderSize + content.size());
  atom += BigEndian(static_cast<UInt32>(kHeaderSize + content.size()));
  atom += BigEndian(type);
  atom += BigEndian(kAtomID);
  atom += BigEndian(UInt16{0});
  atom += BigEndian(static_cast<UInt16>(childCount));
  atom += BigEndian(UInt32{0});
  return atom.append(content);
}

}  // namespace

std::string BigEndian(UInt16 number) {
  return {static_cast<char>(number >> 8), static_cast<char>(number)};
}

std::string BigEndian(UInt32 number) {
  return {static_cast<char>(number >> 24), static_cast<char>(number >> 16),
          static_cast<char>(number >> 8), static_cast<char>(number)};
}

std::string Leaf(OSType type, std::string_view data) {
  return Atom(type, 0, data);
}

std::string Parent(OSType type, std::initializer_list<std::string_view> children) {
  std::string content;
  for (const std::string_view child : children) content += child;
  return Atom(type, children.size(), content);
}

std::string AtomContainer(std::initializer_list<std::string_view> children) {
  return std::string(kReservedBeforeLockCount, '\0') + BigEndian(kLockCount) +
         Parent(kRootType, children);
}

}  // namespace tallowmere::quicktime
