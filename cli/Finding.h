// What a command has found out about one item, and how it is printed: as a line, or as JSON.
#pragma once

#include <tallowmere/Conversion.h>

#include <functional>
#include <nlohmann/json.hpp>
#include <string>
#include <string_view>
#include <utility>

#include "cli/Format.h"
#include "cli/OldRecords.h"

namespace tallowmere::cli {

using Json = nlohmann::ordered_json;

// Stores bytes under a key, as text. Where they are not UTF-8, the text has U+FFFD for each invalid
// byte, and "KEY_hex" holds all bytes in hexadecimal.
void Put(Json& json, const std::string& key, std::string_view bytes);

// An item, as JSON and messages show it.
struct Asked {
  Asked(std::string_view given) : text(given) {}    // NOLINT(google-explicit-constructor)
  Asked(const std::string& given) : text(given) {}  // NOLINT(google-explicit-constructor)
  explicit Asked(const PackedRecord& record) : text(record.hex), packed(&record) {}

  std::string_view text;
  const PackedRecord* packed = nullptr;  // named by its place in the file
};

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
  Finding Answer(const Asked& item, Outcome outcome, std::string text,
                 const std::function<void(Json&)>& fill,
                 const std::function<void(Json&)>& fillFailure = {}) const;

  // No answer: the reason becomes a complaint, or in JSON part of the item's object, with what
  // `fill` adds.
  Finding Failure(const Asked& item, const Error& error,
                  const std::function<void(Json&)>& fill = {}) const;

 private:
  Json Object(const Asked& item, Outcome outcome) const;

  Format mFormat;
  std::string mKey;
};

}  // namespace tallowmere::cli
