// How a command's items are read and its findings printed.
#pragma once

namespace tallowmere::cli {

struct Format {
  bool isJson = false;
  bool hasNullInput = false;    // items on standard input end with a NUL
  bool hasNullOutput = false;   // results end with a NUL, unless they are JSON
  bool isExistingOnly = false;  // a new item is a failure
  bool isQuiet = false;         // neither a progress bar nor a summary
  bool hasNoProgress = false;   // no progress bar

  char InputEnd() const { return hasNullInput ? '\0' : '\n'; }
  char OutputEnd() const { return hasNullOutput && !isJson ? '\0' : '\n'; }
  bool HasProgress() const { return !isQuiet && !hasNoProgress; }
};

}  // namespace tallowmere::cli
