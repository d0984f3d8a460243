// What an alias says of its target, whether it is a record or a bookmark: all that a search for it
// goes by. Pure.
//
// Names in 8 bits come without their encoding. They are read as Mac Roman, and where they are valid
// UTF-8 as that too: each reading is searched for, and two that find different items find nothing.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "formats/Recognition.h"
#include "kernel/Item.h"

namespace tallowmere::aliases {

// Which kinds of items the target can be.
struct Kinds {
  bool file = false;
  bool folder = false;
  bool link = false;

  bool Admit(const kernel::Item& item) const;
};

// A path within a volume by its components: Linux names, or HFS names in Mac Roman.
struct Way {
  enum class Spelling : std::uint8_t { kLinux, kHFS };

  Spelling spelling = Spelling::kLinux;
  std::vector<std::string> components;  // none for the volume's root folder
};

// From the folder of the alias file up to the common folder and down to the target; 1 and 1 is the
// same folder.
struct Levels {
  std::size_t up;
  std::size_t down;
};

// When the target was created.
struct Creation {
  std::int64_t seconds;  // since 1970
  bool isInUTC;          // else in UTC or in the writer's time
};

// The catalog's own numbers, of HFS and HFS+ alone.
struct CatalogIDs {
  std::optional<std::uint32_t> target;
  std::optional<std::uint32_t> parent;
  Creation creation;
};

struct Target {
  Kinds kinds;
  std::vector<std::u16string> volumeNames;  // readings, in HFS form
  std::vector<Way> names;                   // readings of the target's name, one component each
  std::vector<Way> ways;                    // readings; none where no path is known
  std::optional<Levels> levels;             // for the last components of the ways
  std::optional<CatalogIDs> ids;            // none without a date that proves them
  bool isOnHFSPlus = false;                 // the volume
};

Target TargetOf(const formats::AliasRecord& record);
Target TargetOf(const formats::Bookmark& bookmark);
Target TargetOf(const formats::AliasContent& content);

// Whether an item born then, in seconds since 1970, is the one that was created: in the same
// second, or where the time zone is not known different by whole quarters of an hour, at most 14
// hours.
bool IsBirthOf(const Creation& creation, std::int64_t birthSeconds);

// The Linux names that a component of a way with that spelling can have besides its own bytes: with
// its letters and marks composed and decomposed, where that is different.
std::vector<std::string> OtherFormsOf(std::string_view linuxName);

}  // namespace tallowmere::aliases
