// What a command has found out of its items, printed as text or as JSON: one line, or with --null
// one NUL-terminated text, for each item, in their order.
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

// Puts bytes under a key: as text, and where they are no UTF-8 with U+FFFD for the bytes that are
// none and all of them in hexadecimal under "KEY_hex".
void Put(Json& json, const std::string& key, std::string_view bytes);

class Report {
 public:
  // `key` is that of the item itself in JSON.
  Report(Format format, std::string key);

  // `item` has an answer: `text`, or what `fill` puts behind the item.
  void Answer(std::string_view item, std::string_view text, const std::function<void(Json&)>& fill);

  // `item` has none: the reason goes to standard error, or into its JSON object.
  void Fail(std::string_view item, std::string_view reason);

  // Shows how far the work has come, where the answers themselves do not.
  void ShowProgress(std::optional<double> done);

  // Whether the output can be written.
  bool GoesOn() const;

  // The program's exit status when all has been printed.
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
