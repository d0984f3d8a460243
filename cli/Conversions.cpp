#include <utility>

#include "cli/Commands.h"
#include "cli/Conversion.h"
#include "cli/Records.h"
#include "cli/Text.h"

namespace tallowmere::cli {
namespace {

constexpr const char* kPathKey = "path";

// The handler that writes down what `answer` makes of the conversion's value, or why there is none.
template <class Value, class Answer>
auto Tell(const Findings& findings, const std::string& item, Finding& finding, Answer answer) {
  return [&findings, &item, &finding, answer](const Conversion<Value>& result) {
    finding = result ? answer(findings, item, *result) : findings.Failure(item, result.Failure());
  };
}

// The handler for answers that are paths.
auto TellPath(const Findings& findings, const std::string& item, Finding& finding) {
  return Tell<std::string>(
      findings, item, finding, [](const auto& all, const auto& asked, const auto& path) {
        return all.Answer(asked, path.outcome, path.value,
                          [&](Json& json) { Put(json, kPathKey, path.value); });
      });
}

// The handler for answers that are HFS names or HFS paths; `key` is theirs in JSON.
auto TellHFSText(const Findings& findings, const std::string& item, Finding& finding,
                 const char* key) {
  return Tell<std::string>(
      findings, item, finding, [key](const auto& all, const auto& asked, const auto& hfs) {
        const std::string text = Utf8OfHFSName(hfs.value);
        return all.Answer(asked, hfs.outcome, text, [&](Json& json) { json[key] = text; });
      });
}

Finding Invalid(const Findings& findings, const std::string& item, std::string reason) {
  return findings.Failure(item, {Outcome::kInvalid, std::move(reason)});
}

}  // namespace

int PrintRecords(const ItemsToAsk& items, bool asHex) {
  const Findings findings(items.format, kPathKey);
  return Convert(items, [&](Converter& converter, const std::string& item, Finding& finding) {
    converter.RecordOf(
        item,
        Tell<FSSpec>(findings, item, finding,
                     [asHex](const auto& all, const auto& asked, const Converted<FSSpec>& record) {
                       const FSSpec& spec = record.value;
                       return all.Answer(asked, record.outcome,
                                         asHex ? HexOfRecord(spec) : TextOfFSSpec(spec),
                                         [&](Json& json) { Put(json, spec); });
                     }));
  });
}

int PrintHFSPaths(const ItemsToAsk& items) {
  const Findings findings(items.format, kPathKey);
  return Convert(items, [&](Converter& converter, const std::string& item, Finding& finding) {
    converter.HFSPathOf(item, TellHFSText(findings, item, finding, "hfs_path"));
  });
}

int PrintNames(const ItemsToAsk& items) {
  const Findings findings(items.format, kPathKey);
  return Convert(items, [&](Converter& converter, const std::string& item, Finding& finding) {
    converter.HFSNameOf(item, TellHFSText(findings, item, finding, "name"));
  });
}

int PrintPathsOfNames(const ItemsToAsk& items, const std::string& folder) {
  const Findings findings(items.format, "name");
  return Convert(items, [&](Converter& converter, const std::string& item, Finding& finding) {
    const auto name = HFSNameOfUtf8(item);
    if (!name) {
      finding = Invalid(findings, item, WhyNotHFSNames(item));
    } else {
      converter.PathInFolder(folder, *name, TellPath(findings, item, finding));
    }
  });
}

}  // namespace tallowmere::cli
