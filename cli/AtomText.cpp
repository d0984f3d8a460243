#include "cli/AtomText.h"

#include <iomanip>
#include <sstream>

#include "cli/Text.h"

namespace tallowmere::cli {
namespace {

constexpr std::size_t kContainerHead = 12;  // ten zero bytes and a lock count
constexpr std::size_t kAtomHead = 20;
constexpr std::size_t kCodeLength = 4;
constexpr std::size_t kDeepest = 16;
constexpr int kDigitsOfARate = 10;  // five before the point, and all that 16 bits can express

// A leaf's data, as text that suits its type.
std::string Value(std::string_view type, std::string_view data) {
  if (type == "ssct") return std::string(data);
  const std::uint32_t number = BigEndian(data);
  if (type != "ssrt") return std::to_string(number);
  std::ostringstream hertz;
  hertz << std::setprecision(kDigitsOfARate) << number / kFixedOne;
  return hertz.str();
}

// Appends the atoms in `atoms` and their contents; returns false when they are malformed.
bool AppendAtoms(std::string_view atoms, std::size_t depth, std::string& text) {
  if (depth == kDeepest) return false;
  while (!atoms.empty()) {
    if (atoms.size() < kAtomHead) return false;
    const std::size_t size = BigEndian(atoms.substr(0, 4));
    if (size < kAtomHead || size > atoms.size()) return false;
    const std::string_view type = atoms.substr(4, kCodeLength);
    const bool hasChildren = BigEndian(atoms.substr(14, 2)) > 0;
    const std::string_view content = atoms.substr(kAtomHead, size - kAtomHead);
    text.append(2 * depth, ' ').append(Printable(type));
    if (!hasChildren) text.append("  ").append(Printable(Value(type, content)));
    text.push_back('\n');
    if (hasChildren && !AppendAtoms(content, depth + 1, text)) return false;
    atoms.remove_prefix(size);
  }
  return true;
}

}  // namespace

std::uint32_t BigEndian(std::string_view bytes) {
  std::uint32_t number = 0;
  for (const char byte : bytes) number = number << 8 | static_cast<unsigned char>(byte);
  return number;
}

std::optional<std::string> TextOfAtoms(std::string_view container) {
  std::string text;
  if (container.size() < kContainerHead) return std::nullopt;
  if (!AppendAtoms(container.substr(kContainerHead), 0, text)) return std::nullopt;
  return text;
}

}  // namespace tallowmere::cli
