// The subcommands of tallowmere-cli. Each gives the program's exit status: 0, or 1 when something
// could not be answered, with the reason on standard error.
#pragma once

#include <tallowmere/Client.h>

#include <cstdint>
#include <string>
#include <vector>

#include "cli/Report.h"

namespace tallowmere::cli {

// The items of a command and how they are asked about.
struct ItemsToAsk {
  ClientOptions client;
  Format format;
  std::vector<std::string> items;  // arguments; "-" alone stands for those of standard input
};

// Number, name and mount point of every volume of this machine.
int PrintVolumes(const ClientOptions& options, bool isJson);

// The record of each path, its full HFS path and the path to which the record leads, as a table.
int PrintIdentities(const ItemsToAsk& paths);

// The record of each path, as text or in hexadecimal.
int PrintRecords(const ItemsToAsk& items, bool asHex);

// The path of each record.
int PrintPathsOfRecords(const ItemsToAsk& items, bool searchOtherVolumes);

// The full HFS path of each path, as UTF-8.
int PrintHFSPaths(const ItemsToAsk& items);

// The path of each HFS path, given as UTF-8.
int PrintPathsOfHFSPaths(const ItemsToAsk& items);

// The HFS name of each path, as UTF-8.
int PrintNames(const ItemsToAsk& items);

// The path of the item with each HFS name, given as UTF-8, in a folder.
int PrintPathsOfNames(const ItemsToAsk& items, const std::string& folder);

// A sound in the words of a person.
struct Sound {
  double hertz = 44100;  // IsRate
  std::uint16_t bits = 16;
  unsigned channels = 2;        // 0 to 255
  std::string format = "twos";  // four characters
};

// Whether that many hertz, as hertz × 65536, have 32 bits.
bool IsRate(double hertz);

// REQUIRES: the sound is within its ranges.
SoundFormat FormatOf(const Sound& sound);

// The settings with which such a sound is exported to AIFF files: as a tree of atoms, or as they
// are into the file `output`, "-" for standard output.
int PrintExportSettings(const ClientOptions& options, const Sound& sound, bool isJson,
                        const std::string& output);

// Asks one service for the record of every item of a folder, and another for the path of every
// record. Prints each item that does not come back, each folder that is left out and the figures;
// 1 when an item did not come back. What vanishes meanwhile does not count.
int TakeCensus(const ClientOptions& options, bool isJson, const std::string& folder);

// Starts the service and tries each request on the volume of "/", up to the first that fails.
int CheckService(const ClientOptions& options, bool isJson);

}  // namespace tallowmere::cli
