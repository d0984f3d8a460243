// The subcommand alias: what alias files, records and bookmarks say, and where they lead now. It
// asks no service: the protocol has no request for it.
#pragma once

#include <string>
#include <vector>

namespace tallowmere::cli {

struct AliasesToShow {
  std::vector<std::string> items;  // arguments; a single "-" stands for those on standard input
  bool areHex = false;  // bytes as hexadecimal digits, with any blanks between; else files
  bool isJson = false;
  char separator = '\n';  // of items on standard input
};

// Prints each, and with more than one a line with counts on standard error. Returns 1 when one of
// them is none or its target is not found.
int PrintAliases(const AliasesToShow& aliases);

}  // namespace tallowmere::cli
