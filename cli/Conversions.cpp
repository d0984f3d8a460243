#include <memory>

#include "cli/Commands.h"
#include "cli/Conversion.h"
#include "cli/Paths.h"
#include "cli/Reasons.h"
#include "cli/Records.h"

namespace tallowmere::cli {
namespace {

constexpr const char* kPathKey = "path";
constexpr const char* kNoRecord =
    "a record is volume:parent:name, the name of at most 63 Mac Roman characters, or 140 "
    "hexadecimal digits";
constexpr const char* kNotMacRoman = "it has a character that HFS names cannot have";

// The usual handler: reports the answer, or why there is none.
template <class Value>
std::function<void(Result<std::optional<Value>>)> Tell(const std::string& item, Report& report,
                                                       std::function<void(const Value&)> answer,
                                                       std::function<std::string()> whyNone) {
  return [item, &report, answer = std::move(answer),
          whyNone = std::move(whyNone)](const Result<std::optional<Value>>& result) {
    if (!result) return report.Fail(item, result.Failure().message);
    if (!*result) return report.Fail(item, whyNone());
    answer(**result);
  };
}

// The handler for answers that are paths.
std::function<void(Result<std::optional<std::string>>)> TellPath(
    const std::string& item, Report& report, std::function<std::string()> whyNone) {
  return Tell<std::string>(
      item, report,
      [item, &report](const std::string& path) {
        report.Answer(item, path, [&](Json& json) { Put(json, kPathKey, path); });
      },
      std::move(whyNone));
}

}  // namespace

int PrintRecords(const ItemsToAsk& items, bool asHex) {
  return Convert(items, kPathKey, [=](Batch& batch, const std::string& item, Report& report) {
    const std::string path = AbsolutePath(item);
    batch.Add(request::GetFSSpec(path),
              Tell<FSSpec>(
                  item, report,
                  [=, &report](const FSSpec& spec) {
                    const auto text = asHex ? HexOfRecord(spec) : TextOfRecord(spec);
                    report.Answer(item, text, [&](Json& json) { Put(json, spec); });
                  },
                  [path] { return WhyNoRecord(path); }));
  });
}

int PrintPathsOfRecords(const ItemsToAsk& items, bool searchOtherVolumes) {
  Client explaining(items.client);
  return Convert(items, "record", [&](Batch& batch, const std::string& item, Report& report) {
    const auto spec = ReadRecord(item);
    if (!spec) {
      return Refuse(batch, item, kNoRecord, report);
    }
    batch.Add(request::SetFileRefFromFSSpec(*spec, searchOtherVolumes),
              TellPath(item, report, [&, spec] { return WhyNoPath(explaining, *spec); }));
  });
}

int PrintHFSPaths(const ItemsToAsk& items) {
  return Convert(items, kPathKey, [](Batch& batch, const std::string& item, Report& report) {
    const std::string path = AbsolutePath(item);
    const auto folders = std::make_shared<Result<std::string>>(std::string());
    batch.Add(request::MakeFullPath(path),
              [folders](Result<std::string> result) { *folders = std::move(result); });
    batch.Add(request::GetHFSName(path),
              Tell<std::string>(
                  item, report,
                  [=, &report](const std::string& name) {
                    if (!*folders) return report.Fail(item, folders->Failure().message);
                    const auto text = Utf8OfHFSName(IsFolder(path) ? **folders : **folders + name);
                    report.Answer(item, text, [&](Json& json) { json["hfs_path"] = text; });
                  },
                  [path] { return WhyNoName(path); }));
  });
}

int PrintPathsOfHFSPaths(const ItemsToAsk& items) {
  Client explaining(items.client);
  return Convert(items, "hfs_path", [&](Batch& batch, const std::string& item, Report& report) {
    const auto hfsPath = HFSNameOfUtf8(item);
    if (!hfsPath) return Refuse(batch, item, kNotMacRoman, report);
    batch.Add(request::MakeFileRefFromPath(*hfsPath),
              TellPath(item, report, [&, hfsPath] { return WhyNoPath(explaining, *hfsPath); }));
  });
}

int PrintNames(const ItemsToAsk& items) {
  return Convert(items, kPathKey, [](Batch& batch, const std::string& item, Report& report) {
    const std::string path = AbsolutePath(item);
    batch.Add(request::GetHFSName(path),
              Tell<std::string>(
                  item, report,
                  [item, &report](const std::string& name) {
                    const std::string text = Utf8OfHFSName(name);
                    report.Answer(item, text, [&](Json& json) { json["name"] = text; });
                  },
                  [path] { return WhyNoName(path); }));
  });
}

int PrintPathsOfNames(const ItemsToAsk& items, const std::string& folder) {
  const auto path = FolderAt(folder);
  return Convert(items, "name", [&](Batch& batch, const std::string& item, Report& report) {
    if (!path) return Refuse(batch, item, "there is no folder \"" + folder + '"', report);
    const auto name = HFSNameOfUtf8(item);
    if (!name) return Refuse(batch, item, kNotMacRoman, report);
    batch.Add(request::AddHFSName(*path, *name),
              TellPath(item, report, [] { return "no item can have this name"; }));
  });
}

}  // namespace tallowmere::cli
