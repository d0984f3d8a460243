#include <tallowmere/Volumes.h>

#include <iostream>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "cli/Commands.h"
#include "cli/Finding.h"
#include "cli/Output.h"
#include "cli/Table.h"
#include "cli/Text.h"

namespace tallowmere::cli {
namespace {

struct Row {
  Volume volume;
  std::optional<std::int16_t> numberByName;  // what the service answers for the name

  bool Answers() const { return !numberByName || *numberByName == volume.number; }
};

Result<std::vector<Row>> AskForVolumes(const ClientOptions& options) {
  Client client(options);
  auto volumes = ListVolumes(client);
  if (!volumes) return volumes.Failure();
  std::vector<Row> rows;
  for (Volume& volume : *volumes) {
    const auto number = client.GetVolRefnumByHFSName(volume.name);
    if (!number) return number.Failure();
    rows.push_back({std::move(volume), *number});
  }
  return rows;
}

void PrintAsJson(const Row& row) {
  Json json;
  json["volume"] = row.volume.number;
  json["name"] = Utf8OfHFSName(row.volume.name);
  Put(json, "mount_point", row.volume.mountPoint);
  json["answers_to_its_name"] = row.Answers();
  std::cout << json.dump() << '\n';
}

}  // namespace

int PrintVolumes(const ClientOptions& options, bool isJson) {
  const auto rows = AskForVolumes(options);
  if (!rows) return Complain(rows.Failure().message);
  Table table({{"vRefNum", Table::Align::kRight}, {"name"}, {"mount point"}});
  for (const Row& row : *rows) {
    if (isJson) {
      PrintAsJson(row);
    } else {
      table.Add({std::to_string(row.volume.number), Printable(Utf8OfHFSName(row.volume.name)),
                 Printable(row.volume.mountPoint) +
                     (row.Answers() ? "" : "  (the first volume of this name answers to it)")});
    }
  }
  if (!isJson) table.Print(std::cout);
  return FinishOutput();
}

}  // namespace tallowmere::cli
