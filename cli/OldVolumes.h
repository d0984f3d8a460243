// Where the volumes of another machine are here: mounted again under another number, or copied into
// a folder.
#pragma once

#include <tallowmere/Client.h>
#include <tallowmere/Result.h>

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <string_view>
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

// Reads a table. Fails at the first line that is none of it, and for what is told twice.
Result<std::vector<OldPlace>> ReadTable(const std::string& file);

// Which volume the records of another machine are of now.
class OldNumbers {
 public:
  // Fails where `volume` is none, and for a table that cannot be read.
  static Result<OldNumbers> Read(Client& client, const OldPlaces& places);

  // The record as it is here. A record of a volume's root folder gets its name, too. Fails for a
  // number that the table lacks, or whose place is no volume's.
  Result<FSSpec> Here(FSSpec record) const;

  // Whether volumes are told at all.
  bool AreTold() const { return mAll || mIsTable; }

 private:
  struct Known {
    std::int16_t number;
    std::string name;
  };

  std::optional<Known> mAll;
  bool mIsTable = false;
  std::map<std::string, Result<Known>> mKnown;  // by number as text, or by name in Mac Roman
};

// The folders into which volumes were copied, by the names that those had.
class CopiedVolumes {
 public:
  // Fails for a map without '=' and for one whose place is no folder.
  static Result<CopiedVolumes> Read(const OldPlaces& places);

  // The item that an HFS path in Mac Roman names, where its volume was copied. Nullopt where it was
  // not.
  struct InCopy {
    std::string folder;              // canonical
    std::vector<std::string> names;  // on the way from it, in Mac Roman; none for the folder itself
  };
  std::optional<InCopy> Find(std::string_view hfsPath) const;

 private:
  std::map<std::string, std::string> mFolders;  // by volume's name in Mac Roman
};

// The path of an item of a copy that exists. Each name is looked up as an HFS name, precomposed or
// as the one entry whose HFS form is the same; links on the way are not followed, so that nothing
// outside the copy is found. kInvalid for a way that climbs.
Result<std::string> PathInCopy(const CopiedVolumes::InCopy& copy);

}  // namespace tallowmere::cli
