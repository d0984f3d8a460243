// The paths of records and of HFS paths, which other machines may have stored: each answer says how
// the item was found, and whether it exists.

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "cli/Commands.h"
#include "cli/Conversion.h"
#include "cli/CopiedVolumes.h"
#include "cli/Output.h"
#include "cli/Records.h"
#include "cli/Text.h"

namespace tallowmere::cli {
namespace {

constexpr const char* kNoRecord =
    "a record is volume:parent:name, the name of at most 63 Mac Roman characters, or its 70 bytes "
    "in hexadecimal or base64";
constexpr const char* kNoPackedRecord = "the length of its name is above 63";

// How an item was found; the values of "by" in JSON.
constexpr const char* kByID = "id";
constexpr const char* kBySearch = "search";
constexpr const char* kByPath = "path";
constexpr const char* kByMap = "map";

using Path = Conversion<std::string>;

Finding FindingOf(const Findings& findings, const Asked& item, const Path& path, const char* by) {
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
  // Items are records, or with `packed` the indices of records there.
  RecordsToFind(const Findings& findings, const OldNumbers& numbers, const RecordOptions& options,
                const std::vector<PackedRecord>* packed)
      : mFindings(findings), mNumbers(numbers), mOptions(options), mPacked(packed) {}

  void Ask(Converter& converter, const std::string& item, Finding& finding) const {
    const Asked asked = mPacked != nullptr ? Asked((*mPacked)[std::stoul(item)]) : Asked(item);
    const auto stored = ReadRecord(asked.text, mOptions.form.order);
    if (!stored) return Tell(asked, Error{Outcome::kInvalid, WhyNone(asked)}, finding);
    const auto record = mNumbers.Here(*stored);
    if (!record) return TellFailure(asked, *stored, record.Failure(), finding);
    const auto byID = std::make_shared<Path>(Error{});
    converter.PathOf(*record, false, [this, byID, asked, stored = *stored, &finding](Path path) {
      *byID = std::move(path);
      if (!*byID) return TellFailure(asked, stored, byID->Failure(), finding);
      Tell(asked, *byID, finding);
    });
    if (!mOptions.searchOtherVolumes) return;
    converter.PathOf(*record, true, [this, byID, asked, &finding](const Path& path) {
      if (!IsFound(*byID) && IsFound(path)) Tell(asked, path, finding, kBySearch);
    });
  }

 private:
  static const char* WhyNone(const Asked& asked) {
    return asked.packed != nullptr ? kNoPackedRecord : kNoRecord;
  }

  void Tell(const Asked& asked, const Path& path, Finding& finding, const char* by = kByID) const {
    finding = FindingOf(mFindings, asked, path, by);
  }

  void TellFailure(const Asked& asked, const FSSpec& stored, Error error, Finding& finding) const {
    const auto hint = Hint(asked, stored, error.outcome);
    if (hint) error.message += "; " + *hint;
    Tell(asked, std::move(error), finding);
  }

  std::optional<std::string> Hint(const Asked& asked, const FSSpec& stored, Outcome outcome) const {
    const bool isTold = mNumbers.AreToldFor(stored);
    const bool isNoVolume = outcome == Outcome::kNotAVolume;
    if (outcome != Outcome::kNothing && (!isNoVolume || isTold)) return std::nullopt;
    const RecordVolume volume = isTold       ? RecordVolume::kTold
                                : isNoVolume ? RecordVolume::kUnknown
                                             : RecordVolume::kMounted;
    return HintAtOtherOrder(std::string(asked.text), mOptions.form.order, volume);
  }

  const Findings& mFindings;
  const OldNumbers& mNumbers;
  const RecordOptions& mOptions;
  const std::vector<PackedRecord>* mPacked;
};

}  // namespace

int PrintPathsOfRecords(const ItemsToAsk& items, const RecordOptions& options) {
  const Findings findings(items.format, "record");
  Client client(items.client);
  if (const auto error = WhyItDoesNotAnswer(client)) return Complain(*error);
  const auto numbers = OldNumbers::Read(client, options.places);
  if (!numbers) return Complain(numbers.Failure().message);
  ItemsToAsk records = items;
  std::vector<PackedRecord> all;
  if (options.form.isPacked) {
    auto packed = ReadPackedRecords(items.items, options.form);
    if (!packed) return Complain(packed.Failure().message);
    all = *std::move(packed);
    records.items.clear();
    for (std::size_t i = 0; i < all.size(); ++i) records.items.push_back(std::to_string(i));
  }
  const RecordsToFind toFind(findings, *numbers, options, options.form.isPacked ? &all : nullptr);
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
      finding = FindingOf(findings, item, Error{Outcome::kInvalid, WhyNotHFSNames(item)}, kByPath);
    } else if (const auto inCopy = copies->PathOfHFSPath(*hfsPath)) {
      finding = FindingOf(findings, item, *inCopy, kByMap);
    } else {
      converter.PathOfHFSPath(
          *hfsPath, [&](const Path& path) { finding = FindingOf(findings, item, path, kByPath); });
    }
  });
}

}  // namespace tallowmere::cli
