// The subcommands of tallowmere-cli. Each returns the program's exit status: 0, or 1 when a
// question was not answered, with the reason on standard error.
#pragma once

#include <tallowmere/Client.h>

#include <cstdint>
#include <string>
#include <vector>

#include "cli/Format.h"
#include "cli/OldRecords.h"
#include "cli/OldVolumes.h"

namespace tallowmere::cli {

// The items of a command and how to ask about them.
struct ItemsToAsk {
  ClientOptions client;
  Format format;
  std::vector<std::string> items;  // arguments; a single "-" stands for those on standard input
};

// Prints number, name and mount point of every volume of this machine.
int PrintVolumes(const ClientOptions& options, bool isJson);

// Prints a table with each path's record, full HFS path and the path that its record leads to.
int PrintIdentities(const ItemsToAsk& paths);

// Prints the record of each path, as text or in hexadecimal.
int PrintRecords(const ItemsToAsk& items, bool asHex);

// How records were stored, and where the volumes that they name are now.
struct RecordOptions {
  RecordForm form;
  OldPlaces places;
  bool searchOtherVolumes = false;
};

// Prints the path of each record.
int PrintPathsOfRecords(const ItemsToAsk& items, const RecordOptions& options);

// Prints the full HFS path of each path, as UTF-8.
int PrintHFSPaths(const ItemsToAsk& items);

// Prints the path of each HFS path, given as UTF-8; that of a volume that was copied, in the copy.
int PrintPathsOfHFSPaths(const ItemsToAsk& items, const OldPlaces& places);

// Prints the HFS name of each path, as UTF-8.
int PrintNames(const ItemsToAsk& items);

// Prints the path of the item with each HFS name, given as UTF-8, in a folder.
int PrintPathsOfNames(const ItemsToAsk& items, const std::string& folder);

// A sound format as a person gives it.
struct Sound {
  double hertz = 44100;  // IsRate(hertz) holds
  std::uint16_t bits = 16;
  unsigned channels = 2;        // 0 to 255
  std::string format = "twos";  // four characters
};

// Whether a rate in hertz fits into 32 bits as hertz × 65536.
bool IsRate(double hertz);

// REQUIRES: every field is within its range.
SoundFormat FormatOf(const Sound& sound);

// Prints the settings for exporting such a sound to AIFF files, as a tree of atoms, or writes them
// as they are to the file `output`, "-" for standard output.
int PrintExportSettings(const ClientOptions& options, const Sound& sound, bool isJson,
                        const std::string& output);

// Asks one service for the record of every item in a folder, and another for the path of every
// record. Prints each item that does not come back, each folder that is left out, and the totals.
// Returns 1 when an item did not come back; items that vanish meanwhile do not count.
int TakeCensus(const ClientOptions& options, const Format& format, const std::string& folder);

// Starts the service and tries each request on the volume of "/", stopping at the first that fails.
int CheckService(const ClientOptions& options, bool isJson);

}  // namespace tallowmere::cli
