// The subcommand alias: what alias files, records and bookmarks say, and where they lead now. It
// asks no service: the protocol has no request for it.
#pragma once

#include <string>
#include <vector>

#include "cli/Format.h"
#include "cli/OldVolumes.h"

namespace tallowmere::cli {

struct AliasOptions {
  bool areHex = false;       // items are bytes as hexadecimal digits, with any blanks between
  bool targetsOnly = false;  // a line for each item: where it leads
  OldPlaces places;          // of volumes that were copied
};

// Prints each item that the arguments name; a single "-" stands for the items on standard input.
// Text is a block of lines for each alias, and an empty line for what is none. Returns 1 when one
// of them is no alias, or its target is not found.
int PrintAliases(const std::vector<std::string>& arguments, const Format& format,
                 const AliasOptions& options);

}  // namespace tallowmere::cli
