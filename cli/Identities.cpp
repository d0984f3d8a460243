#include <iostream>
#include <utility>

#include "cli/Conversion.h"
#include "cli/Items.h"
#include "cli/Output.h"
#include "cli/Records.h"
#include "cli/Report.h"
#include "cli/Table.h"
#include "cli/Text.h"

namespace tallowmere::cli {
namespace {

struct Identity {
  FSSpec spec;
  std::optional<std::string> hfsPath;
  std::optional<std::string> wayBack;  // the path that the record leads to
};

// The answer, or nullopt where there is none for the item. An error when the service failed.
Result<std::optional<std::string>> IfAny(Conversion<std::string> answer) {
  if (answer) return std::optional((*std::move(answer)).value);
  if (answer.Failure().outcome == Outcome::kServiceFailed) return answer.Failure();
  return std::optional<std::string>();
}

Conversion<Identity> Identify(Client& client, const std::string& path) {
  const auto record = client.RecordOf(path);
  if (!record) return record.Failure();
  auto hfsPath = IfAny(client.HFSPathOf(path));
  if (!hfsPath) return hfsPath.Failure();
  auto wayBack = IfAny(client.PathOf(record->value));
  if (!wayBack) return wayBack.Failure();
  return Converted<Identity>{{record->value, *std::move(hfsPath), *std::move(wayBack)},
                             record->outcome};
}

void Fill(Json& json, const Identity& identity) {
  Put(json, identity.spec);
  if (identity.hfsPath) {
    json["hfs_path"] = Utf8OfHFSName(*identity.hfsPath);
  } else {
    json["hfs_path"] = nullptr;
  }
  if (identity.wayBack) {
    Put(json, "way_back", *identity.wayBack);
  } else {
    json["way_back"] = nullptr;
  }
}

std::vector<std::string> RowOf(const Identity& identity) {
  const auto& [spec, hfsPath, wayBack] = identity;
  return {std::to_string(spec.vRefNum), std::to_string(spec.parID),
          Printable(Utf8OfHFSName(spec.name)),
          hfsPath ? Printable(Utf8OfHFSName(*hfsPath)) : "none",
          wayBack ? Printable(*wayBack) : "none"};
}

// The findings of identify: JSON as they come, or at the end a table.
class Identities {
 public:
  explicit Identities(const Format& format) : mFormat(format), mFindings(format, "path") {}

  void Take(Report& report, const std::string& item, const Conversion<Identity>& identity) {
    const Finding finding = identity
                                ? mFindings.Answer(item, identity->outcome, "",
                                                   [&](Json& json) { Fill(json, identity->value); })
                                : mFindings.Failure(item, identity.Failure());
    if (mFormat.isJson) return report.Print(finding);
    report.Count(finding);
    mTable.Add(finding.isFailure ? Table::Row(kColumns) : RowOf(identity->value));
  }

  void Finish() const {
    if (!mTable.IsEmpty()) mTable.Print(std::cout);
  }

 private:
  static constexpr std::size_t kColumns = 5;

  Format mFormat;
  Findings mFindings;
  Table mTable{{{"vRefNum", Table::Align::kRight},
                {"parent id", Table::Align::kRight},
                {"HFS name"},
                {"HFS path"},
                {"way back"}}};
};

}  // namespace

int PrintIdentities(const ItemsToAsk& paths) {
  Client client(paths.client);
  if (const auto error = WhyItDoesNotAnswer(client)) return Complain(*error);
  Report report(paths.format);
  Identities identities(paths.format);
  Items items(paths.items, paths.format.InputEnd());
  while (const auto item = report.GoesOn() ? items.Next([] {}) : std::nullopt) {
    identities.Take(report, *item, Identify(client, *item));
  }
  identities.Finish();
  return report.Finish(items);
}

}  // namespace tallowmere::cli
