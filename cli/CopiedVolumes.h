// The volumes of another machine that were copied into folders here.
#pragma once

#include <tallowmere/Conversion.h>

#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "cli/OldVolumes.h"

namespace tallowmere::cli {

class CopiedVolumes {
 public:
  // Fails for a table that cannot be read, for a map whose folder is not there, and for a volume
  // with two places. REQUIRES: each map is an OLD-NAME=FOLDER.
  static Result<CopiedVolumes> Read(const OldPlaces& places);

  // The folder of the volume that had a name, in UTF-8. Nullopt where it was not copied, an error
  // where the table tells a folder that is not there.
  std::optional<Result<std::string>> FolderOf(const std::string& volume) const;

  // The path of the item with an HFS path, in Mac Roman; also of a new one in an existing folder.
  // Nullopt where its volume was not copied.
  std::optional<Conversion<std::string>> PathOfHFSPath(std::string_view hfsPath) const;

 private:
  std::map<std::string, Result<std::string>> mFolders;  // by the volume's name, see KeyOfVolume
};

// The path of an item of a copy, by the Linux names on the way to it from the copy's folder; none
// for that folder itself. Each name is looked up
//
//   1. as it is
//   2. with its accents composed or decomposed
//   3. as its Mac Roman bytes, which a volume that is mounted without a code page has
//
// Links on the way are not followed, so that nothing outside the copy is found.
Conversion<std::string> PathInCopy(const std::string& folder,
                                   const std::vector<std::string>& names);

}  // namespace tallowmere::cli
