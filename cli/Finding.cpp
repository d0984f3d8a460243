#include "cli/Finding.h"

#include <cstring>
#include <utility>

#include "cli/Records.h"
#include "cli/Text.h"

namespace tallowmere::cli {
namespace {

constexpr const char* kHasNewline = "the answer has a newline; --json or --null-output prints it";
constexpr const char* kIsNew = "there is no such file or folder, only a folder for it";

// "record 3 at byte 140 of records.bin"
std::string PlaceOf(const PackedRecord& record) {
  return "record " + std::to_string(record.number) + " at byte " + std::to_string(record.byte) +
         " of " + (record.file == "-" ? "standard input" : record.file);
}

// The message for a person, who has to see which item is meant.
std::string Complaint(const Asked& asked, const std::string& message) {
  if (asked.packed != nullptr) return PlaceOf(*asked.packed) + ": " + message;
  const std::string_view item = asked.text;
  if (item.empty()) return "\"\": " + message;
  const std::size_t quoted = message.find(std::string(item) + '"');
  const bool isNamed = quoted != std::string::npos && quoted > 0 &&
                       std::strchr("\"/", message[quoted - 1]) != nullptr;
  if (!isNamed) return Shortened(item) + ": " + message;
  return std::string(message).replace(quoted, item.size(), Shortened(item));
}

}  // namespace

void Put(Json& json, const std::string& key, std::string_view bytes) {
  std::string text = Utf8OfAnyBytes(bytes);
  const bool isUtf8 = text == bytes;
  json[key] = std::move(text);
  if (!isUtf8) json[key + "_hex"] = Hex(bytes);
}

Finding Findings::Answer(const Asked& item, Outcome outcome, std::string text,
                         const std::function<void(Json&)>& fill,
                         const std::function<void(Json&)>& fillFailure) const {
  if (mFormat.isExistingOnly && outcome == Outcome::kNew) {
    return Failure(item, {outcome, kIsNew}, fillFailure);
  }
  if (mFormat.isJson) {
    Json json = Object(item, outcome);
    fill(json);
    text = json.dump();
  } else if (mFormat.OutputEnd() == '\n' && text.find('\n') != std::string::npos) {
    return Failure(item, {Outcome::kInvalid, kHasNewline});
  }
  return {outcome, false, std::move(text), {}};
}

Finding Findings::Failure(const Asked& item, const Error& error,
                          const std::function<void(Json&)>& fill) const {
  if (!mFormat.isJson) return {error.outcome, true, {}, Complaint(item, error.message)};
  Json json = Object(item, error.outcome);
  Put(json, "error", error.message);
  if (fill) fill(json);
  return {error.outcome, true, json.dump(), {}};
}

Json Findings::Object(const Asked& item, Outcome outcome) const {
  Json json;
  Put(json, mKey, item.text);
  if (item.packed != nullptr) {
    Put(json, "file", item.packed->file);
    json["byte"] = item.packed->byte;
  }
  json["status"] = Name(outcome);
  return json;
}

}  // namespace tallowmere::cli
