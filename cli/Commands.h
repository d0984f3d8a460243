// The subcommands of tallowmere-cli. Each gives the program's exit status: 0, or 1 when something
// could not be answered, with the reason on standard error.
#pragma once

#include <tallowmere/Client.h>

#include <cstdint>
#include <string>
#include <vector>

namespace tallowmere::cli {

// Prints number, name and mount point of every volume of this machine.
int PrintVolumes(const ClientOptions& options);

// Prints the record of each path, its full HFS path and the path to which the record leads.
int PrintIdentities(const ClientOptions& options, const std::vector<std::string>& paths);

// A sound in the words of a person.
struct Sound {
  double hertz = 44100;  // 0 to 65535
  std::uint16_t bits = 16;
  unsigned channels = 2;        // 0 to 255
  std::string format = "twos";  // four characters
};

// Prints the settings with which such a sound is exported to AIFF files, as a tree of atoms.
int PrintExportSettings(const ClientOptions& options, const Sound& sound);

// Asks one service for the record of every item of a folder, and another for the path of every
// record. Prints each item that does not come back, each folder that is left out and the figures;
// 1 when an item did not come back. What vanishes meanwhile does not count.
int TakeCensus(ClientOptions options, const std::string& folder);

}  // namespace tallowmere::cli
