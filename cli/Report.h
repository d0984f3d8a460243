// A command's findings about its items, printed as text or as JSON: one line for each item, or with
// --null-output one NUL-terminated text, in the items' order. In text, what failed is an empty one.
#pragma once

#include <functional>
#include <nlohmann/json.hpp>
#include <optional>
#include <string>
#include <string_view>

#include "cli/ProgressBar.h"

namespace tallowmere::cli {

using Json = nlohmann::ordered_json;

struct Format {
  bool isJson = false;
  bool hasNullInput = false;   // items on standard input end with a NUL
  bool hasNullOutput = false;  // results end with a NUL, unless they are JSON
  bool isQuiet = false;        // neither a progress bar nor a summary
  bool hasNoProgress = false;  // no progress bar

  char InputEnd() const { return hasNullInput ? '\0' : '\n'; }
  char OutputEnd() const { return hasNullOutput && !isJson ? '\0' : '\n'; }
};

// Stores bytes under a key, as text. Where they are not UTF-8, the text has U+FFFD for each invalid
// byte, and "KEY_hex" holds all bytes in hexadecimal.
void Put(Json& json, const std::string& key, std::string_view bytes);

class Report {
 public:
  // `key` is that of the item itself in JSON.
  Report(Format format, std::string key);

  // Reports the answer for `item`: `text`, or in JSON what `fill` adds to the item's object. A text
  // with a newline fails where results end with one.
  void Answer(std::string_view item, std::string_view text, const std::function<void(Json&)>& fill);

  // Reports that `item` has no answer: the reason goes to standard error, or into its JSON object.
  void Fail(std::string_view item, std::string_view reason);

  // The same on standard error alone, for answers that are not printed one by one.
  void TellFailure(std::string_view item, std::string_view reason);

  // Shows the progress, unless the answers themselves show it.
  void ShowProgress(std::optional<double> done);

  // Whether the output can still be written.
  bool GoesOn() const;

  // Returns the program's exit status once everything has been printed.
  int Finish();

 private:
  void Print(std::string_view text) const;

  Format mFormat;
  std::string mKey;
  bool mOutputIsTerminal;
  ProgressBar mBar;
  std::size_t mItems = 0;
  int mStatus = 0;
};

}  // namespace tallowmere::cli
