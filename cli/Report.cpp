#include "cli/Report.h"

#include <unistd.h>

#include <algorithm>
#include <iostream>
#include <utility>

#include "cli/Output.h"
#include "cli/Records.h"
#include "cli/Text.h"

namespace tallowmere::cli {
namespace {

constexpr const char* kHasNewline = "the answer has a newline; --json or --null-output prints it";

}  // namespace

void Put(Json& json, const std::string& key, std::string_view bytes) {
  std::string text = Utf8OfAnyBytes(bytes);
  const bool isUtf8 = text == bytes;
  json[key] = std::move(text);
  if (!isUtf8) json[key + "_hex"] = Hex(bytes);
}

Report::Report(Format format, std::string key)
    : mFormat(format),
      mKey(std::move(key)),
      mOutputIsTerminal(isatty(STDOUT_FILENO) == 1),
      mBar(!format.isQuiet && !format.hasNoProgress) {}

void Report::Answer(std::string_view item, std::string_view text,
                    const std::function<void(Json&)>& fill) {
  if (!mFormat.isJson) {
    const bool isLines = mFormat.OutputEnd() == '\n';
    return isLines && text.find('\n') != text.npos ? Fail(item, kHasNewline) : Print(text);
  }
  Json json;
  Put(json, mKey, item);
  fill(json);
  Print(json.dump());
}

void Report::Fail(std::string_view item, std::string_view reason) {
  if (!mFormat.isJson) {
    TellFailure(item, reason);
    return Print("");
  }
  mStatus = kFailed;
  mBar.Hide();
  Json json;
  Put(json, mKey, item);
  Put(json, "error", reason);
  Print(json.dump());
}

void Report::TellFailure(std::string_view item, std::string_view reason) {
  mStatus = kFailed;
  mBar.Hide();
  Complain(Quoted(item).append(": ").append(reason));
}

void Report::ShowProgress(std::optional<double> done) {
  ++mItems;
  if (!mOutputIsTerminal) mBar.Show(done, std::to_string(mItems) + " items");
}

bool Report::GoesOn() const {
  return std::cout.good();
}

int Report::Finish() {
  mBar.Hide();
  return FinishOutput(mStatus);
}

void Report::Print(std::string_view text) const {
  if (mOutputIsTerminal && !mFormat.isJson) {
    std::cout << Printable(text);
  } else {
    std::cout << text;
  }
  std::cout << mFormat.OutputEnd();
}

}  // namespace tallowmere::cli
