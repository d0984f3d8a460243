// A command's findings about its items, printed as text or as JSON: one line for each item, or with
// --null one NUL-terminated text, in the items' order.
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
  bool isNullTerminated = false;

  char Separator() const { return isNullTerminated ? '\0' : '\n'; }
};

// Stores bytes under a key, as text. Where they are not UTF-8, the text has U+FFFD for each invalid
// byte, and "KEY_hex" holds all bytes in hexadecimal.
void Put(Json& json, const std::string& key, std::string_view bytes);

class Report {
 public:
  // `key` is that of the item itself in JSON.
  Report(Format format, std::string key);

  // Reports the answer for `item`: `text`, or in JSON what `fill` adds to the item's object.
  void Answer(std::string_view item, std::string_view text, const std::function<void(Json&)>& fill);

  // Reports that `item` has no answer: the reason goes to standard error, or into its JSON object.
  void Fail(std::string_view item, std::string_view reason);

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
