// Where the volumes of another machine are here, as a person tells it, and which of the mounted
// ones their records are of.
#pragma once

#include <tallowmere/Client.h>
#include <tallowmere/Result.h>

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "cli/OldRecords.h"

namespace tallowmere::cli {

// How a person tells it; all may be empty.
struct OldPlaces {
  std::string volume;             // that all records are of: a mount point, or a name
  std::string table;              // a file with lines OLD-NUMBER-OR-NAME=PLACE, '#' for comments
  std::vector<std::string> maps;  // OLD-NAME=FOLDER
};

// A line of a table, or a map.
struct OldPlace {
  std::string old;    // number or name, in UTF-8
  std::string place;  // mount point, name of a volume, or folder
};

// Nullopt for a text that is no OLD=PLACE.
std::optional<OldPlace> ReadPlace(const std::string& text);

// The key of a volume: its name in Mac Roman, as records and HFS paths have it. A text outside Mac
// Roman, or a number, stays as it is.
std::string KeyOfVolume(const std::string& old);

// Reads a table. Fails at the first line that is malformed or tells a volume a second time.
Result<std::vector<OldPlace>> ReadTable(const std::string& file);

// Which volume the records of another machine are of now.
class OldNumbers {
 public:
  // Fails where `volume` is none, and for a table that cannot be read.
  static Result<OldNumbers> Read(Client& client, const OldPlaces& places);

  // The record as it is here. A record of a volume's root folder gets its name, too. Fails for a
  // number that the table lacks, or whose place is no volume's.
  Result<FSSpec> Here(FSSpec record) const;

  // Whether the volume of a record is told.
  bool AreToldFor(const FSSpec& record) const;

 private:
  struct Known {
    std::int16_t number;
    std::string name;
  };

  // Null where the table has none.
  const Result<Known>* KnownOf(const FSSpec& record) const;

  std::optional<Known> mAll;
  bool mIsTable = false;
  std::map<std::string, Result<Known>> mKnown;  // by number as text, or by name in Mac Roman
};

}  // namespace tallowmere::cli
