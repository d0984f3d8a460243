// The paths of records and of HFS paths, which other machines may have stored: each answer says how
// the item was found, and whether it exists.

#include <memory>
#include <string>
#include <utility>

#include "cli/Commands.h"
#include "cli/Conversion.h"
#include "cli/CopiedVolumes.h"
#include "cli/Output.h"
#include "cli/Records.h"

namespace tallowmere::cli {
namespace {

constexpr const char* kNoRecord =
    "a record is volume:parent:name, the name of at most 63 Mac Roman characters, or its 70 bytes "
    "in hexadecimal or base64";
constexpr const char* kNotMacRoman = "it has a character that HFS names cannot have";

// How an item was found; the values of "by" in JSON.
constexpr const char* kByID = "id";
constexpr const char* kBySearch = "search";
constexpr const char* kByPath = "path";
constexpr const char* kByMap = "map";

using Path = Conversion<std::string>;

Finding FindingOf(const Findings& findings, const std::string& item, const Path& path,
                  const char* by) {
  const auto tellMissing = [](Json& json) { json["exists"] = false; };
  if (!path) {
    const bool isMissing = path.Failure().outcome == Outcome::kNothing;
    return isMissing ? findings.Failure(item, path.Failure(), tellMissing)
                     : findings.Failure(item, path.Failure());
  }
  const auto fill = [&](Json& json) {
    Put(json, "path", path->value);
    json["exists"] = path->outcome == Outcome::kFound;
    json["by"] = by;
  };
  return findings.Answer(item, path->outcome, path->value, fill, tellMissing);
}

bool IsFound(const Path& path) {
  return path && path->outcome == Outcome::kFound;
}

class RecordsToFind {
 public:
  RecordsToFind(const Findings& findings, const OldNumbers& numbers, const RecordOptions& options)
      : mFindings(findings), mNumbers(numbers), mOptions(options) {}

  void Ask(Converter& converter, const std::string& item, Finding& finding) const {
    const auto stored = ReadRecord(item, mOptions.form.order);
    const auto record =
        stored ? mNumbers.Here(*stored) : Result<FSSpec>(Error{Outcome::kInvalid, kNoRecord});
    if (!record) return Tell(item, record.Failure(), kByID, finding);
    const auto byID = std::make_shared<Path>(Error{});
    converter.PathOf(*record, false, [this, byID, &item, &finding](Path path) {
      *byID = std::move(path);
      Tell(item, *byID, kByID, finding);
    });
    if (!mOptions.searchOtherVolumes) return;
    converter.PathOf(*record, true, [this, byID, &item, &finding](const Path& path) {
      if (!IsFound(*byID) && IsFound(path)) Tell(item, path, kBySearch, finding);
    });
  }

 private:
  void Tell(const std::string& item, Path path, const char* by, Finding& finding) const {
    if (!path) {
      Error error = path.Failure();
      const bool isKnown = mNumbers.AreTold() || error.outcome != Outcome::kNotAVolume;
      const auto hint = HintAtOtherOrder(item, mOptions.form.order, isKnown);
      if (hint) error.message += "; " + *hint;
      path = std::move(error);
    }
    finding = FindingOf(mFindings, item, path, by);
  }

  const Findings& mFindings;
  const OldNumbers& mNumbers;
  const RecordOptions& mOptions;
};

}  // namespace

int PrintPathsOfRecords(const ItemsToAsk& items, const RecordOptions& options) {
  const Findings findings(items.format, "record");
  Client client(items.client);
  if (const auto error = WhyItDoesNotAnswer(client)) return Complain(*error);
  const auto numbers = OldNumbers::Read(client, options.places);
  if (!numbers) return Complain(numbers.Failure().message);
  ItemsToAsk records = items;
  if (options.form.isPacked) {
    auto packed = ReadPackedRecords(items.items, options.form);
    if (!packed) return Complain(packed.Failure().message);
    records.items = *std::move(packed);
  }
  const RecordsToFind toFind(findings, *numbers, options);
  return Convert(records, [&](Converter& converter, const std::string& item, Finding& finding) {
    toFind.Ask(converter, item, finding);
  });
}

int PrintPathsOfHFSPaths(const ItemsToAsk& items, const OldPlaces& places) {
  const Findings findings(items.format, "hfs_path");
  const auto copies = CopiedVolumes::Read(places);
  if (!copies) return Complain(copies.Failure().message);
  return Convert(items, [&](Converter& converter, const std::string& item, Finding& finding) {
    const auto hfsPath = HFSNameOfUtf8(item);
    if (!hfsPath) {
      finding = FindingOf(findings, item, Error{Outcome::kInvalid, kNotMacRoman}, kByPath);
    } else if (const auto inCopy = copies->PathOfHFSPath(*hfsPath)) {
      finding = FindingOf(findings, item, *inCopy, kByMap);
    } else {
      converter.PathOfHFSPath(
          *hfsPath, [&](const Path& path) { finding = FindingOf(findings, item, path, kByPath); });
    }
  });
}

}  // namespace tallowmere::cli
