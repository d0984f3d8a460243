// What a command has found out about one item, and how it is printed: as a line, or as JSON.
#pragma once

#include <tallowmere/Conversion.h>

#include <functional>
#include <nlohmann/json.hpp>
#include <string>
#include <string_view>
#include <utility>

#include "cli/Format.h"

namespace tallowmere::cli {

using Json = nlohmann::ordered_json;

// Stores bytes under a key, as text. Where they are not UTF-8, the text has U+FFFD for each invalid
// byte, and "KEY_hex" holds all bytes in hexadecimal.
void Put(Json& json, const std::string& key, std::string_view bytes);

struct Finding {
  Outcome outcome{};
  bool isFailure = false;
  std::string text;       // to be printed; empty for what failed, unless it is JSON
  std::string complaint;  // for standard error; empty when there is none
};

// Makes findings; many threads may use one.
class Findings {
 public:
  // `key` is that of the item itself in JSON.
  Findings(const Format& format, std::string key) : mFormat(format), mKey(std::move(key)) {}

  // An answer: `text`, or in JSON what `fill` adds to the item's object. A new item fails where
  // only those are wanted that exist (`fillFailure` as for Failure), and a text with a newline
  // where results end with one.
  Finding Answer(std::string_view item, Outcome outcome, std::string text,
                 const std::function<void(Json&)>& fill,
                 const std::function<void(Json&)>& fillFailure = {}) const;

  // That there is none: the reason is a complaint, or in JSON part of the item's object, with what
  // `fill` adds.
  Finding Failure(std::string_view item, const Error& error,
                  const std::function<void(Json&)>& fill = {}) const;

 private:
  Json Object(std::string_view item, Outcome outcome) const;

  Format mFormat;
  std::string mKey;
};

}  // namespace tallowmere::cli
