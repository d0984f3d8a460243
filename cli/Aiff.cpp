#include <MacTypes.h>

#include <cerrno>
#include <cmath>
#include <fstream>
#include <iomanip>
#include <iostream>
#include <limits>
#include <sstream>
#include <string_view>
#include <system_error>

#include "cli/Commands.h"
#include "cli/Output.h"
#include "cli/Records.h"
#include "cli/Text.h"

namespace tallowmere::cli {
namespace {

constexpr std::size_t kContainerHead = 12;  // ten zero bytes and a lock count
constexpr std::size_t kAtomHead = 20;
constexpr std::size_t kCodeLength = 4;
constexpr double kFixedOne = 65536;
constexpr int kDigitsOfARate = 10;  // five before the point and what 16 bits can tell

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
  hertz << std::setprecision(kDigitsOfARate) << number / kFixedOne;
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

std::string WhyRefused(int result) {
  switch (result) {
    case paramErr:
      return "a sound has channels, a rate, and bits in a sample unless it is compressed";
    case badFormat:
      return "no AIFF file can hold this format";
    default:
      return "the exporter refuses this sound, result " + std::to_string(result);
  }
}

bool PrintContainer(std::string_view container) {
  return container.size() >= kContainerHead && PrintAtoms(container.substr(kContainerHead), 0);
}

void PrintAsJson(const Sound& sound, std::string_view settings) {
  Json json;
  json["rate"] = sound.hertz;
  json["bits"] = sound.bits;
  json["channels"] = sound.channels;
  Put(json, "format", sound.format);
  json["settings"] = Hex(settings);
  std::cout << json.dump() << '\n';
}

int Store(const std::string& bytes, const std::string& path) {
  std::ofstream file(path, std::ios::binary);
  if (!file) return Complain(path + ": " + std::generic_category().message(errno));
  return file.write(bytes.data(), static_cast<std::streamsize>(bytes.size())).flush()
             ? 0
             : Complain(path + ": it could not be written");
}

}  // namespace

bool IsRate(double hertz) {
  return hertz >= 0 && std::round(hertz * kFixedOne) <= std::numeric_limits<std::uint32_t>::max();
}

SoundFormat FormatOf(const Sound& sound) {
  return {static_cast<std::uint32_t>(std::lround(sound.hertz * kFixedOne)), sound.bits,
          static_cast<std::uint8_t>(sound.channels), BigEndian(sound.format)};
}

int PrintExportSettings(const ClientOptions& options, const Sound& sound, bool isJson,
                        const std::string& output) {
  Client client(options);
  const auto settings = client.GetAIFFExportSettings(FormatOf(sound));
  if (!settings) return Complain(settings.Failure().message);
  if (settings->result != 0) return Complain(WhyRefused(settings->result));
  if (!output.empty() && output != "-") return Store(settings->bytes, output);
  if (!output.empty()) {
    std::cout << settings->bytes;
  } else if (isJson) {
    PrintAsJson(sound, settings->bytes);
  } else if (!PrintContainer(settings->bytes)) {
    return Complain("the settings are no atom container");
  }
  return FinishOutput();
}

}  // namespace tallowmere::cli
