#include <cmath>
#include <iostream>
#include <sstream>
#include <string_view>

#include "cli/Commands.h"
#include "cli/Output.h"
#include "cli/Text.h"

namespace tallowmere::cli {
namespace {

constexpr std::size_t kContainerHead = 12;  // ten zero bytes and a lock count
constexpr std::size_t kAtomHead = 20;
constexpr std::size_t kCodeLength = 4;
constexpr double kFixedOne = 65536;

std::uint32_t BigEndian(std::string_view bytes) {
  std::uint32_t number = 0;
  for (const char byte : bytes) number = number << 8 | static_cast<unsigned char>(byte);
  return number;
}

// A leaf's data in the words of its kind.
std::string Value(std::string_view type, std::string_view data) {
  if (type == "ssct") return std::string(data);
  const std::uint32_t number = BigEndian(data);
  if (type != "ssrt") return std::to_string(number);
  std::ostringstream hertz;
  hertz << number / kFixedOne;
  return hertz.str();
}

// Prints the atoms in `atoms` and what is in them; false where they are not well formed.
bool PrintAtoms(std::string_view atoms, std::size_t depth) {
  while (!atoms.empty()) {
    if (atoms.size() < kAtomHead) return false;
    const std::size_t size = BigEndian(atoms.substr(0, 4));
    if (size < kAtomHead || size > atoms.size()) return false;
    const std::string_view type = atoms.substr(4, kCodeLength);
    const bool hasChildren = BigEndian(atoms.substr(14, 2)) > 0;
    const std::string_view content = atoms.substr(kAtomHead, size - kAtomHead);
    std::cout << std::string(2 * depth, ' ') << Printable(type);
    if (!hasChildren) std::cout << "  " << Printable(Value(type, content));
    std::cout << '\n';
    if (hasChildren && !PrintAtoms(content, depth + 1)) return false;
    atoms.remove_prefix(size);
  }
  return true;
}

}  // namespace

int PrintExportSettings(const ClientOptions& options, const Sound& sound) {
  Client client(options);
  const auto settings = client.GetAIFFExportSettings(
      {static_cast<std::uint32_t>(std::lround(sound.hertz * kFixedOne)), sound.bits,
       static_cast<std::uint8_t>(sound.channels), BigEndian(sound.format)});
  if (!settings) return Complain(settings.Failure().message);
  if (settings->result != 0) {
    return Complain("the exporter refuses this sound: " + std::to_string(settings->result));
  }
  const std::string_view container = settings->bytes;
  if (container.size() < kContainerHead || !PrintAtoms(container.substr(kContainerHead), 0)) {
    return Complain("the settings are no atom container");
  }
  return FinishOutput();
}

}  // namespace tallowmere::cli
