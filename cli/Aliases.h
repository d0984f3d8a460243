// The subcommand alias: what alias files, records and bookmarks say, and where they lead now. It
// asks no service: the protocol has no request for it.
#pragma once

#include <string>
#include <vector>

#include "cli/Format.h"

namespace tallowmere::cli {

// Prints each item that the arguments name: alias files or, if `areHex`, bytes as hexadecimal
// digits with any blanks between. A single "-" stands for the items on standard input. With more
// than one, prints counts on standard error unless the format is quiet. Returns 1 when one of them
// is no alias, or its target is not found.
int PrintAliases(const std::vector<std::string>& arguments, const Format& format, bool areHex);

}  // namespace tallowmere::cli
