// Finds the alias in bytes by what they are: a record or bookmark alone, or a file that has one in
// it.
#pragma once

#include <cstdint>
#include <optional>
#include <string_view>
#include <variant>

#include "formats/AliasRecord.h"
#include "formats/Bookmark.h"

namespace tallowmere::formats {

using AliasContent = std::variant<AliasRecord, Bookmark>;

enum class Container : std::uint8_t {
  kNone,          // a record or bookmark alone
  kBookmarkFile,  // the data of an alias file
  kResourceFork,
  kAppleDouble,  // AppleSingle too
  kMacBinary,
};

struct RecognizedAlias {
  Container container;
  std::optional<AliasContent> content;  // nullopt when it is broken
};

// Nullopt for bytes in which no alias is. Whatever Finder flags say counts for nothing here.
std::optional<RecognizedAlias> RecognizeAlias(std::string_view bytes);

// The alias in a resource fork: its resource of type 'alis' with id 0, else with the lowest.
// Nullopt when it has none; a fork whose map does not fit has none either.
std::optional<RecognizedAlias> RecognizeAliasInFork(std::string_view fork);

}  // namespace tallowmere::formats
