#include <iostream>
#include <utility>

#include "cli/Conversion.h"
#include "cli/Items.h"
#include "cli/Output.h"
#include "cli/Paths.h"
#include "cli/Reasons.h"
#include "cli/Records.h"
#include "cli/Table.h"
#include "cli/Text.h"

namespace tallowmere::cli {
namespace {

struct Identity {
  FSSpec spec;
  std::string hfsPath;
  std::optional<std::string> wayBack;  // the path that the record leads to
};

// Nullopt when the path has no record.
Result<std::optional<Identity>> Identify(Client& client, const std::string& path) {
  auto spec = client.GetFSSpec(path);
  if (!spec) return spec.Failure();
  if (!*spec) return std::optional<Identity>{};
  auto folders = client.MakeFullPath(path);
  if (!folders) return folders.Failure();
  auto wayBack = client.SetFileRefFromFSSpec(**spec, false);
  if (!wayBack) return wayBack.Failure();
  Identity identity{**std::move(spec), *std::move(folders), *std::move(wayBack)};
  if (!IsFolder(path)) identity.hfsPath += identity.spec.name;
  return std::optional(std::move(identity));
}

void Fill(Json& json, const Identity& identity) {
  Put(json, identity.spec);
  json["hfs_path"] = Utf8OfHFSName(identity.hfsPath);
  if (identity.wayBack) {
    Put(json, "way_back", *identity.wayBack);
  } else {
    json["way_back"] = nullptr;
  }
}

std::vector<std::string> RowOf(const Identity& identity) {
  const auto& [spec, hfsPath, wayBack] = identity;
  return {std::to_string(spec.vRefNum), std::to_string(spec.parID),
          Printable(Utf8OfHFSName(spec.name)), Printable(Utf8OfHFSName(hfsPath)),
          wayBack ? Printable(*wayBack) : "none"};
}

}  // namespace

int PrintIdentities(const ItemsToAsk& paths) {
  Client client(paths.client);
  if (const auto error = WhyItDoesNotAnswer(client)) return Complain(*error);
  const bool isJson = paths.format.isJson;
  Report report(paths.format, "path");
  Table table({{"vRefNum", Table::Align::kRight},
               {"parent id", Table::Align::kRight},
               {"HFS name"},
               {"HFS path"},
               {"way back"}});
  const auto fail = [&](const std::string& item, const std::string& reason) {
    if (isJson) return report.Fail(item, reason);
    report.TellFailure(item, reason);
    table.AddEmptyRow();
  };
  Items items(paths.items, paths.format.InputEnd());
  while (const auto item = report.GoesOn() ? items.Next([] {}) : std::nullopt) {
    if (item->empty()) {
      fail(*item, kEmptyItem);
      continue;
    }
    const std::string path = AbsolutePath(*item);
    const auto identity = Identify(client, path);
    if (!identity) {
      fail(*item, identity.Failure().message);
    } else if (!*identity) {
      fail(*item, WhyNoRecord(path));
    } else if (isJson) {
      report.Answer(*item, "", [&](Json& json) { Fill(json, **identity); });
    } else {
      table.Add(RowOf(**identity));
    }
  }
  if (!isJson && !table.IsEmpty()) table.Print(std::cout);
  return report.Finish();
}

}  // namespace tallowmere::cli
