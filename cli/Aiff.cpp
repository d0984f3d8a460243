#include <MacTypes.h>

#include <cerrno>
#include <cmath>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <limits>
#include <system_error>

#include "cli/AtomText.h"
#include "cli/Commands.h"
#include "cli/Finding.h"
#include "cli/Output.h"
#include "cli/Records.h"

namespace tallowmere::cli {
namespace {

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

void PrintAsJson(const Sound& sound, std::string_view settings) {
  Json json;
  json["rate"] = sound.hertz;
  json["bits"] = sound.bits;
  json["channels"] = sound.channels;
  Put(json, "format", sound.format);
  json["settings"] = Hex(settings);
  std::cout << json.dump() << '\n';
}

// Removes a file that could not be written whole; leaves devices and the like.
int Store(const std::string& bytes, const std::string& path) {
  std::ofstream file(path, std::ios::binary);
  if (!file) return Complain(path + ": " + std::generic_category().message(errno));
  if (file.write(bytes.data(), static_cast<std::streamsize>(bytes.size())).flush()) return 0;
  std::error_code none;
  if (std::filesystem::is_regular_file(path, none)) std::filesystem::remove(path, none);
  return Complain(path + ": it could not be written");
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
  } else {
    const auto text = TextOfAtoms(settings->bytes);
    if (!text) return Complain("the settings are no atom container");
    std::cout << *text;
  }
  return FinishOutput();
}

}  // namespace tallowmere::cli
